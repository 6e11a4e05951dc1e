// The module's own COM interfaces and the identifiers of the classes it serves.
#pragma once

#include <windows.h>
#include <dshow.h>
#include <medparam.h>

namespace ulvetta {
class ReverbCore;
}

// {3818a521-3f15-11d5-9eda-0010b5071e57}
static const CLSID CLSID_UlvettaFilter = {0x3818a521, 0x3f15, 0x11d5, {0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57}};
// {3818a522-3f15-11d5-9eda-0010b5071e57}
static const CLSID CLSID_UlvettaPropertyPage = {0x3818a522, 0x3f15, 0x11d5,
                                                {0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57}};
// {93ad712b-daa0-4ffe-bc81-b0ce500fcdd9}: reference time, the only time format of the automation interfaces.
static const GUID GUID_UlvettaTimeReference = {0x93ad712b, 0xdaa0, 0x4ffe,
                                               {0xbc, 0x81, 0xb0, 0xce, 0x50, 0x0f, 0xcd, 0xd9}};
constexpr DWORD kAllParams = 0xFFFFFFFF;

// The editor's private line to the filter: option byte, formats, notification windows, the state stream
// and the core itself. GetPersistStream and GetCore are plain calls in the table, not COM methods.
MIDL_INTERFACE("3818a524-3f15-11d5-9eda-0010b5071e57")
IReverbControl : public IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetOption(BYTE * out) = 0;
    virtual HRESULT STDMETHODCALLTYPE SetOption(const BYTE* in) = 0;
    // direction 0 input, 1 output; copies the 18-byte format.
    virtual HRESULT STDMETHODCALLTYPE GetFormat(WAVEFORMATEX * out, int direction) = 0;
    // Id 0 unregisters the window.
    virtual HRESULT STDMETHODCALLTYPE RegisterWindow(HWND window, WORD commandId) = 0;
    virtual IPersistStream* STDMETHODCALLTYPE GetPersistStream() = 0;
    virtual ulvetta::ReverbCore* STDMETHODCALLTYPE GetCore() = 0;
};
__CRT_UUID_DECL(IReverbControl, 0x3818a524, 0x3f15, 0x11d5, 0x9e, 0xda, 0x00, 0x10, 0xb5, 0x07, 0x1e, 0x57)

// Host presets: one entry, "(Default)".
MIDL_INTERFACE("36a22460-0cc9-11d0-8574-00a0c9053912")
IHostPresets : public IUnknown {
    virtual HRESULT STDMETHODCALLTYPE GetPresetCount(DWORD * count) = 0;
    virtual HRESULT STDMETHODCALLTYPE GetPresetName(DWORD index, WCHAR * buffer, int length) = 0;
    virtual HRESULT STDMETHODCALLTYPE SetPreset(DWORD index) = 0;
};
__CRT_UUID_DECL(IHostPresets, 0x36a22460, 0x0cc9, 0x11d0, 0x85, 0x74, 0x00, 0xa0, 0xc9, 0x05, 0x39, 0x12)

// The host's recorder of parameter changes (we only call it).
struct ICaptureCallback : public IUnknown {
    virtual HRESULT STDMETHODCALLTYPE BeginCapture(DWORD* indices, DWORD count) = 0;
    virtual HRESULT STDMETHODCALLTYPE Changed(DWORD* indices, DWORD count, MP_DATA* values) = 0;
    virtual HRESULT STDMETHODCALLTYPE EndCapture(DWORD* indices, DWORD count) = 0;
};

MIDL_INTERFACE("f5011136-c416-48b9-8c35-e7c5f9aa6fdf")
ICaptureCallbackSetter : public IUnknown {
    virtual HRESULT STDMETHODCALLTYPE SetCaptureCallback(ICaptureCallback * callback) = 0;
};
__CRT_UUID_DECL(ICaptureCallbackSetter, 0xf5011136, 0xc416, 0x48b9, 0x8c, 0x35, 0xe7, 0xc5, 0xf9, 0xaa, 0x6f, 0xdf)
