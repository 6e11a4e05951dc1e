#include "resources/BitmapResources.h"

// Built from the resource script: {id, size in bytes, offset from the table's start} per bitmap, ended by a
// zero id; the bytes follow in the same read-only section.
extern "C" const int32_t ulvetta_bitmap_table[];

namespace ulvetta {

const uint8_t* BitmapResource(int id, size_t* size) {
    if (size) *size = 0;
    if (id <= 0) return nullptr;
    for (const int32_t* entry = ulvetta_bitmap_table; entry[0] != 0; entry += 3) {
        if (entry[0] != id) continue;
        if (size) *size = static_cast<size_t>(entry[1]);
        return reinterpret_cast<const uint8_t*>(ulvetta_bitmap_table) + entry[2];
    }
    return nullptr;
}

}  // namespace ulvetta
