// The module's registration: the class table, the server keys under HKEY_CLASSES_ROOT and the filter's
// record with the filter mapper. Called from the registration exports on the caller's thread.
#pragma once

#include <windows.h>

namespace ulvetta {
namespace dshow {

using CreateFunction = IUnknown* (*)(IUnknown* outer, HRESULT* hr);

// One class the module serves.
struct ClassEntry {
    const wchar_t* name;
    const CLSID* clsid;
    CreateFunction create;
};

// The entry of a CLSID, or null.
const ClassEntry* FindClass(REFCLSID clsid);

// The module's file path into buffer (capacity characters); an error when it does not fit whole.
HRESULT ModulePath(HMODULE module, wchar_t* buffer, DWORD capacity);

// Writes every class's server keys and filter-mapper record, unregistering each first.
HRESULT RegisterServer(HMODULE module);
// Removes them, in reverse table order.
HRESULT UnregisterServer();

// The filter-mapper record of a filter: two pins, "Input" and "Output", each taking any audio subtype.
HRESULT RegisterFilterRecord(REFCLSID clsid, const wchar_t* name, DWORD merit);
HRESULT UnregisterFilterRecord(REFCLSID clsid);

}  // namespace dshow
}  // namespace ulvetta
