#include "filter/dshow/TransformFilter.h"

#include <cstring>
#include <cwchar>

#include "filter/dshow/Registration.h"

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

}  // namespace

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
        // Both pins or neither, so that a failed creation is tried again by the next call.
        std::unique_ptr<TransformInputPin> in(new (std::nothrow) TransformInputPin(this));
        std::unique_ptr<TransformOutputPin> out(new (std::nothrow) TransformOutputPin(this));
        if (in && out) {
            input_ = std::move(in);
            output_ = std::move(out);
        }
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
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(stateLock_);
        if (state_ == State_Stopped) return S_OK;
        if (GetPin(0) == nullptr) return E_OUTOFMEMORY;
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
    });
}

HRESULT TransformFilter::PauseLocked(ComRef<IPin>& endOfStreamTo) {
    if (GetPin(0) == nullptr) return E_OUTOFMEMORY;
    if (state_ == State_Paused) return S_OK;
    if (!input_->IsConnected()) {
        // With nothing to read, downstream gets its end of stream at once (by the caller, unlocked).
        if (output_->IsConnected() && !eosDelivered_) {
            endOfStreamTo.reset(output_->Connected());
            eosDelivered_ = true;
        }
        state_ = State_Paused;
        return S_OK;
    }
    HRESULT hr = S_OK;
    if (output_->IsConnected() && state_ == State_Stopped) {
        CritSecLock r(receiveLock_);
        hr = StartStreaming();
        if (SUCCEEDED(hr)) hr = output_->Active();
        if (SUCCEEDED(hr)) input_->Active();
    }
    if (SUCCEEDED(hr)) state_ = State_Paused;
    return hr;
}

STDMETHODIMP TransformFilter::Pause() {
    return ComBoundary([&] {
        ComRef<IPin> endOfStreamTo;
        HRESULT hr;
        {
            CritSecLock g(stateLock_);
            hr = PauseLocked(endOfStreamTo);
        }
        if (endOfStreamTo) endOfStreamTo->EndOfStream();
        return hr;
    });
}

STDMETHODIMP TransformFilter::Run(REFERENCE_TIME) {
    return ComBoundary([&] {
        ComRef<IPin> endOfStreamTo;
        HRESULT hr = S_OK;
        {
            CritSecLock g(stateLock_);
            if (state_ == State_Stopped) hr = PauseLocked(endOfStreamTo);
            if (SUCCEEDED(hr)) state_ = State_Running;
        }
        if (endOfStreamTo) endOfStreamTo->EndOfStream();
        return hr;
    });
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
    return ComBoundary([&]() -> HRESULT {
        if (e == nullptr) return E_POINTER;
        *e = new (std::nothrow) PinEnumerator(this, 0);
        if (*e == nullptr) return E_OUTOFMEMORY;
        (*e)->AddRef();
        return S_OK;
    });
}

STDMETHODIMP TransformFilter::FindPin(LPCWSTR id, IPin** pin) {
    return ComBoundary([&]() -> HRESULT {
        if (id == nullptr || pin == nullptr) return E_POINTER;
        *pin = nullptr;
        if (GetPin(0) == nullptr) return E_OUTOFMEMORY;
        if (wcscmp(id, L"In") == 0)
            *pin = input_.get();
        else if (wcscmp(id, L"Out") == 0)
            *pin = output_.get();
        if (*pin == nullptr) return VFW_E_NOT_FOUND;
        (*pin)->AddRef();
        return S_OK;
    });
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
    return ComBoundary([&] { return RegisterFilterRecord(clsid_, FilterName(), FilterMerit()); });
}

STDMETHODIMP TransformFilter::Unregister() {
    return ComBoundary([&] { return UnregisterFilterRecord(clsid_); });
}

}  // namespace dshow
}  // namespace ulvetta
