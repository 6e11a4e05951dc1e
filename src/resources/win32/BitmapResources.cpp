#include "resources/BitmapResources.h"

#include <windows.h>

namespace ulvetta {

// Looks in the module that holds this code (Ulvetta.ax, or a test executable that links the same resource
// object), not in the host's executable.
const uint8_t* BitmapResource(int id, size_t* size) {
    if (size) *size = 0;
    if (id <= 0 || id > 0xFFFF) return nullptr;
    HMODULE module = nullptr;
    const auto self = reinterpret_cast<LPCWSTR>(reinterpret_cast<uintptr_t>(&BitmapResource));
    if (!GetModuleHandleExW(GET_MODULE_HANDLE_EX_FLAG_FROM_ADDRESS | GET_MODULE_HANDLE_EX_FLAG_UNCHANGED_REFCOUNT,
                            self, &module))
        return nullptr;
    HRSRC info = FindResourceW(module, MAKEINTRESOURCEW(id), MAKEINTRESOURCEW(2) /* RT_BITMAP */);
    if (!info) return nullptr;
    HGLOBAL handle = LoadResource(module, info);
    const void* bytes = handle ? LockResource(handle) : nullptr;
    if (!bytes) return nullptr;
    if (size) *size = SizeofResource(module, info);
    return static_cast<const uint8_t*>(bytes);
}

}  // namespace ulvetta
