#include "filter/dshow/TransformInputPin.h"

#include <cstring>
#include <cwchar>

#include "filter/dshow/TransformFilter.h"

namespace ulvetta {
namespace dshow {

TransformInputPin::TransformInputPin(TransformFilter* filter)
    : TransformPin(filter, PINDIR_INPUT, L"Input", L"In") {}

TransformInputPin::~TransformInputPin() = default;

STDMETHODIMP TransformInputPin::QueryInterface(REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    if (riid == IID_IMemInputPin) {
        *ppv = static_cast<IMemInputPin*>(this);
        AddRef();
        return S_OK;
    }
    return TransformPin::QueryInterface(riid, ppv);
}

HRESULT TransformInputPin::CheckMediaType(const AM_MEDIA_TYPE* mt) { return filter_->CheckInputPinMediaType(mt); }

STDMETHODIMP TransformInputPin::Connect(IPin*, const AM_MEDIA_TYPE*) { return E_UNEXPECTED; }

STDMETHODIMP TransformInputPin::ReceiveConnection(IPin* connector, const AM_MEDIA_TYPE* mt) {
    return ComBoundary([&]() -> HRESULT {
        if (connector == nullptr || mt == nullptr) return E_POINTER;
        CritSecLock g(filter_->StateLock());
        if (IsConnected()) return VFW_E_ALREADY_CONNECTED;
        if (filter_->State() != State_Stopped) return VFW_E_NOT_STOPPED;
        PIN_DIRECTION other;
        if (FAILED(connector->QueryDirection(&other)) || other != PINDIR_OUTPUT) return VFW_E_INVALID_DIRECTION;
        HRESULT hr = filter_->CheckConnect(PINDIR_INPUT, connector);
        if (FAILED(hr)) return hr;
        if (CheckMediaType(mt) != S_OK) {
            filter_->BreakConnect(PINDIR_INPUT);
            return VFW_E_TYPE_NOT_ACCEPTED;
        }
        SetConnection(connector, mt);
        // A failure here, thrown or returned, undoes the connection.
        hr = ComBoundary([&] {
            HRESULT r = filter_->SetMediaType(PINDIR_INPUT, mt);
            return SUCCEEDED(r) ? filter_->CompleteConnect(PINDIR_INPUT, connector) : r;
        });
        if (FAILED(hr)) {
            filter_->BreakConnect(PINDIR_INPUT);
            ClearConnection();
            return hr;
        }
        return S_OK;
    });
}

STDMETHODIMP TransformInputPin::Disconnect() {
    return ComBoundary([&]() -> HRESULT {
        HRESULT hr = TransformPin::Disconnect();
        if (hr == S_OK) allocator_.reset();
        return hr;
    });
}

STDMETHODIMP TransformInputPin::EndOfStream() {
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(filter_->ReceiveLock());
        if (filter_->State() == State_Stopped) return VFW_E_WRONG_STATE;
        if (flushing_) return S_FALSE;
        endOfStream_ = true;
        return filter_->EndOfStream();
    });
}

STDMETHODIMP TransformInputPin::BeginFlush() {
    return ComBoundary([&]() -> HRESULT {
        // No lock: a streaming thread blocked downstream is released by the flush that follows. Without
        // both connections there is nothing to flush, and a flag left set would drop the first samples.
        TransformOutputPin* out = filter_->OutputPin();
        if (!IsConnected() || out == nullptr || !out->IsConnected()) return VFW_E_NOT_CONNECTED;
        flushing_ = true;
        return filter_->BeginFlush();
    });
}

STDMETHODIMP TransformInputPin::EndFlush() {
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(filter_->StateLock());
        HRESULT hr = filter_->EndFlush();
        flushing_ = false;
        endOfStream_ = false;
        return hr;
    });
}

STDMETHODIMP TransformInputPin::NewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate) {
    return ComBoundary([&]() -> HRESULT {
        return filter_->NewSegment(start, stop, rate);
    });
}

STDMETHODIMP TransformInputPin::GetAllocator(IMemAllocator** allocator) {
    return ComBoundary([&]() -> HRESULT {
        if (allocator == nullptr) return E_POINTER;
        CritSecLock g(filter_->StateLock());
        if (!allocator_) {
            HRESULT hr = CoCreateInstance(CLSID_MemoryAllocator, nullptr, CLSCTX_INPROC_SERVER, IID_IMemAllocator,
                                          reinterpret_cast<void**>(allocator_.put()));
            if (FAILED(hr)) return hr;
        }
        *allocator = allocator_.get();
        (*allocator)->AddRef();
        return S_OK;
    });
}

STDMETHODIMP TransformInputPin::NotifyAllocator(IMemAllocator* allocator, BOOL) {
    if (allocator == nullptr) return E_POINTER;
    CritSecLock g(filter_->StateLock());
    allocator_.reset(allocator);
    return S_OK;
}

STDMETHODIMP TransformInputPin::GetAllocatorRequirements(ALLOCATOR_PROPERTIES*) { return E_NOTIMPL; }

STDMETHODIMP TransformInputPin::Receive(IMediaSample* sample) {
    return ComBoundary([&]() -> HRESULT {
        if (sample == nullptr) return E_POINTER;
        CritSecLock g(filter_->ReceiveLock());
        if (filter_->State() == State_Stopped) return VFW_E_WRONG_STATE;
        if (flushing_) return S_FALSE;
        if (endOfStream_) return VFW_E_SAMPLE_REJECTED_EOS;
        // A sample may carry a new media type.
        AM_MEDIA_TYPE* changed = nullptr;
        if (sample->GetMediaType(&changed) == S_OK && changed != nullptr) {
            HRESULT hr = CheckMediaType(changed) == S_OK
                             ? ComBoundary([&] { return filter_->SetMediaType(PINDIR_INPUT, changed); })
                             : VFW_E_INVALIDMEDIATYPE;
            if (SUCCEEDED(hr)) {
                FreeMediaType(mt_);
                hr = CopyMediaType(&mt_, changed);
            }
            DeleteMediaType(changed);
            if (FAILED(hr)) return hr;
        }
        return filter_->Receive(sample);
    });
}

STDMETHODIMP TransformInputPin::ReceiveMultiple(IMediaSample** samples, long count, long* processed) {
    if (samples == nullptr || processed == nullptr) return E_POINTER;
    HRESULT hr = S_OK;
    *processed = 0;
    while (*processed < count) {
        hr = Receive(samples[*processed]);
        if (hr != S_OK) break;
        ++*processed;
    }
    return hr;
}

STDMETHODIMP TransformInputPin::ReceiveCanBlock() { return S_OK; }

void TransformInputPin::Inactive() {
    flushing_ = false;
    if (allocator_) allocator_->Decommit();
}

}  // namespace dshow
}  // namespace ulvetta
