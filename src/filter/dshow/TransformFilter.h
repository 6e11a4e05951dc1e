// A small, complete DirectShow transform-filter base: the filter object (IBaseFilter, IMediaFilter,
// IPersist, IAMovieSetup) with one input and one output pin, media-type enumeration, allocator
// negotiation (the output pin brings its own allocator when downstream has none), state changes from any
// thread, flushing, new segments, end of stream, and an IMediaSeeking pass-through on the output pin.
//
// Threads and locks: stateLock_ guards the filter state and connections (graph thread); receiveLock_ is
// held while a sample or end of stream is processed (streaming thread), and Stop takes it after
// decommitting the input allocator so that a blocked streaming thread is released first. No lock is
// held while calling downstream from a state change; BeginFlush takes no lock.
//
// The reference count of the pins is the filter's. A derived filter supplies the format checks, buffer
// sizing and the processing of samples.
#pragma once

#include <windows.h>
#include <dshow.h>

#include <memory>

#include "filter/dshow/DShowUtil.h"

namespace ulvetta {
namespace dshow {

class TransformFilter;

// Common part of both pins: connection, media type and the IPin queries.
class TransformPin : public IPin {
public:
    TransformPin(TransformFilter* filter, PIN_DIRECTION dir, const wchar_t* name, const wchar_t* id);
    virtual ~TransformPin();

    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override;
    STDMETHODIMP_(ULONG) AddRef() override;
    STDMETHODIMP_(ULONG) Release() override;

    STDMETHODIMP Disconnect() override;
    STDMETHODIMP ConnectedTo(IPin** pin) override;
    STDMETHODIMP ConnectionMediaType(AM_MEDIA_TYPE* mt) override;
    STDMETHODIMP QueryPinInfo(PIN_INFO* info) override;
    STDMETHODIMP QueryDirection(PIN_DIRECTION* dir) override;
    STDMETHODIMP QueryId(LPWSTR* id) override;
    STDMETHODIMP QueryAccept(const AM_MEDIA_TYPE* mt) override;
    STDMETHODIMP EnumMediaTypes(IEnumMediaTypes** e) override;
    STDMETHODIMP QueryInternalConnections(IPin** pins, ULONG* n) override;

    bool IsConnected() const { return connected_.get() != nullptr; }
    IPin* Connected() const { return connected_.get(); }
    const AM_MEDIA_TYPE& MediaType() const { return mt_; }
    // The pin's own media-type check.
    virtual HRESULT CheckMediaType(const AM_MEDIA_TYPE* mt) = 0;
    // Type offered at a position of this pin's enumeration.
    virtual HRESULT GetMediaType(int position, AM_MEDIA_TYPE* mt) = 0;

protected:
    // Stores a new connection; called under the filter's state lock.
    void SetConnection(IPin* pin, const AM_MEDIA_TYPE* mt);
    void ClearConnection();

    TransformFilter* filter_;
    PIN_DIRECTION dir_;
    const wchar_t* name_;
    const wchar_t* id_;
    ComRef<IPin> connected_;
    AM_MEDIA_TYPE mt_{};
};

class TransformInputPin : public TransformPin, public IMemInputPin {
public:
    explicit TransformInputPin(TransformFilter* filter);
    ~TransformInputPin() override;

    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override;
    STDMETHODIMP_(ULONG) AddRef() override { return TransformPin::AddRef(); }
    STDMETHODIMP_(ULONG) Release() override { return TransformPin::Release(); }

    // IPin
    STDMETHODIMP Connect(IPin* receivePin, const AM_MEDIA_TYPE* mt) override;
    STDMETHODIMP ReceiveConnection(IPin* connector, const AM_MEDIA_TYPE* mt) override;
    STDMETHODIMP Disconnect() override;
    STDMETHODIMP EndOfStream() override;
    STDMETHODIMP BeginFlush() override;
    STDMETHODIMP EndFlush() override;
    STDMETHODIMP NewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate) override;

    // IMemInputPin
    STDMETHODIMP GetAllocator(IMemAllocator** allocator) override;
    STDMETHODIMP NotifyAllocator(IMemAllocator* allocator, BOOL readOnly) override;
    STDMETHODIMP GetAllocatorRequirements(ALLOCATOR_PROPERTIES* props) override;
    STDMETHODIMP Receive(IMediaSample* sample) override;
    STDMETHODIMP ReceiveMultiple(IMediaSample** samples, long count, long* processed) override;
    STDMETHODIMP ReceiveCanBlock() override;

