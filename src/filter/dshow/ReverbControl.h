// ReverbControl: the part of the filter that owns the ReverbCore and serves IReverbControl to the editor.
// It also holds the automation segment list (guarded by the filter's paramLock) and runs the sample
// conversion around the core's processing call.
//
// Threads: GetOption/SetOption/RegisterWindow take this object's small lock; Process runs on the
// streaming thread; the core takes its own lock inside every call.
#pragma once

#include <windows.h>

#include <cstdint>
#include <memory>
#include <vector>

#include "filter/ReverbCore.h"
#include "filter/dshow/Interfaces.h"

namespace ulvetta {
namespace dshow {

// One automation segment in sample time of the input stream.
struct EnvelopeSegment {
    int32_t paramId;
    int64_t startSample;  // 64-bit so that long streams at high rates cannot wrap
    int64_t endSample;
    float startValue;  // position 0..1, or the integer value for parameters automated by value
    float endValue;
    bool jump;  // bit 0 of the segment's curve type; stored, not used by the playback
};

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
    bool IsDirty();

    // Runs one block through the core with the stream's sample format. in is null for the tail drain
    // (silence is processed). Returns the frames produced; *shortfall is set when fewer than asked.
    int Process(int mode, const BYTE* in, int inFrames, BYTE* out, int outCapacity, bool* shortfall);

    // The automation segments; guarded by the filter's paramLock.
    std::vector<EnvelopeSegment> segments;

private:
    void begin() override;
    void end() override;
    // Calls notify(window, id) for every registered window that still exists, clearing the others.
    template <class F>
    void ForEachWindow(F notify);

    IUnknown* outer_;
    IPersistStream* persist_;
    std::unique_ptr<ReverbCore> core_;
    CRITICAL_SECTION lock_;
    BYTE option_ = 0;
    bool optionChanged_ = true;
    bool dirty_ = false;
    struct Window {
        HWND window;
        WORD id;
    } windows_[2] = {};
    bool started_ = false;
    const WAVEFORMATEX* inFormat_;
    const WAVEFORMATEX* outFormat_;
    bool inKnown_ = false;
    bool outKnown_ = false;
    HCURSOR previousCursor_ = nullptr;
    // Scratch of the 16-bit path and of the drain; they grow to the largest block, never shrink.
    std::vector<float> scratchIn_;
    std::vector<float> scratchOut_;
    std::vector<float> silence_;
};

}  // namespace dshow
}  // namespace ulvetta
