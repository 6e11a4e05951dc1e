// Runs the bitmap file loader on arbitrary bytes, asking for the size the header claims so that the checks
// past the size comparison are reached, then draws whatever loaded into a small surface.
#include <cstddef>
#include <cstdint>
#include <cstdlib>

#include "editor/SkinBitmap.h"
#include "resources/BitmapResources.h"

// The target reads files only: it builds the editor's sources without the module's embedded bitmaps, so the
// default resource lookup finds nothing.
const uint8_t* ulvetta::BitmapResource(int, size_t* size) {
  if (size != nullptr) *size = 0;
  return nullptr;
}

namespace {

// The little-endian field of 2 or 4 bytes at `at`, 0 past the end.
int64_t field(const uint8_t* data, size_t size, size_t at, int bytes) {
  if (size < at + bytes) return 0;
  uint32_t v = 0;
  for (int i = bytes - 1; i >= 0; --i) v = (v << 8) | data[at + i];
  return bytes == 2 ? static_cast<int64_t>(v) : static_cast<int64_t>(static_cast<int32_t>(v));
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  using namespace ulvetta;
  const bool core = field(data, size, 14, 4) == 12;
  const int64_t width = core ? field(data, size, 18, 2) : field(data, size, 18, 4);
  const int64_t height = core ? field(data, size, 20, 2) : field(data, size, 22, 4);
  const int64_t rows = height < 0 ? -height : height;
  SkinBitmap bitmap(nullptr);
  if (!bitmap.loadFileBytes(data, size, static_cast<int>(width), static_cast<int>(rows & 0x7fffffff))) {
    if (!bitmap.empty() || bitmap.pixels()) std::abort();
    return 0;
  }
  if (bitmap.width() != width || bitmap.height() > SkinBitmap::kMaxSide) std::abort();
  DibSurface surface;
  surface.create(0, 0, 16, 16);
  bitmap.copy(&surface, -3, -2, bitmap.width(), bitmap.height(), 0, 0);
  bitmap.tintedCopyAlpha(&surface, 5, 5, 40, 40, 1, 1, SkinColour{1, 2, 3, 255}, 200);
  bitmap.maskedCopy(&surface, 0, 0, 16, 16, 0, 0, &bitmap);
  bitmap.opaqueBounds();
  return 0;
}
