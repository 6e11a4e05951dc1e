#pragma once
// The editor's 32-bit back buffer: B, G, R, X pixels, rows top to bottom, zero-filled (black) when created.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "editor/SkinColour.h"

namespace ulvetta {

// The device-independent bitmap header that describes a surface to the window system (40 bytes).
struct DibHeader {
  uint32_t size = 40;
  int32_t width = 0;
  int32_t height = 0;  // minus the surface height: rows run top-down
  uint16_t planes = 1;
  uint16_t bitCount = 32;
  uint32_t compression = 0;
  uint32_t sizeImage = 0;  // bytes: stride x height
  int32_t xPelsPerMeter = 0;
  int32_t yPelsPerMeter = 0;
  uint32_t clrUsed = 0;
  uint32_t clrImportant = 0;
};

class DibSurface {
 public:
  static constexpr int kMaxSide = 16384;  // pixels

  // Sizes the buffer and clears it to black. Only 32 bits per pixel; a refused size or a failed allocation
  // leaves the surface empty and returns false.
  bool create(int x, int y, int width, int height, int bits = 32);
  void release();

  bool empty() const { return pixels_.empty(); }
  int x() const { return x_; }
  int y() const { return y_; }
  int width() const { return width_; }
  int height() const { return height_; }
  int stride() const { return width_ * 4; }  // bytes per row
  const DibHeader& header() const { return header_; }

  // The palette for 8-bit palette displays: at most 236 colours chosen from the contents at the first call,
  // then kept until the surface is released or created again.
  const std::vector<SkinColour>& displayPalette();

  uint8_t* pixels() { return pixels_.data(); }
  const uint8_t* pixels() const { return pixels_.data(); }
  // The first byte (blue) of pixel (px, py); the caller keeps inside the surface.
  uint8_t* at(int px, int py) { return pixels_.data() + (static_cast<size_t>(py) * width_ + px) * 4; }
  const uint8_t* at(int px, int py) const {
    return pixels_.data() + (static_cast<size_t>(py) * width_ + px) * 4;
  }

 private:
  int x_ = 0, y_ = 0, width_ = 0, height_ = 0;
  DibHeader header_;
  std::vector<uint8_t> pixels_;
  std::vector<SkinColour> palette_;
};

}  // namespace ulvetta
