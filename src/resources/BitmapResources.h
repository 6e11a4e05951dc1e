// The editor's pictures as the module's bitmap resources: the same bytes on every platform, embedded at
// build time on Linux and compiled into the module's resource section on Windows.
#pragma once

#include <cstddef>
#include <cstdint>

namespace ulvetta {

// The bytes of bitmap resource id as an RT_BITMAP resource holds them: a BITMAPINFOHEADER or
// BITMAPCOREHEADER, its palette and the rows, without a file header; null (and *size 0) when there is none.
// The bytes live as long as the module; any thread may call this.
const uint8_t* BitmapResource(int id, size_t* size);

}  // namespace ulvetta
