// TransformInputPin: the filter's input; accepts connections, holds the upstream allocator and passes
// samples, end of stream, flushes and new segments to the filter under its receive lock.
#pragma once

#include <windows.h>
#include <dshow.h>

#include <atomic>

#include "filter/dshow/TransformPin.h"

namespace ulvetta {
namespace dshow {

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

}  // namespace dshow
}  // namespace ulvetta
