#include "filter/dshow/TransformPin.h"

#include <cstring>
#include <cwchar>

#include "filter/dshow/TransformFilter.h"

namespace ulvetta {
namespace dshow {

namespace {

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
        return ComBoundary([&]() -> HRESULT {
            ULONG skipped = 0;
            AM_MEDIA_TYPE mt{};
            while (skipped < count && pin_->GetMediaType(static_cast<int>(pos_), &mt) == S_OK) {
                FreeMediaType(mt);
                ++pos_;
                ++skipped;
            }
            return skipped == count ? S_OK : S_FALSE;
        });
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

}  // namespace

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
    return ComBoundary([&]() -> HRESULT {
        CritSecLock g(filter_->StateLock());
        if (filter_->State() != State_Stopped) return VFW_E_NOT_STOPPED;
        if (!IsConnected()) return S_FALSE;
        filter_->BreakConnect(dir_);
        ClearConnection();
        return S_OK;
    });
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
    return ComBoundary([&]() -> HRESULT {
        if (mt == nullptr) return E_POINTER;
        return CheckMediaType(mt) == S_OK ? S_OK : S_FALSE;
    });
}

STDMETHODIMP TransformPin::EnumMediaTypes(IEnumMediaTypes** e) {
    if (e == nullptr) return E_POINTER;
    *e = new (std::nothrow) MediaTypeEnumerator(this, 0);
    if (*e == nullptr) return E_OUTOFMEMORY;
    (*e)->AddRef();
    return S_OK;
}

STDMETHODIMP TransformPin::QueryInternalConnections(IPin**, ULONG*) { return E_NOTIMPL; }

}  // namespace dshow
}  // namespace ulvetta
