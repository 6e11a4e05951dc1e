#include "filter/dshow/TransformFilter.h"

#include <cstring>
#include <cwchar>
#include <vector>

namespace ulvetta {
namespace dshow {

namespace {


// Enumerates the filter's two pins; holds a reference on the filter.
class PinEnumerator : public SingleInterfaceObject<IEnumPins> {
public:
    PinEnumerator(TransformFilter* f, ULONG position) : filter_(f), pos_(position) { filter_->AddRef(); }
    ~PinEnumerator() override { filter_->Release(); }
    STDMETHODIMP Next(ULONG count, IPin** pins, ULONG* fetched) override {
        if (pins == nullptr) return E_POINTER;
        if (count > 1 && fetched == nullptr) return E_INVALIDARG;
        ULONG n = 0;
        while (n < count && pos_ < static_cast<ULONG>(filter_->GetPinCount())) {
            TransformPin* p = filter_->GetPin(static_cast<int>(pos_++));
            if (p == nullptr) continue;
            pins[n++] = p;
            p->AddRef();
        }
        if (fetched) *fetched = n;
        return n == count ? S_OK : S_FALSE;
    }
    STDMETHODIMP Skip(ULONG count) override {
        const ULONG total = static_cast<ULONG>(filter_->GetPinCount());
        if (pos_ + count > total) {
            pos_ = total;
            return S_FALSE;
        }
        pos_ += count;
        return S_OK;
    }
    STDMETHODIMP Reset() override {
        pos_ = 0;
        return S_OK;
    }
    STDMETHODIMP Clone(IEnumPins** e) override {
        if (e == nullptr) return E_POINTER;
        *e = new (std::nothrow) PinEnumerator(filter_, pos_);
        if (*e == nullptr) return E_OUTOFMEMORY;
        (*e)->AddRef();
        return S_OK;
    }

private:
    TransformFilter* filter_;
    ULONG pos_;
};

// Enumerates the media types a pin offers; holds a reference on the pin (and so on the filter).
class MediaTypeEnumerator : public SingleInterfaceObject<IEnumMediaTypes> {
public:
    MediaTypeEnumerator(TransformPin* pin, ULONG position) : pin_(pin), pos_(position) { pin_->AddRef(); }
    ~MediaTypeEnumerator() override { pin_->Release(); }
    STDMETHODIMP Next(ULONG count, AM_MEDIA_TYPE** types, ULONG* fetched) override {
        if (types == nullptr) return E_POINTER;
        if (count > 1 && fetched == nullptr) return E_INVALIDARG;
        ULONG n = 0;
        while (n < count) {
            AM_MEDIA_TYPE mt{};
            if (pin_->GetMediaType(static_cast<int>(pos_), &mt) != S_OK) break;
            ++pos_;
            types[n] = static_cast<AM_MEDIA_TYPE*>(CoTaskMemAlloc(sizeof(AM_MEDIA_TYPE)));
            if (types[n] == nullptr) {
                FreeMediaType(mt);
                break;
            }
            *types[n] = mt;  // ownership of the format block moves with it
            ++n;
        }
        if (fetched) *fetched = n;
        return n == count ? S_OK : S_FALSE;
    }
    STDMETHODIMP Skip(ULONG count) override {
        pos_ += count;
        return S_OK;
    }
    STDMETHODIMP Reset() override {
        pos_ = 0;
        return S_OK;
    }
    STDMETHODIMP Clone(IEnumMediaTypes** e) override {
        if (e == nullptr) return E_POINTER;
        *e = new (std::nothrow) MediaTypeEnumerator(pin_, pos_);
        if (*e == nullptr) return E_OUTOFMEMORY;
        (*e)->AddRef();
        return S_OK;
    }

private:
    TransformPin* pin_;
    ULONG pos_;
};

bool PartialMatch(const AM_MEDIA_TYPE* want, const AM_MEDIA_TYPE* have) {
    if (want == nullptr) return true;
    if (want->majortype != GUID_NULL && want->majortype != have->majortype) return false;
    if (want->subtype != GUID_NULL && want->subtype != have->subtype) return false;
    if (want->formattype != GUID_NULL && want->formattype != have->formattype) return false;
    return true;
}

}  // namespace

// ---- TransformPin ----

TransformPin::TransformPin(TransformFilter* filter, PIN_DIRECTION dir, const wchar_t* name, const wchar_t* id)
    : filter_(filter), dir_(dir), name_(name), id_(id) {}

TransformPin::~TransformPin() { FreeMediaType(mt_); }

STDMETHODIMP TransformPin::QueryInterface(REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    if (riid == IID_IUnknown || riid == IID_IPin) {
        *ppv = static_cast<IPin*>(this);
        AddRef();
        return S_OK;
    }
    *ppv = nullptr;
    return E_NOINTERFACE;
}

STDMETHODIMP_(ULONG) TransformPin::AddRef() { return filter_->AddRef(); }
STDMETHODIMP_(ULONG) TransformPin::Release() { return filter_->Release(); }

void TransformPin::SetConnection(IPin* pin, const AM_MEDIA_TYPE* mt) {
    connected_.reset(pin);
    FreeMediaType(mt_);
    if (FAILED(CopyMediaType(&mt_, mt))) std::memset(&mt_, 0, sizeof mt_);
}

void TransformPin::ClearConnection() {
    connected_.reset();
    FreeMediaType(mt_);
    std::memset(&mt_, 0, sizeof mt_);
}

STDMETHODIMP TransformPin::Disconnect() {
    CritSecLock g(filter_->StateLock());
    if (filter_->State() != State_Stopped) return VFW_E_NOT_STOPPED;
    if (!IsConnected()) return S_FALSE;
    filter_->BreakConnect(dir_);
    ClearConnection();
    return S_OK;
}

STDMETHODIMP TransformPin::ConnectedTo(IPin** pin) {
    if (pin == nullptr) return E_POINTER;
    CritSecLock g(filter_->StateLock());
    *pin = connected_.get();
    if (*pin == nullptr) return VFW_E_NOT_CONNECTED;
    (*pin)->AddRef();
    return S_OK;
}

STDMETHODIMP TransformPin::ConnectionMediaType(AM_MEDIA_TYPE* mt) {
    if (mt == nullptr) return E_POINTER;
    CritSecLock g(filter_->StateLock());
    if (!IsConnected()) {
        std::memset(mt, 0, sizeof *mt);
        return VFW_E_NOT_CONNECTED;
    }
    return CopyMediaType(mt, &mt_);
}

STDMETHODIMP TransformPin::QueryPinInfo(PIN_INFO* info) {
    if (info == nullptr) return E_POINTER;
    info->pFilter = filter_;
    filter_->AddRef();
    info->dir = dir_;
    wcsncpy(info->achName, name_, MAX_PIN_NAME - 1);
    info->achName[MAX_PIN_NAME - 1] = L'\0';
    return S_OK;
}

STDMETHODIMP TransformPin::QueryDirection(PIN_DIRECTION* dir) {
    if (dir == nullptr) return E_POINTER;
    *dir = dir_;
    return S_OK;
}

STDMETHODIMP TransformPin::QueryId(LPWSTR* id) {
    if (id == nullptr) return E_POINTER;
    const size_t bytes = (wcslen(id_) + 1) * sizeof(wchar_t);
    *id = static_cast<LPWSTR>(CoTaskMemAlloc(bytes));
    if (*id == nullptr) return E_OUTOFMEMORY;
    std::memcpy(*id, id_, bytes);
    return S_OK;
}

STDMETHODIMP TransformPin::QueryAccept(const AM_MEDIA_TYPE* mt) {
    if (mt == nullptr) return E_POINTER;
    return CheckMediaType(mt) == S_OK ? S_OK : S_FALSE;
}

STDMETHODIMP TransformPin::EnumMediaTypes(IEnumMediaTypes** e) {
    if (e == nullptr) return E_POINTER;
    *e = new (std::nothrow) MediaTypeEnumerator(this, 0);
    if (*e == nullptr) return E_OUTOFMEMORY;
    (*e)->AddRef();
    return S_OK;
}

STDMETHODIMP TransformPin::QueryInternalConnections(IPin**, ULONG*) { return E_NOTIMPL; }

// ---- TransformInputPin ----

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
    hr = filter_->SetMediaType(PINDIR_INPUT, mt);
    if (SUCCEEDED(hr)) hr = filter_->CompleteConnect(PINDIR_INPUT, connector);
    if (FAILED(hr)) {
        filter_->BreakConnect(PINDIR_INPUT);
        ClearConnection();
        return hr;
    }
    return S_OK;
}

STDMETHODIMP TransformInputPin::Disconnect() {
    HRESULT hr = TransformPin::Disconnect();
    if (hr == S_OK) allocator_.reset();
    return hr;
}

STDMETHODIMP TransformInputPin::EndOfStream() {
    CritSecLock g(filter_->ReceiveLock());
    if (filter_->State() == State_Stopped) return VFW_E_WRONG_STATE;
    if (flushing_) return S_FALSE;
    endOfStream_ = true;
    return filter_->EndOfStream();
}

STDMETHODIMP TransformInputPin::BeginFlush() {
    // No lock: a streaming thread blocked downstream is released by the flush that follows.
    flushing_ = true;
    return filter_->BeginFlush();
}

STDMETHODIMP TransformInputPin::EndFlush() {
    CritSecLock g(filter_->StateLock());
    HRESULT hr = filter_->EndFlush();
    flushing_ = false;
    endOfStream_ = false;
    return hr;
}

STDMETHODIMP TransformInputPin::NewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate) {
    return filter_->NewSegment(start, stop, rate);
}

