// ReverbControl: the part of the filter that owns the ReverbCore and serves IReverbControl to the editor.
// It also runs the sample conversion around the core's processing call and keeps the dirty state of
// the saved settings.
//
// Threads: GetOption/SetOption/RegisterWindow and the dirty state take this object's small lock, which
// is never held while calling a window; Process runs on the streaming thread; the core takes its own
// lock inside every call.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <vector>

#include "filter/CoreState.h"
#include "filter/ReverbCore.h"
#include "filter/dshow/Interfaces.h"

namespace ulvetta {
namespace dshow {

// Processing modes of Process.
enum ProcessMode { kModeDiscontinuity = 0, kModeOrdinary = 1, kModeDrain = 2 };

class ReverbControl : public IReverbControl, private BusyIndicator {
public:
    // outer: the filter's controlling unknown; persist: the filter's IPersistStream.
    ReverbControl(IUnknown* outer, IPersistStream* persist, const WAVEFORMATEX* inFormat,
                  const WAVEFORMATEX* outFormat);
    ~ReverbControl();
    ReverbControl(const ReverbControl&) = delete;
    ReverbControl& operator=(const ReverbControl&) = delete;

    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override { return outer_->QueryInterface(riid, ppv); }
    STDMETHODIMP_(ULONG) AddRef() override { return outer_->AddRef(); }
    STDMETHODIMP_(ULONG) Release() override { return outer_->Release(); }

    STDMETHODIMP GetOption(BYTE* out) override;
    STDMETHODIMP SetOption(const BYTE* in) override;
    STDMETHODIMP GetFormat(WAVEFORMATEX* out, int direction) override;
    STDMETHODIMP RegisterWindow(HWND window, WORD commandId) override;
    IPersistStream* STDMETHODCALLTYPE GetPersistStream() override;
    ReverbCore* STDMETHODCALLTYPE GetCore() override { return core_.get(); }

    // Tells the core about a new format of one direction and applies every parameter; then tells the
    // registered windows.
    void FormatChanged(int direction);
    // Records the formats of both directions and starts the core; false when the core could not start.
    bool StartStreaming();
    void StopStreaming();
    // Redraws every registered window (after a state was loaded).
    void RedrawWindows();
    // True after SetOption or when the settings differ from those last saved with MarkClean.
    bool IsDirty();
    void MarkClean(const uint8_t* savedState);

    // Sizes the conversion scratch for blocks of up to frames (graph thread, before streaming).
    void ReserveFrames(size_t frames);
    // Runs one block through the core with the stream's sample format, in pieces of the scratch size
    // when the block is larger. in is null for the tail drain (silence is processed). Returns the
    // frames produced; *shortfall is set when fewer than asked. Allocates nothing once sized.
    int Process(int mode, const BYTE* in, int inFrames, BYTE* out, int outCapacity, bool* shortfall);

private:
    void begin() override;
    void end() override;
    // Calls notify(window, id) for every registered window that still exists, clearing the others;
    // the window calls run after this object's lock is released.
    template <class F>
    void ForEachWindow(F notify);
    int ProcessPiece(int mode, bool first, const BYTE* in, BYTE* out, int frames);

    IUnknown* outer_;
    IPersistStream* persist_;
    std::unique_ptr<ReverbCore> core_;
    CRITICAL_SECTION lock_;
    BYTE option_ = 0;
    bool dirty_ = false;
    uint8_t cleanState_[kCoreStateSize] = {};  // the settings as last saved (or at construction)
    struct Window {
        HWND window;
        WORD id;
    } windows_[2] = {};
    const WAVEFORMATEX* inFormat_;
    const WAVEFORMATEX* outFormat_;
    bool inKnown_ = false;
    bool outKnown_ = false;
    HCURSOR previousCursor_ = nullptr;
    // Interleaved stereo scratch of the 16-bit path and of the drain's silence, scratchFrames_ frames
    // each; sized off the streaming thread.
    size_t scratchFrames_ = 0;
    std::vector<float> scratchIn_;
    std::vector<float> scratchOut_;
};

}  // namespace dshow
}  // namespace ulvetta
