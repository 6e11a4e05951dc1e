// The in-process COM server: class table, class factory, object and lock counting, the four exports and
// registration (server keys under HKEY_CLASSES_ROOT and the filter-mapper record).
#include <windows.h>
#include <dshow.h>
#include <olectl.h>

#include <cwchar>
#include <new>

#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/Interfaces.h"
#include "filter/dshow/ReverbFilter.h"

namespace ulvetta {
namespace dshow {

namespace {

// The editor's process-wide lock (its keyboard hook and mouse handling take it).
CRITICAL_SECTION* g_editorLock = nullptr;

using CreateFunction = IUnknown* (*)(IUnknown* outer, HRESULT* hr);

IUnknown* CreatePropertyPage(IUnknown*, HRESULT* hr) {
    // The property page arrives with the editor.
    *hr = CLASS_E_CLASSNOTAVAILABLE;
    return nullptr;
}

struct ClassEntry {
    const wchar_t* name;
    const CLSID* clsid;
    CreateFunction create;
};

const ClassEntry kClasses[] = {
    {L"Morvane Ulvetta", &CLSID_UlvettaFilter, &ReverbFilter::CreateInstance},
    {L"Morvane Ulvetta Property Page", &CLSID_UlvettaPropertyPage, &CreatePropertyPage},
};

class ClassFactory : public SingleInterfaceObject<IClassFactory> {
public:
    explicit ClassFactory(const ClassEntry& e) : entry_(e) {}
    STDMETHODIMP CreateInstance(IUnknown* outer, REFIID riid, void** ppv) override {
        if (ppv == nullptr) return E_POINTER;
        *ppv = nullptr;
        // An aggregating outer object may only ask for the inner IUnknown.
        if (outer != nullptr && riid != IID_IUnknown) return E_NOINTERFACE;
        HRESULT hr = S_OK;
        IUnknown* inner = entry_.create(outer, &hr);
        if (inner == nullptr) return FAILED(hr) ? hr : E_OUTOFMEMORY;
        inner->AddRef();
        hr = inner->QueryInterface(riid, ppv);
        inner->Release();
        return hr;
    }
    STDMETHODIMP LockServer(BOOL lock) override {
        if (lock)
            ++g_lockCount;
        else
            --g_lockCount;
        return S_OK;
    }

private:
    const ClassEntry& entry_;
};

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
        return (hr == E_NOINTERFACE || hr == VFW_E_NEED_OWNER || hr == CLASS_E_CLASSNOTAVAILABLE) ? S_OK : hr;
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

}  // namespace

}  // namespace dshow
}  // namespace ulvetta

using namespace ulvetta::dshow;

extern "C" {

BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID) {
    if (reason == DLL_PROCESS_ATTACH) {
        g_module = instance;
        g_editorLock = new (std::nothrow) CRITICAL_SECTION;
        if (g_editorLock == nullptr) return FALSE;
        InitializeCriticalSection(g_editorLock);
        DisableThreadLibraryCalls(instance);
    } else if (reason == DLL_PROCESS_DETACH) {
        if (g_editorLock) {
            DeleteCriticalSection(g_editorLock);
            delete g_editorLock;
            g_editorLock = nullptr;
        }
    }
    return TRUE;
}

STDAPI DllGetClassObject(REFCLSID clsid, REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    *ppv = nullptr;
    for (const ClassEntry& e : kClasses) {
        if (*e.clsid != clsid) continue;
        auto* factory = new (std::nothrow) ClassFactory(e);
        if (factory == nullptr) return E_OUTOFMEMORY;
        factory->AddRef();
        HRESULT hr = factory->QueryInterface(riid, ppv);
        factory->Release();
        return hr;
    }
    return CLASS_E_CLASSNOTAVAILABLE;
}

STDAPI DllCanUnloadNow() { return (g_objectCount == 0 && g_lockCount == 0) ? S_OK : S_FALSE; }

STDAPI DllRegisterServer() {
    wchar_t path[MAX_PATH];
    const DWORD n = GetModuleFileNameW(g_module, path, MAX_PATH);
    if (n == 0 || n >= MAX_PATH) return HRESULT_FROM_WIN32(GetLastError());
    ComScope com;
    for (const ClassEntry& e : kClasses) {
        HRESULT hr = WriteServerKeys(e, path);
        if (SUCCEEDED(hr)) hr = WithSetup(e, true);
        if (FAILED(hr)) return hr;
    }
    return S_OK;
}

STDAPI DllUnregisterServer() {
    ComScope com;
    for (int i = static_cast<int>(sizeof kClasses / sizeof kClasses[0]) - 1; i >= 0; --i) {
        HRESULT hr = WithSetup(kClasses[i], false);
        if (SUCCEEDED(hr)) hr = RemoveServerKeys(kClasses[i]);
        if (FAILED(hr)) return hr;
    }
    return S_OK;
}

}  // extern "C"