STDMETHODIMP TransformInputPin::GetAllocator(IMemAllocator** allocator) {
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
}

STDMETHODIMP TransformInputPin::NotifyAllocator(IMemAllocator* allocator, BOOL) {
    if (allocator == nullptr) return E_POINTER;
    CritSecLock g(filter_->StateLock());
    allocator_.reset(allocator);
    return S_OK;
}

STDMETHODIMP TransformInputPin::GetAllocatorRequirements(ALLOCATOR_PROPERTIES*) { return E_NOTIMPL; }

STDMETHODIMP TransformInputPin::Receive(IMediaSample* sample) {
    if (sample == nullptr) return E_POINTER;
    CritSecLock g(filter_->ReceiveLock());
    if (filter_->State() == State_Stopped) return VFW_E_WRONG_STATE;
    if (flushing_) return S_FALSE;
    if (endOfStream_) return VFW_E_SAMPLE_REJECTED_EOS;
    // A sample may carry a new media type.
    AM_MEDIA_TYPE* changed = nullptr;
    if (sample->GetMediaType(&changed) == S_OK && changed != nullptr) {
        HRESULT hr = CheckMediaType(changed) == S_OK ? filter_->SetMediaType(PINDIR_INPUT, changed)
                                                     : VFW_E_INVALIDMEDIATYPE;
        if (SUCCEEDED(hr)) {
            FreeMediaType(mt_);
            hr = CopyMediaType(&mt_, changed);
        }
        DeleteMediaType(changed);
        if (FAILED(hr)) return hr;
    }
    return filter_->Receive(sample);
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

// ---- TransformOutputPin ----

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
    HRESULT hr = filter_->SetMediaType(PINDIR_OUTPUT, mt);
    if (SUCCEEDED(hr)) hr = receivePin->ReceiveConnection(this, mt);
    if (SUCCEEDED(hr)) {
        hr = receivePin->QueryInterface(IID_IMemInputPin, reinterpret_cast<void**>(input_.put()));
        if (SUCCEEDED(hr)) hr = DecideAllocator(input_.get());
        if (SUCCEEDED(hr)) hr = filter_->CompleteConnect(PINDIR_OUTPUT, receivePin);
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
}

STDMETHODIMP TransformOutputPin::Disconnect() {
    HRESULT hr = TransformPin::Disconnect();
    if (hr == S_OK) {
        if (allocator_) allocator_->Decommit();
        allocator_.reset();
        input_.reset();
    }
    return hr;
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

#define ULVETTA_FORWARD_SEEKING(call)                       \
    ComRef<IMediaSeeking> up;                               \
    HRESULT hr = UpstreamSeeking(up.put());                 \
    if (FAILED(hr) || !up) return FAILED(hr) ? hr : E_NOTIMPL; \
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

// ---- TransformFilter ----

TransformFilter::TransformFilter(const CLSID& clsid, IUnknown* outer) : clsid_(clsid) {
    inner_.owner = this;
    outer_ = outer ? outer : &inner_;
    InitializeCriticalSection(&stateLock_);
    InitializeCriticalSection(&receiveLock_);
    ++g_objectCount;
}

TransformFilter::~TransformFilter() {
    output_.reset();
    input_.reset();
    if (clock_) clock_->Release();
    DeleteCriticalSection(&receiveLock_);
    DeleteCriticalSection(&stateLock_);
    --g_objectCount;
}

HRESULT STDMETHODCALLTYPE TransformFilter::NonDelegatingQueryInterface(REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    if (riid == IID_IUnknown) {
        *ppv = &inner_;
    } else if (riid == IID_IBaseFilter || riid == IID_IMediaFilter || riid == IID_IPersist) {
        *ppv = static_cast<IBaseFilter*>(this);
    } else if (riid == IID_IAMovieSetup) {
        *ppv = static_cast<IAMovieSetup*>(this);
    } else {
        *ppv = nullptr;
        return E_NOINTERFACE;
    }
    static_cast<IUnknown*>(*ppv)->AddRef();
    return S_OK;
}

ULONG STDMETHODCALLTYPE TransformFilter::NonDelegatingAddRef() { return ++refs_; }

ULONG STDMETHODCALLTYPE TransformFilter::NonDelegatingRelease() {
    const long r = --refs_;
    if (r == 0) {
        refs_ = 1;  // guard against re-entry while tearing down
        delete this;
    }
    return static_cast<ULONG>(r);
}

TransformPin* TransformFilter::GetPin(int n) {
    if (!input_) {
        input_.reset(new (std::nothrow) TransformInputPin(this));
        if (input_) output_.reset(new (std::nothrow) TransformOutputPin(this));
    }
    if (n == 0) return input_.get();
    if (n == 1) return output_.get();
    return nullptr;
}

STDMETHODIMP TransformFilter::GetClassID(CLSID* clsid) {
    if (clsid == nullptr) return E_POINTER;
    *clsid = clsid_;
    return S_OK;
}

STDMETHODIMP TransformFilter::Stop() {
    CritSecLock g(stateLock_);
    if (state_ == State_Stopped) return S_OK;
    GetPin(0);
    if (!input_->IsConnected() || !output_->IsConnected()) {
        state_ = State_Stopped;
        eosDelivered_ = false;
        return S_OK;
    }
    // Decommit the input first so that a streaming thread waiting for a buffer lets go of the receive lock.
    input_->Inactive();
    CritSecLock r(receiveLock_);
    output_->Inactive();
    HRESULT hr = StopStreaming();
    if (SUCCEEDED(hr)) {
        state_ = State_Stopped;
        eosDelivered_ = false;
    }
    return hr;
}

STDMETHODIMP TransformFilter::Pause() {
    CritSecLock g(stateLock_);
    GetPin(0);
    HRESULT hr = S_OK;
    if (state_ == State_Paused) {
        // nothing to do
    } else if (!input_->IsConnected()) {
        // With nothing to read, downstream gets its end of stream at once.
        if (output_->IsConnected() && !eosDelivered_) {
            output_->DeliverEndOfStream();
            eosDelivered_ = true;
        }
        state_ = State_Paused;
    } else if (!output_->IsConnected()) {
        state_ = State_Paused;
    } else {
        if (state_ == State_Stopped) {
            CritSecLock r(receiveLock_);
            hr = StartStreaming();
            if (SUCCEEDED(hr)) hr = output_->Active();
            if (SUCCEEDED(hr)) input_->Active();
        }
        if (SUCCEEDED(hr)) state_ = State_Paused;
    }
    return hr;
}

STDMETHODIMP TransformFilter::Run(REFERENCE_TIME start) {
    CritSecLock g(stateLock_);
    start_ = start;
    if (state_ == State_Stopped) {
        HRESULT hr = Pause();
        if (FAILED(hr)) return hr;
    }
    state_ = State_Running;
    return S_OK;
}

STDMETHODIMP TransformFilter::GetState(DWORD, FILTER_STATE* state) {
    if (state == nullptr) return E_POINTER;
    *state = state_;
    return S_OK;
}

STDMETHODIMP TransformFilter::SetSyncSource(IReferenceClock* clock) {
    CritSecLock g(stateLock_);
    if (clock) clock->AddRef();
    if (clock_) clock_->Release();
    clock_ = clock;
    return S_OK;
}

STDMETHODIMP TransformFilter::GetSyncSource(IReferenceClock** clock) {
    if (clock == nullptr) return E_POINTER;
    CritSecLock g(stateLock_);
    *clock = clock_;
    if (clock_) clock_->AddRef();
    return S_OK;
}

STDMETHODIMP TransformFilter::EnumPins(IEnumPins** e) {
    if (e == nullptr) return E_POINTER;
    *e = new (std::nothrow) PinEnumerator(this, 0);
    if (*e == nullptr) return E_OUTOFMEMORY;
    (*e)->AddRef();
    return S_OK;
}

STDMETHODIMP TransformFilter::FindPin(LPCWSTR id, IPin** pin) {
    if (id == nullptr || pin == nullptr) return E_POINTER;
    *pin = nullptr;
    GetPin(0);
    if (wcscmp(id, L"In") == 0)
        *pin = input_.get();
    else if (wcscmp(id, L"Out") == 0)
        *pin = output_.get();
    if (*pin == nullptr) return VFW_E_NOT_FOUND;
    (*pin)->AddRef();
    return S_OK;
}

STDMETHODIMP TransformFilter::QueryFilterInfo(FILTER_INFO* info) {
    if (info == nullptr) return E_POINTER;
    CritSecLock g(stateLock_);
    wcsncpy(info->achName, name_, MAX_FILTER_NAME - 1);
    info->achName[MAX_FILTER_NAME - 1] = L'\0';
    info->pGraph = graph_;
    if (graph_) graph_->AddRef();
    return S_OK;
}

STDMETHODIMP TransformFilter::JoinFilterGraph(IFilterGraph* graph, LPCWSTR name) {
    CritSecLock g(stateLock_);
    graph_ = graph;
    name_[0] = L'\0';
    if (name) {
        wcsncpy(name_, name, MAX_FILTER_NAME - 1);
        name_[MAX_FILTER_NAME - 1] = L'\0';
    }
    return S_OK;
}

STDMETHODIMP TransformFilter::QueryVendorInfo(LPWSTR*) { return E_NOTIMPL; }

HRESULT TransformFilter::EndOfStream() { return output_ ? output_->DeliverEndOfStream() : S_OK; }
HRESULT TransformFilter::BeginFlush() { return output_ ? output_->DeliverBeginFlush() : S_OK; }
HRESULT TransformFilter::EndFlush() { return output_ ? output_->DeliverEndFlush() : S_OK; }
HRESULT TransformFilter::NewSegment(REFERENCE_TIME start, REFERENCE_TIME stop, double rate) {
    return output_ ? output_->DeliverNewSegment(start, stop, rate) : S_OK;
}

STDMETHODIMP TransformFilter::Register() {
    ComRef<IFilterMapper> mapper;
    HRESULT hr = CoCreateInstance(CLSID_FilterMapper, nullptr, CLSCTX_INPROC_SERVER, IID_IFilterMapper,
                                  reinterpret_cast<void**>(mapper.put()));
    if (FAILED(hr)) return hr;
    mapper->UnregisterFilter(clsid_);
    hr = mapper->RegisterFilter(clsid_, FilterName(), FilterMerit());
    if (FAILED(hr)) return hr;
    // Two pins, each taking any audio subtype.
    struct PinRecord {
        const wchar_t* name;
        BOOL output;
        const wchar_t* connectsTo;
    } pins[2] = {{L"Input", FALSE, L"Output"}, {L"Output", TRUE, L"Input"}};
    for (const PinRecord& p : pins) {
        hr = mapper->RegisterPin(clsid_, const_cast<LPWSTR>(p.name), FALSE, p.output, FALSE, FALSE, CLSID_NULL,
                                 const_cast<LPWSTR>(p.connectsTo));
        if (SUCCEEDED(hr)) hr = mapper->RegisterPinType(clsid_, const_cast<LPWSTR>(p.name), MEDIATYPE_Audio, GUID_NULL);
        if (FAILED(hr)) {
            mapper->UnregisterFilter(clsid_);
            return hr;
        }
    }
    return S_OK;
}

STDMETHODIMP TransformFilter::Unregister() {
    ComRef<IFilterMapper> mapper;
    HRESULT hr = CoCreateInstance(CLSID_FilterMapper, nullptr, CLSCTX_INPROC_SERVER, IID_IFilterMapper,
                                  reinterpret_cast<void**>(mapper.put()));
    if (FAILED(hr)) return hr;
    hr = mapper->UnregisterFilter(clsid_);
    // A filter that was never registered is not an error here.
    return (hr == HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) || hr == VFW_E_NOT_FOUND) ? S_OK : hr;
}

}  // namespace dshow
}  // namespace ulvetta
