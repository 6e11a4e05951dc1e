// TransformPin: what both pins of the transform filter share: the connection, its media type, the pin
// queries and media-type enumeration. A pin's reference count is its filter's.
#pragma once

#include <windows.h>
#include <dshow.h>

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

}  // namespace dshow
}  // namespace ulvetta
