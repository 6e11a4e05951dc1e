// A small, complete DirectShow transform-filter base: the filter object (IBaseFilter, IMediaFilter,
// IPersist, IAMovieSetup) with one input and one output pin, media-type enumeration, allocator
// negotiation (the output pin brings its own allocator when downstream has none), state changes from any
// thread, flushing, new segments, end of stream, and an IMediaSeeking pass-through on the output pin.
//
// Threads and locks: stateLock_ guards the filter state and connections (graph thread); receiveLock_ is
// held while a sample or end of stream is processed (streaming thread), and Stop takes it after
// decommitting the input allocator so that a blocked streaming thread is released first. A state change
// holds no lock while it calls downstream (Pause and Run deliver the end of stream of an unconnected
// input after releasing the state lock). BeginFlush takes no lock; EndFlush holds the state lock while
// it passes the flush on, so downstream must not change the filter's state from its EndFlush. Every COM
// method that can fail by an exception runs its body through ComBoundary.
//
// The reference count of the pins is the filter's. A derived filter supplies the format checks, buffer
// sizing and the processing of samples.
#pragma once

#include <windows.h>
#include <dshow.h>

#include <atomic>
#include <memory>

#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/TransformInputPin.h"
#include "filter/dshow/TransformOutputPin.h"

namespace ulvetta {
namespace dshow {

// Non-delegating unknown of an aggregatable object.
struct INonDelegatingUnknown {
    virtual HRESULT STDMETHODCALLTYPE NonDelegatingQueryInterface(REFIID riid, void** ppv) = 0;
    virtual ULONG STDMETHODCALLTYPE NonDelegatingAddRef() = 0;
    virtual ULONG STDMETHODCALLTYPE NonDelegatingRelease() = 0;
};

class TransformFilter : public IBaseFilter, public IAMovieSetup, public INonDelegatingUnknown {
public:
    TransformFilter(const CLSID& clsid, IUnknown* outer);
    virtual ~TransformFilter();

    // The IUnknown seen by every interface of the object: the outer one when aggregated.
    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override { return outer_->QueryInterface(riid, ppv); }
    STDMETHODIMP_(ULONG) AddRef() override { return outer_->AddRef(); }
    STDMETHODIMP_(ULONG) Release() override { return outer_->Release(); }

    HRESULT STDMETHODCALLTYPE NonDelegatingQueryInterface(REFIID riid, void** ppv) override;
    ULONG STDMETHODCALLTYPE NonDelegatingAddRef() override;
    ULONG STDMETHODCALLTYPE NonDelegatingRelease() override;
    // The inner unknown handed to an aggregating outer object.
    IUnknown* InnerUnknown() { return &inner_; }

    // IPersist
    STDMETHODIMP GetClassID(CLSID* clsid) override;
    // IMediaFilter
    STDMETHODIMP Stop() override;
    STDMETHODIMP Pause() override;
    STDMETHODIMP Run(REFERENCE_TIME start) override;
    STDMETHODIMP GetState(DWORD timeoutMs, FILTER_STATE* state) override;
    STDMETHODIMP SetSyncSource(IReferenceClock* clock) override;
    STDMETHODIMP GetSyncSource(IReferenceClock** clock) override;
    // IBaseFilter
    STDMETHODIMP EnumPins(IEnumPins** e) override;
    STDMETHODIMP FindPin(LPCWSTR id, IPin** pin) override;
    STDMETHODIMP QueryFilterInfo(FILTER_INFO* info) override;
    STDMETHODIMP JoinFilterGraph(IFilterGraph* graph, LPCWSTR name) override;
    STDMETHODIMP QueryVendorInfo(LPWSTR* info) override;
    // IAMovieSetup: registers the filter's record with the filter mapper.
    STDMETHODIMP Register() override;
    STDMETHODIMP Unregister() override;

    // Pins: 0 input, 1 output, created on first use.
    virtual TransformPin* GetPin(int n);
    int GetPinCount() { return 2; }

    // What a derived filter supplies.
    virtual HRESULT CheckInputType(const AM_MEDIA_TYPE* mt) = 0;
    virtual HRESULT CheckTransform(const AM_MEDIA_TYPE* in, const AM_MEDIA_TYPE* out) = 0;
    virtual HRESULT DecideBufferSize(IMemAllocator* allocator, ALLOCATOR_PROPERTIES* request) = 0;
    virtual HRESULT GetMediaType(int position, AM_MEDIA_TYPE* mt) = 0;
    virtual HRESULT StartStreaming() { return S_OK; }
    virtual HRESULT StopStreaming() { return S_OK; }
    virtual HRESULT SetMediaType(PIN_DIRECTION, const AM_MEDIA_TYPE*) { return S_OK; }
    virtual HRESULT CheckConnect(PIN_DIRECTION, IPin*) { return S_OK; }
    virtual HRESULT BreakConnect(PIN_DIRECTION) { return S_OK; }
    virtual HRESULT CompleteConnect(PIN_DIRECTION, IPin*) { return S_OK; }
    virtual HRESULT Receive(IMediaSample* sample) = 0;
    virtual HRESULT EndOfStream();
    virtual HRESULT BeginFlush();
    virtual HRESULT EndFlush();
    virtual HRESULT NewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate);
    // The input pin's media-type check; by default the input type check alone.
    virtual HRESULT CheckInputPinMediaType(const AM_MEDIA_TYPE* mt) { return CheckInputType(mt); }
    // Registration record.
    virtual const wchar_t* FilterName() const = 0;
    virtual DWORD FilterMerit() const = 0;

    TransformInputPin* InputPin() { return input_.get(); }
    TransformOutputPin* OutputPin() { return output_.get(); }
    IFilterGraph* Graph() const { return graph_; }
    FILTER_STATE State() const { return state_; }
    CRITICAL_SECTION& StateLock() { return stateLock_; }
    CRITICAL_SECTION& ReceiveLock() { return receiveLock_; }

protected:
    // Moves to Paused under the state lock; the pin that must be told the stream has ended (an
    // unconnected input) is returned for the caller to notify after releasing the lock.
    HRESULT PauseLocked(ComRef<IPin>& endOfStreamTo);

    struct Inner : IUnknown {
        TransformFilter* owner;
        STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override {
            return owner->NonDelegatingQueryInterface(riid, ppv);
        }
        STDMETHODIMP_(ULONG) AddRef() override { return owner->NonDelegatingAddRef(); }
        STDMETHODIMP_(ULONG) Release() override { return owner->NonDelegatingRelease(); }
    };

    CLSID clsid_;
    Inner inner_;
    IUnknown* outer_;
    std::atomic<long> refs_{0};
    CRITICAL_SECTION stateLock_;
    CRITICAL_SECTION receiveLock_;
    FILTER_STATE state_ = State_Stopped;
    IReferenceClock* clock_ = nullptr;
    IFilterGraph* graph_ = nullptr;  // not referenced: the graph owns the filter
    wchar_t name_[MAX_FILTER_NAME] = {};
    bool eosDelivered_ = false;
    std::unique_ptr<TransformInputPin> input_;
    std::unique_ptr<TransformOutputPin> output_;
};

}  // namespace dshow
}  // namespace ulvetta
