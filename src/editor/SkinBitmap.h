#pragma once
// A picture of the editor's skin (8-bit with a palette or 24-bit), loaded from the module's resources or from a
// user's file, and the operations that draw it into the back buffer.
#include <array>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "editor/DibSurface.h"
#include "editor/SkinColour.h"

namespace ulvetta {

// Finds the bytes of a bitmap resource as an RT_BITMAP resource holds them (header, palette, rows; no file
// header); null and *size 0 when there is none.
using ResourceLookup = const uint8_t* (*)(int id, size_t* size);

// The lookup that new bitmaps use; null until the host installs the module's resource table.
ResourceLookup defaultResourceLookup();
void setDefaultResourceLookup(ResourceLookup lookup);

class SkinBitmap {
 public:
  static constexpr int kMaxSide = 16384;  // pixels, the largest width or height accepted

  explicit SkinBitmap(ResourceLookup lookup = defaultResourceLookup()) : lookup_(lookup) {}
  virtual ~SkinBitmap() = default;

  // Draw the source rectangle (sx, sy, w, h) at (dx, dy). Every draw is clipped to the surface and to the
  // bitmap; an empty bitmap or surface draws nothing.
  virtual void copy(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy) const;
  // The grey level g of each pixel weights the tint colour over the destination.
  virtual void tintedCopy(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                          SkinColour colour) const;
  // As tintedCopy with the weight scaled by alpha (0..255).
  virtual void tintedCopyAlpha(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                               SkinColour colour, int alpha) const;
  // As copy with each pixel weighted by the mask's grey level at the same position (255 opaque).
  virtual void maskedCopy(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                          const SkinBitmap* mask) const;

  virtual EditorRect rect() const { return {0, 0, width_, height_}; }
  // Rows top to bottom, stride() bytes each; null when empty.
  virtual const uint8_t* pixels() const { return rows_.empty() ? nullptr : rows_.data(); }
  virtual void size(int* width, int* height) const;
  // The colour at (x, y) with A = 255; false outside the bitmap.
  virtual bool pixelColour(int x, int y, SkinColour* out) const;
  // The smallest rectangle holding every pixel that is not black; empty when there is none.
  virtual EditorRect opaqueBounds() const;
  // Loads a BMP file whose width is requiredWidth and whose height (either row order) is requiredHeight.
  virtual bool loadFile(const std::string& path, int requiredWidth, int requiredHeight);
  virtual bool loadResource(int id);
  virtual void release();

  // The parsers behind the two loads: a whole file (starting "BM") and a resource's bytes.
  bool loadFileBytes(const uint8_t* data, size_t size, int requiredWidth, int requiredHeight);
  bool loadDib(const uint8_t* data, size_t size);

  bool empty() const { return rows_.empty(); }
  int width() const { return width_; }
  int height() const { return height_; }
  int bitsPerPixel() const { return bits_; }
  int stride() const { return stride_; }
  // Grey level of (x, y): the first palette byte for 8-bit bitmaps, the middle byte for 24-bit ones.
  uint8_t grey(int x, int y) const { return bits_ == 8 ? greyAt<true>(x, y) : greyAt<false>(x, y); }

 private:
  // Parses a header, palette and rows; pixelOffset is where the rows start in data, or 0 when they follow
  // the palette directly.
  bool parse(const uint8_t* data, size_t size, size_t pixelOffset);
  const uint8_t* pixel(int x, int y) const {
    return rows_.data() + static_cast<size_t>(y) * stride_ + static_cast<size_t>(x) * (bits_ / 8);
  }

  // B, G, R of (x, y) and its grey level, for a bitmap known to be 8-bit (Eight) or 24-bit.
  template <bool Eight>
  const uint8_t* colourAt(int x, int y) const {
    const uint8_t* p = pixel(x, y);
    return Eight ? &palette_[p[0] * 4] : p;
  }
  template <bool Eight>
  uint8_t greyAt(int x, int y) const {
    return Eight ? palette_[pixel(x, y)[0] * 4] : pixel(x, y)[1];
  }

  ResourceLookup lookup_;
  int width_ = 0, height_ = 0, bits_ = 0, stride_ = 0;
  std::array<uint8_t, 256 * 4> palette_{};  // B, G, R, reserved
  std::vector<uint8_t> rows_;
};

}  // namespace ulvetta