    HRESULT CheckMediaType(const AM_MEDIA_TYPE* mt) override;
    HRESULT GetMediaType(int, AM_MEDIA_TYPE*) override { return VFW_S_NO_MORE_ITEMS; }

    IMemAllocator* Allocator() const { return allocator_.get(); }
    bool Flushing() const { return flushing_; }
    // Decommits the allocator (releases a streaming thread blocked in GetBuffer).
    void Inactive();
    void Active() { endOfStream_ = false; }

private:
    ComRef<IMemAllocator> allocator_;
    std::atomic<bool> flushing_{false};
    bool endOfStream_ = false;
};

class TransformOutputPin : public TransformPin, public IMediaSeeking {
public:
    explicit TransformOutputPin(TransformFilter* filter);
    ~TransformOutputPin() override;

    STDMETHODIMP QueryInterface(REFIID riid, void** ppv) override;
    STDMETHODIMP_(ULONG) AddRef() override { return TransformPin::AddRef(); }
    STDMETHODIMP_(ULONG) Release() override { return TransformPin::Release(); }

    // IPin
    STDMETHODIMP Connect(IPin* receivePin, const AM_MEDIA_TYPE* mt) override;
    STDMETHODIMP ReceiveConnection(IPin*, const AM_MEDIA_TYPE*) override { return E_UNEXPECTED; }
    STDMETHODIMP Disconnect() override;
    STDMETHODIMP EndOfStream() override { return E_UNEXPECTED; }
    STDMETHODIMP BeginFlush() override { return E_UNEXPECTED; }
    STDMETHODIMP EndFlush() override { return E_UNEXPECTED; }
    STDMETHODIMP NewSegment(REFERENCE_TIME, REFERENCE_TIME, double) override { return S_OK; }

    // IMediaSeeking, forwarded to the pin upstream of the filter's input.
    STDMETHODIMP GetCapabilities(DWORD* caps) override;
    STDMETHODIMP CheckCapabilities(DWORD* caps) override;
    STDMETHODIMP IsFormatSupported(const GUID* format) override;
    STDMETHODIMP QueryPreferredFormat(GUID* format) override;
    STDMETHODIMP GetTimeFormat(GUID* format) override;
    STDMETHODIMP IsUsingTimeFormat(const GUID* format) override;
    STDMETHODIMP SetTimeFormat(const GUID* format) override;
    STDMETHODIMP GetDuration(LONGLONG* duration) override;
    STDMETHODIMP GetStopPosition(LONGLONG* stop) override;
    STDMETHODIMP GetCurrentPosition(LONGLONG* current) override;
    STDMETHODIMP ConvertTimeFormat(LONGLONG* target, const GUID* targetFormat, LONGLONG source,
                                   const GUID* sourceFormat) override;
    STDMETHODIMP SetPositions(LONGLONG* current, DWORD currentFlags, LONGLONG* stop, DWORD stopFlags) override;
    STDMETHODIMP GetPositions(LONGLONG* current, LONGLONG* stop) override;
    STDMETHODIMP GetAvailable(LONGLONG* earliest, LONGLONG* latest) override;
    STDMETHODIMP SetRate(double rate) override;
    STDMETHODIMP GetRate(double* rate) override;
    STDMETHODIMP GetPreroll(LONGLONG* preroll) override;

    HRESULT CheckMediaType(const AM_MEDIA_TYPE* mt) override;
    HRESULT GetMediaType(int position, AM_MEDIA_TYPE* mt) override;

    HRESULT GetDeliveryBuffer(IMediaSample** sample, REFERENCE_TIME* start, REFERENCE_TIME* stop, DWORD flags);
    HRESULT Deliver(IMediaSample* sample);
    HRESULT DeliverEndOfStream();
    HRESULT DeliverBeginFlush();
    HRESULT DeliverEndFlush();
    HRESULT DeliverNewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate);
    HRESULT Active();
    void Inactive();

private:
    HRESULT TryConnect(IPin* receivePin, const AM_MEDIA_TYPE* mt);
    HRESULT DecideAllocator(IMemInputPin* input);
    // The upstream seeking interface, or null.
    HRESULT UpstreamSeeking(IMediaSeeking** seeking);

    ComRef<IMemInputPin> input_;
    ComRef<IMemAllocator> allocator_;
};

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
    REFERENCE_TIME start_ = 0;
    IFilterGraph* graph_ = nullptr;  // not referenced: the graph owns the filter
    wchar_t name_[MAX_FILTER_NAME] = {};
    bool eosDelivered_ = false;
    std::unique_ptr<TransformInputPin> input_;
    std::unique_ptr<TransformOutputPin> output_;
};

}  // namespace dshow
}  // namespace ulvetta
