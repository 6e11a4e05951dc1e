#include "filter/dshow/TransformOutputPin.h"

#include <cstring>
#include <cwchar>

#include "filter/dshow/TransformFilter.h"

namespace ulvetta {
namespace dshow {

namespace {

bool PartialMatch(const AM_MEDIA_TYPE* want, const AM_MEDIA_TYPE* have) {
    if (want == nullptr) return true;
    if (want->majortype != GUID_NULL && want->majortype != have->majortype) return false;
    if (want->subtype != GUID_NULL && want->subtype != have->subtype) return false;
    if (want->formattype != GUID_NULL && want->formattype != have->formattype) return false;
    return true;
}

}  // namespace

TransformOutputPin::TransformOutputPin(TransformFilter* filter)
    : TransformPin(filter, PINDIR_OUTPUT, L"Output", L"Out") {}

TransformOutputPin::~TransformOutputPin() = default;

STDMETHODIMP TransformOutputPin::QueryInterface(REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    if (riid == IID_IMediaSeeking) {
        *ppv = static_cast<IMediaSeeking*>(this);
        AddRef();
        return S_OK;
    }
    return TransformPin::QueryInterface(riid, ppv);
}

HRESULT TransformOutputPin::CheckMediaType(const AM_MEDIA_TYPE* mt) {
    TransformInputPin* in = filter_->InputPin();
    if (in == nullptr || !in->IsConnected()) return E_UNEXPECTED;
    return filter_->CheckTransform(&in->MediaType(), mt);
}

HRESULT TransformOutputPin::GetMediaType(int position, AM_MEDIA_TYPE* mt) {
    return filter_->GetMediaType(position, mt);
}

HRESULT TransformOutputPin::TryConnect(IPin* receivePin, const AM_MEDIA_TYPE* mt) {
    if (CheckMediaType(mt) != S_OK) return VFW_E_TYPE_NOT_ACCEPTED;
    SetConnection(receivePin, mt);
    // A failure in any step, thrown or returned, undoes the connection on both sides.
    HRESULT hr = ComBoundary([&] { return filter_->SetMediaType(PINDIR_OUTPUT, mt); });
    if (SUCCEEDED(hr)) hr = receivePin->ReceiveConnection(this, mt);
    if (SUCCEEDED(hr)) {
        hr = ComBoundary([&] {
            HRESULT r = receivePin->QueryInterface(IID_IMemInputPin, reinterpret_cast<void**>(input_.put()));
            if (SUCCEEDED(r)) r = DecideAllocator(input_.get());
            return SUCCEEDED(r) ? filter_->CompleteConnect(PINDIR_OUTPUT, receivePin) : r;
        });
        if (FAILED(hr)) receivePin->Disconnect();
    }
    if (FAILED(hr)) {
        input_.reset();
        allocator_.reset();
        filter_->BreakConnect(PINDIR_OUTPUT);
        ClearConnection();
    }
    return hr;
}

STDMETHODIMP TransformOutputPin::Connect(IPin* receivePin, const AM_MEDIA_TYPE* mt) {
    return ComBoundary([&]() -> HRESULT {
        if (receivePin == nullptr) return E_POINTER;
        CritSecLock g(filter_->StateLock());
        if (IsConnected()) return VFW_E_ALREADY_CONNECTED;
        if (filter_->State() != State_Stopped) return VFW_E_NOT_STOPPED;
        HRESULT hr = filter_->CheckConnect(PINDIR_OUTPUT, receivePin);
        if (FAILED(hr)) return hr;
        // A fully specified type is tried alone.
        if (mt != nullptr && mt->majortype != GUID_NULL && mt->subtype != GUID_NULL && mt->formattype != GUID_NULL &&
            mt->pbFormat != nullptr)
            return SUCCEEDED(TryConnect(receivePin, mt)) ? S_OK : VFW_E_NO_ACCEPTABLE_TYPES;
        // Otherwise our own types first, then the ones the receiving pin proposes.
        for (int i = 0;; ++i) {
            AM_MEDIA_TYPE ours{};
            if (GetMediaType(i, &ours) != S_OK) break;
            const bool ok = PartialMatch(mt, &ours) && SUCCEEDED(TryConnect(receivePin, &ours));
            FreeMediaType(ours);
            if (ok) return S_OK;
        }
        ComRef<IEnumMediaTypes> theirs;
        if (SUCCEEDED(receivePin->EnumMediaTypes(theirs.put())) && theirs) {
            AM_MEDIA_TYPE* t = nullptr;
            while (theirs->Next(1, &t, nullptr) == S_OK) {
                const bool ok = PartialMatch(mt, t) && SUCCEEDED(TryConnect(receivePin, t));
                DeleteMediaType(t);
                if (ok) return S_OK;
            }
        }
        return VFW_E_NO_ACCEPTABLE_TYPES;
    });
}

STDMETHODIMP TransformOutputPin::Disconnect() {
    return ComBoundary([&]() -> HRESULT {
        HRESULT hr = TransformPin::Disconnect();
        if (hr == S_OK) {
            if (allocator_) allocator_->Decommit();
            allocator_.reset();
            input_.reset();
        }
        return hr;
    });
}

HRESULT TransformOutputPin::DecideAllocator(IMemInputPin* input) {
    ALLOCATOR_PROPERTIES props{};
    input->GetAllocatorRequirements(&props);
    if (props.cbAlign == 0) props.cbAlign = 1;
    ComRef<IMemAllocator> alloc;
    HRESULT hr = input->GetAllocator(alloc.put());
    if (SUCCEEDED(hr) && alloc) {
        ALLOCATOR_PROPERTIES request = props;
        hr = filter_->DecideBufferSize(alloc.get(), &request);
        if (SUCCEEDED(hr)) hr = input->NotifyAllocator(alloc.get(), FALSE);
        if (SUCCEEDED(hr)) {
            allocator_ = alloc;
            return S_OK;
        }
    }
    // Downstream has no allocator to offer (or refused ours): bring our own.
    alloc.reset();
    hr = CoCreateInstance(CLSID_MemoryAllocator, nullptr, CLSCTX_INPROC_SERVER, IID_IMemAllocator,
                          reinterpret_cast<void**>(alloc.put()));
    if (FAILED(hr)) return hr;
    ALLOCATOR_PROPERTIES request = props;
    hr = filter_->DecideBufferSize(alloc.get(), &request);
    if (SUCCEEDED(hr)) hr = input->NotifyAllocator(alloc.get(), FALSE);
    if (SUCCEEDED(hr)) allocator_ = alloc;
    return hr;
}

HRESULT TransformOutputPin::GetDeliveryBuffer(IMediaSample** sample, REFERENCE_TIME* start, REFERENCE_TIME* stop,
                                              DWORD flags) {
    if (!allocator_) return VFW_E_NO_ALLOCATOR;
    return allocator_->GetBuffer(sample, start, stop, flags);
}

HRESULT TransformOutputPin::Deliver(IMediaSample* sample) {
    if (!input_) return VFW_E_NOT_CONNECTED;
    return input_->Receive(sample);
}

HRESULT TransformOutputPin::DeliverEndOfStream() {
    IPin* p = Connected();
    return p ? p->EndOfStream() : VFW_E_NOT_CONNECTED;
}

HRESULT TransformOutputPin::DeliverBeginFlush() {
    IPin* p = Connected();
    return p ? p->BeginFlush() : VFW_E_NOT_CONNECTED;
}

HRESULT TransformOutputPin::DeliverEndFlush() {
    IPin* p = Connected();
    return p ? p->EndFlush() : VFW_E_NOT_CONNECTED;
}

HRESULT TransformOutputPin::DeliverNewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate) {
    IPin* p = Connected();
    return p ? p->NewSegment(start, stop, rate) : VFW_E_NOT_CONNECTED;
}

HRESULT TransformOutputPin::Active() { return allocator_ ? allocator_->Commit() : S_OK; }

void TransformOutputPin::Inactive() {
    if (allocator_) allocator_->Decommit();
}

HRESULT TransformOutputPin::UpstreamSeeking(IMediaSeeking** seeking) {
    *seeking = nullptr;
    TransformInputPin* in = filter_->InputPin();
    IPin* up = in ? in->Connected() : nullptr;
    if (up == nullptr) return VFW_E_NOT_CONNECTED;
    return up->QueryInterface(IID_IMediaSeeking, reinterpret_cast<void**>(seeking));
}

// An upstream pin that cannot seek makes seeking unsupported here too (E_NOTIMPL, not its E_NOINTERFACE).
#define ULVETTA_FORWARD_SEEKING(call)                                   \
    ComRef<IMediaSeeking> up;                                           \
    const HRESULT hr = UpstreamSeeking(up.put());                       \
    if (hr == VFW_E_NOT_CONNECTED) return hr;                           \
    if (FAILED(hr) || !up) return E_NOTIMPL;                            \
    return up->call

STDMETHODIMP TransformOutputPin::GetCapabilities(DWORD* caps) { ULVETTA_FORWARD_SEEKING(GetCapabilities(caps)); }
STDMETHODIMP TransformOutputPin::CheckCapabilities(DWORD* caps) { ULVETTA_FORWARD_SEEKING(CheckCapabilities(caps)); }
STDMETHODIMP TransformOutputPin::IsFormatSupported(const GUID* f) { ULVETTA_FORWARD_SEEKING(IsFormatSupported(f)); }
STDMETHODIMP TransformOutputPin::QueryPreferredFormat(GUID* f) { ULVETTA_FORWARD_SEEKING(QueryPreferredFormat(f)); }
STDMETHODIMP TransformOutputPin::GetTimeFormat(GUID* f) { ULVETTA_FORWARD_SEEKING(GetTimeFormat(f)); }
STDMETHODIMP TransformOutputPin::IsUsingTimeFormat(const GUID* f) { ULVETTA_FORWARD_SEEKING(IsUsingTimeFormat(f)); }
STDMETHODIMP TransformOutputPin::SetTimeFormat(const GUID* f) { ULVETTA_FORWARD_SEEKING(SetTimeFormat(f)); }
STDMETHODIMP TransformOutputPin::GetDuration(LONGLONG* d) { ULVETTA_FORWARD_SEEKING(GetDuration(d)); }
STDMETHODIMP TransformOutputPin::GetStopPosition(LONGLONG* s) { ULVETTA_FORWARD_SEEKING(GetStopPosition(s)); }
STDMETHODIMP TransformOutputPin::GetCurrentPosition(LONGLONG* c) { ULVETTA_FORWARD_SEEKING(GetCurrentPosition(c)); }
STDMETHODIMP TransformOutputPin::ConvertTimeFormat(LONGLONG* target, const GUID* targetFormat, LONGLONG source,
                                                   const GUID* sourceFormat) {
    ULVETTA_FORWARD_SEEKING(ConvertTimeFormat(target, targetFormat, source, sourceFormat));
}
STDMETHODIMP TransformOutputPin::SetPositions(LONGLONG* current, DWORD currentFlags, LONGLONG* stop,
                                              DWORD stopFlags) {
    ULVETTA_FORWARD_SEEKING(SetPositions(current, currentFlags, stop, stopFlags));
}
STDMETHODIMP TransformOutputPin::GetPositions(LONGLONG* c, LONGLONG* s) { ULVETTA_FORWARD_SEEKING(GetPositions(c, s)); }
STDMETHODIMP TransformOutputPin::GetAvailable(LONGLONG* e, LONGLONG* l) { ULVETTA_FORWARD_SEEKING(GetAvailable(e, l)); }
STDMETHODIMP TransformOutputPin::SetRate(double r) { ULVETTA_FORWARD_SEEKING(SetRate(r)); }
STDMETHODIMP TransformOutputPin::GetRate(double* r) { ULVETTA_FORWARD_SEEKING(GetRate(r)); }
STDMETHODIMP TransformOutputPin::GetPreroll(LONGLONG* p) { ULVETTA_FORWARD_SEEKING(GetPreroll(p)); }

#undef ULVETTA_FORWARD_SEEKING

}  // namespace dshow
}  // namespace ulvetta
