#include "filter/dshow/Registration.h"

#include <dshow.h>

#include <cwchar>

#include "editor/win32/EditorPropertyPage.h"
#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/Interfaces.h"
#include "filter/dshow/ReverbFilter.h"

namespace ulvetta {
namespace dshow {

namespace {

const ClassEntry kClasses[] = {
    {L"Morvane Ulvetta", &CLSID_UlvettaFilter, &ReverbFilter::CreateInstance},
    {L"Morvane Ulvetta Property Page", &CLSID_UlvettaPropertyPage, &EditorPropertyPage::CreateInstance},
};
constexpr int kClassCount = sizeof kClasses / sizeof kClasses[0];

void GuidText(const CLSID& clsid, wchar_t* out, int capacity) { StringFromGUID2(clsid, out, capacity); }

LONG SetStringValue(HKEY key, const wchar_t* name, const wchar_t* value) {
    return RegSetValueExW(key, name, 0, REG_SZ, reinterpret_cast<const BYTE*>(value),
                          static_cast<DWORD>((wcslen(value) + 1) * sizeof(wchar_t)));
}

HRESULT WriteServerKeys(const ClassEntry& e, const wchar_t* modulePath) {
    wchar_t guid[64], path[128];
    GuidText(*e.clsid, guid, 64);
    swprintf(path, 128, L"CLSID\\%ls", guid);
    HKEY clsidKey = nullptr, serverKey = nullptr;
    LONG r = RegCreateKeyExW(HKEY_CLASSES_ROOT, path, 0, nullptr, 0, KEY_WRITE, nullptr, &clsidKey, nullptr);
    if (r != ERROR_SUCCESS) return HRESULT_FROM_WIN32(r);
    r = SetStringValue(clsidKey, nullptr, e.name);
    if (r == ERROR_SUCCESS)
        r = RegCreateKeyExW(clsidKey, L"InprocServer32", 0, nullptr, 0, KEY_WRITE, nullptr, &serverKey, nullptr);
    if (r == ERROR_SUCCESS) {
        r = SetStringValue(serverKey, nullptr, modulePath);
        if (r == ERROR_SUCCESS) r = SetStringValue(serverKey, L"ThreadingModel", L"Both");
        RegCloseKey(serverKey);
    }
    RegCloseKey(clsidKey);
    return r == ERROR_SUCCESS ? S_OK : HRESULT_FROM_WIN32(r);
}

HRESULT RemoveServerKeys(const ClassEntry& e) {
    wchar_t guid[64], path[128];
    GuidText(*e.clsid, guid, 64);
    swprintf(path, 128, L"CLSID\\%ls", guid);
    // The whole class key: the server keys and anything registered below them.
    const LONG r = RegDeleteTreeW(HKEY_CLASSES_ROOT, path);
    return (r == ERROR_SUCCESS || r == ERROR_FILE_NOT_FOUND) ? S_OK : HRESULT_FROM_WIN32(r);
}

// The class's IAMovieSetup, created in process; classes without one count as done.
HRESULT WithSetup(const ClassEntry& e, bool registering) {
    HRESULT hr = S_OK;
    IUnknown* inner = e.create(nullptr, &hr);
    if (inner == nullptr) {
        // A class that cannot be created here has no filter-mapper record to write.
        return (hr == E_NOINTERFACE || hr == VFW_E_NEED_OWNER) ? S_OK : hr;
    }
    inner->AddRef();
    ComRef<IAMovieSetup> setup;
    hr = inner->QueryInterface(IID_IAMovieSetup, reinterpret_cast<void**>(setup.put()));
    inner->Release();
    if (hr == E_NOINTERFACE) return S_OK;
    if (FAILED(hr)) return hr;
    hr = setup->Unregister();
    if (registering && SUCCEEDED(hr)) hr = setup->Register();
    return hr;
}

// COM for the registration calls, when the caller has not started it on this thread.
class ComScope {
public:
    ComScope() : hr_(CoInitializeEx(nullptr, COINIT_APARTMENTTHREADED)) {}
    ~ComScope() {
        if (SUCCEEDED(hr_)) CoUninitialize();
    }

private:
    HRESULT hr_;
};


HRESULT CreateMapper(ComRef<IFilterMapper>& mapper) {
    return CoCreateInstance(CLSID_FilterMapper, nullptr, CLSCTX_INPROC_SERVER, IID_IFilterMapper,
                            reinterpret_cast<void**>(mapper.put()));
}

}  // namespace

const ClassEntry* FindClass(REFCLSID clsid) {
    for (const ClassEntry& e : kClasses)
        if (*e.clsid == clsid) return &e;
    return nullptr;
}

HRESULT ModulePath(HMODULE module, wchar_t* buffer, DWORD capacity) {
    const DWORD n = GetModuleFileNameW(module, buffer, capacity);
    if (n == 0) {
        const DWORD error = GetLastError();
        return error ? HRESULT_FROM_WIN32(error) : E_FAIL;
    }
    // A path that fills the buffer was cut short (older systems report no error for it).
    if (n >= capacity) return HRESULT_FROM_WIN32(ERROR_INSUFFICIENT_BUFFER);
    return S_OK;
}

HRESULT RegisterServer(HMODULE module) {
    wchar_t path[MAX_PATH];
    HRESULT hr = ModulePath(module, path, MAX_PATH);
    if (FAILED(hr)) return hr;
    ComScope com;
    for (const ClassEntry& e : kClasses) {
        hr = WriteServerKeys(e, path);
        if (SUCCEEDED(hr)) hr = WithSetup(e, true);
        if (FAILED(hr)) return hr;
    }
    return S_OK;
}

HRESULT UnregisterServer() {
    ComScope com;
    for (int i = kClassCount - 1; i >= 0; --i) {
        HRESULT hr = WithSetup(kClasses[i], false);
        if (SUCCEEDED(hr)) hr = RemoveServerKeys(kClasses[i]);
        if (FAILED(hr)) return hr;
    }
    return S_OK;
}

HRESULT RegisterFilterRecord(REFCLSID clsid, const wchar_t* name, DWORD merit) {
    ComRef<IFilterMapper> mapper;
    HRESULT hr = CreateMapper(mapper);
    if (FAILED(hr)) return hr;
    mapper->UnregisterFilter(clsid);
    hr = mapper->RegisterFilter(clsid, name, merit);
    if (FAILED(hr)) return hr;
    struct PinRecord {
        const wchar_t* name;
        BOOL output;
        const wchar_t* connectsTo;
    } pins[2] = {{L"Input", FALSE, L"Output"}, {L"Output", TRUE, L"Input"}};
    for (const PinRecord& p : pins) {
        hr = mapper->RegisterPin(clsid, const_cast<LPWSTR>(p.name), FALSE, p.output, FALSE, FALSE, CLSID_NULL,
                                 const_cast<LPWSTR>(p.connectsTo));
        if (SUCCEEDED(hr)) hr = mapper->RegisterPinType(clsid, const_cast<LPWSTR>(p.name), MEDIATYPE_Audio, GUID_NULL);
        if (FAILED(hr)) {
            mapper->UnregisterFilter(clsid);
            return hr;
        }
    }
    return S_OK;
}

HRESULT UnregisterFilterRecord(REFCLSID clsid) {
    ComRef<IFilterMapper> mapper;
    HRESULT hr = CreateMapper(mapper);
    if (FAILED(hr)) return hr;
    hr = mapper->UnregisterFilter(clsid);
    // A filter that was never registered is not an error here.
    return (hr == HRESULT_FROM_WIN32(ERROR_FILE_NOT_FOUND) || hr == VFW_E_NOT_FOUND) ? S_OK : hr;
}

}  // namespace dshow
}  // namespace ulvetta
