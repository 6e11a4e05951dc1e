#include "editor/DibSurface.h"

#include <new>

#include "editor/OctreeQuantiser.h"

namespace ulvetta {

bool DibSurface::create(int x, int y, int width, int height, int bits) {
  release();
  if (bits != 32 || width <= 0 || height <= 0 || width > kMaxSide || height > kMaxSide) return false;
  try {
    pixels_.assign(static_cast<size_t>(width) * height * 4, 0);
  } catch (const std::bad_alloc&) {
    release();
    return false;
  }
  x_ = x;
  y_ = y;
  width_ = width;
  height_ = height;
  header_ = DibHeader{};
  header_.width = width;
  header_.height = -height;
  header_.sizeImage = static_cast<uint32_t>(stride()) * static_cast<uint32_t>(height);
  return true;
}

void DibSurface::release() {
  std::vector<uint8_t>().swap(pixels_);
  palette_.clear();
  x_ = y_ = width_ = height_ = 0;
  header_ = DibHeader{};
}

const std::vector<SkinColour>& DibSurface::displayPalette() {
  if (palette_.empty() && !empty()) {
    OctreeQuantiser quantiser;
    quantiser.addSurface(*this);
    palette_ = quantiser.palette();
  }
  return palette_;
}

}  // namespace ulvetta
