#pragma once
// The module that holds this code (Ulvetta.ax, or a test executable linking the same objects): where the
// dialog templates and strings are looked up.
#include <windows.h>

namespace ulvetta {

inline HMODULE codeModule() {
  HMODULE module = nullptr;
  GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                     reinterpret_cast<LPCWSTR>(&codeModule), &module);
  return module;
}

}  // namespace ulvetta
