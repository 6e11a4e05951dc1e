// ReverbFilter: the DirectShow audio transform that runs stereo 16-bit PCM or 32-bit float through the
// reverb into separate output buffers, plays media-parameter envelopes (converted to samples and handed
// to Automation) and drains the reverb tail at end of stream. It also answers IPersistStream (the
// 88-byte settings record), ISpecifyPropertyPages, IHostPresets, the media-parameter interfaces and the
// capture-callback setter.
//
// Threads: Receive and EndOfStream run on the upstream streaming thread; format, state and automation
// calls on the graph's thread; the editor on its window thread. paramLock_ guards the automation and is
// always taken before the core's lock, never while holding it. callbackLock_ guards only the capture
// callback pointer; the host's callback is called with neither lock held.
#pragma once

#include <windows.h>
#include <dshow.h>
#include <medparam.h>

#include <atomic>

#include "filter/Automation.h"
#include "filter/ReverbCore.h"
#include "filter/dshow/Interfaces.h"
#include "filter/dshow/ReverbControl.h"
#include "filter/dshow/TransformFilter.h"

namespace ulvetta {
namespace dshow {

class ReverbFilter : public TransformFilter,
                     public IPersistStream,
                     public ISpecifyPropertyPages,
                     public IHostPresets,
                     public IMediaParamInfo,
                     public IMediaParams,
                     public ICaptureCallbackSetter,
                     private CaptureTarget {
public:
    // Creates a filter for the class factory; *hr receives the failure when null is returned.
    static IUnknown* CreateInstance(IUnknown* outer, HRESULT* hr);

    explicit ReverbFilter(IUnknown* outer);
    ~ReverbFilter() override;

    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override { return outer_->QueryInterface(riid, ppv); }
    STDMETHODIMP_(ULONG) AddRef() override { return outer_->AddRef(); }
    STDMETHODIMP_(ULONG) Release() override { return outer_->Release(); }
    HRESULT STDMETHODCALLTYPE NonDelegatingQueryInterface(REFIID riid, void** ppv) override;

    // IPersist (shared by IBaseFilter and IPersistStream)
    STDMETHODIMP GetClassID(CLSID* clsid) override { return TransformFilter::GetClassID(clsid); }
    // IPersistStream
    STDMETHODIMP IsDirty() override;
    STDMETHODIMP Load(IStream* stream) override;
    STDMETHODIMP Save(IStream* stream, BOOL clearDirty) override;
    STDMETHODIMP GetSizeMax(ULARGE_INTEGER* size) override;
    // ISpecifyPropertyPages
    STDMETHODIMP GetPages(CAUUID* pages) override;
    // IHostPresets
    STDMETHODIMP GetPresetCount(DWORD* count) override;
    STDMETHODIMP GetPresetName(DWORD index, WCHAR* buffer, int length) override;
    STDMETHODIMP SetPreset(DWORD index) override;
    // IMediaParamInfo
    STDMETHODIMP GetParamCount(DWORD* count) override;
    STDMETHODIMP GetParamInfo(DWORD index, MP_PARAMINFO* info) override;
    STDMETHODIMP GetParamText(DWORD index, WCHAR** text) override;
    STDMETHODIMP GetNumTimeFormats(DWORD* count) override;
    STDMETHODIMP GetSupportedTimeFormat(DWORD index, GUID* format) override;
    STDMETHODIMP GetCurrentTimeFormat(GUID* format, MP_TIMEDATA* data) override;
    // IMediaParams
    STDMETHODIMP GetParam(DWORD index, MP_DATA* value) override;
    STDMETHODIMP SetParam(DWORD index, MP_DATA value) override;
    STDMETHODIMP AddEnvelope(DWORD index, DWORD count, MP_ENVELOPE_SEGMENT* segments) override;
    STDMETHODIMP FlushEnvelope(DWORD index, REFERENCE_TIME start, REFERENCE_TIME stop) override;
    STDMETHODIMP SetTimeFormat(GUID format, MP_TIMEDATA data) override;
    // ICaptureCallbackSetter
    STDMETHODIMP SetCaptureCallback(ICaptureCallback* callback) override;

    // The transform.
    HRESULT CheckInputType(const AM_MEDIA_TYPE* mt) override;
    HRESULT CheckTransform(const AM_MEDIA_TYPE* in, const AM_MEDIA_TYPE* out) override;
    HRESULT DecideBufferSize(IMemAllocator* allocator, ALLOCATOR_PROPERTIES* request) override;
    HRESULT GetMediaType(int position, AM_MEDIA_TYPE* mt) override;
    HRESULT StartStreaming() override;
    HRESULT StopStreaming() override;
    HRESULT SetMediaType(PIN_DIRECTION dir, const AM_MEDIA_TYPE* mt) override;
    HRESULT CompleteConnect(PIN_DIRECTION dir, IPin* pin) override;
    HRESULT CheckInputPinMediaType(const AM_MEDIA_TYPE* mt) override;
    HRESULT Receive(IMediaSample* sample) override;
    HRESULT EndOfStream() override;
    HRESULT EndFlush() override;
    const wchar_t* FilterName() const override { return L"Morvane Ulvetta"; }
    DWORD FilterMerit() const override { return MERIT_DO_NOT_USE; }

    ReverbControl& Control() { return *control_; }
    const WAVEFORMATEX& InputFormat() const { return inputFormat_; }
    // The envelopes; read them only while no other thread uses the filter.
    const Automation& AutomationForInspection() const { return automation_; }

private:
    void captureParameter(int32_t id, float position) override;
    // Sizes the conversion scratch for the larger of the two allocators' buffers.
    void ReserveScratch();
    // Runs a change of the core's settings. An exception from it (out of memory while the engine
    // rebuilds its network) may leave the engine half built, so the engine is rebuilt whole before the
    // next block is processed.
    template <class Change>
    auto ChangeCore(Change&& change) -> decltype(change()) {
        try {
            return change();
        } catch (...) {
            rebuildPending_ = true;
            throw;
        }
    }
    // Rebuilds the engine after a failed change; E_OUTOFMEMORY while that is still impossible.
    HRESULT RebuildIfPending();
    // Runs an input block through the core into as many output samples as it needs.
    HRESULT ProcessChunked(const BYTE* in, int frames, int mode, bool timed, IMediaSample* source);

    std::unique_ptr<ReverbControl> control_;
    CRITICAL_SECTION paramLock_;
    Automation automation_;             // guarded by paramLock_
    CoreAutomationSink automationSink_;  // applies envelope and SetParam values to the core
    CRITICAL_SECTION callbackLock_;
    ICaptureCallback* uiCallback_ = nullptr;  // referenced; guarded by callbackLock_
    WAVEFORMATEX inputFormat_{};
    WAVEFORMATEX outputFormat_{};
    bool streamStarted_ = false;
    std::atomic<bool> rebuildPending_{false};
    int64_t blockPosition_ = 0;
};

}  // namespace dshow
}  // namespace ulvetta
