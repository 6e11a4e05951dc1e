#include "platform/ModulePath.h"

#include <windows.h>

namespace ulvetta {

std::string modulePath() {
    // The module that holds this function: the filter DLL when linked into it, else the executable.
    HMODULE module = nullptr;
    if (!GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                            reinterpret_cast<LPCWSTR>(&modulePath), &module))
        return {};
    wchar_t wide[MAX_PATH * 4];
    const DWORD n = GetModuleFileNameW(module, wide, sizeof wide / sizeof wide[0]);
    if (n == 0 || n >= sizeof wide / sizeof wide[0]) return {};
    const int bytes = WideCharToMultiByte(CP_UTF8, 0, wide, static_cast<int>(n), nullptr, 0, nullptr, nullptr);
    std::string path(bytes, '\0');
    WideCharToMultiByte(CP_UTF8, 0, wide, static_cast<int>(n), &path[0], bytes, nullptr, nullptr);
    return path;
}

}  // namespace ulvetta
