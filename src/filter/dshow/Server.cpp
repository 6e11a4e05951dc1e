// The in-process COM server: DLL entry point, class factory, object and lock counting and the four
// exports. What is registered, and how, lives in Registration.cpp beside the class table.
//
// Threads: the exports may be called on any thread; the factory keeps no state but its entry, and the
// counts are atomic. Every export and factory method runs its body through ComBoundary.
#include <windows.h>
#include <dshow.h>

#include <new>

#include "editor/win32/EditorLock.h"
#include "filter/dshow/DShowUtil.h"
#include "filter/dshow/Registration.h"

namespace ulvetta {
namespace dshow {

namespace {

HMODULE g_module = nullptr;
std::atomic<long> g_lockCount{0};

class ClassFactory : public SingleInterfaceObject<IClassFactory> {
public:
    explicit ClassFactory(const ClassEntry& e) : entry_(e) {}
    STDMETHODIMP CreateInstance(IUnknown* outer, REFIID riid, void** ppv) override {
        if (ppv == nullptr) return E_POINTER;
        *ppv = nullptr;
        // An aggregating outer object may only ask for the inner IUnknown.
        if (outer != nullptr && riid != IID_IUnknown) return E_NOINTERFACE;
        return ComBoundary([&] {
            HRESULT hr = S_OK;
            IUnknown* inner = entry_.create(outer, &hr);
            if (inner == nullptr) return FAILED(hr) ? hr : E_OUTOFMEMORY;
            inner->AddRef();
            hr = inner->QueryInterface(riid, ppv);
            inner->Release();
            return hr;
        });
    }
    STDMETHODIMP LockServer(BOOL lock) override {
        if (lock) {
            ++g_lockCount;
        } else {
            // An unbalanced unlock must not let the count go negative and the module unload while in use.
            long n = g_lockCount.load();
            while (n > 0 && !g_lockCount.compare_exchange_weak(n, n - 1)) {
            }
        }
        return S_OK;
    }

private:
    const ClassEntry& entry_;
};

}  // namespace

}  // namespace dshow
}  // namespace ulvetta

using namespace ulvetta::dshow;

extern "C" {

BOOL WINAPI DllMain(HINSTANCE instance, DWORD reason, LPVOID) {
    if (reason == DLL_PROCESS_ATTACH) {
        g_module = instance;
        // The editor's process-wide lock (its keyboard hook and mouse handling take it).
        if (!ulvetta::createEditorLock()) return FALSE;
        DisableThreadLibraryCalls(instance);
    } else if (reason == DLL_PROCESS_DETACH) {
        ulvetta::deleteEditorLock();
    }
    return TRUE;
}

STDAPI DllGetClassObject(REFCLSID clsid, REFIID riid, void** ppv) {
    if (ppv == nullptr) return E_POINTER;
    *ppv = nullptr;
    const ClassEntry* e = FindClass(clsid);
    if (e == nullptr) return CLASS_E_CLASSNOTAVAILABLE;
    return ComBoundary([&] {
        auto* factory = new ClassFactory(*e);
        factory->AddRef();
        HRESULT hr = factory->QueryInterface(riid, ppv);
        factory->Release();
        return hr;
    });
}

STDAPI DllCanUnloadNow() { return (g_objectCount == 0 && g_lockCount == 0) ? S_OK : S_FALSE; }

STDAPI DllRegisterServer() {
    return ComBoundary([] { return RegisterServer(g_module); });
}

STDAPI DllUnregisterServer() {
    return ComBoundary([] { return UnregisterServer(); });
}

}  // extern "C"
