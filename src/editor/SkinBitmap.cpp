#include "editor/SkinBitmap.h"
#include "resources/BitmapResources.h"

#include <algorithm>
#include <cstring>
#include <fstream>
#include <new>
#include <type_traits>

namespace ulvetta {
namespace {

// The module's own bitmap resources, unless a host or a test installs another table.
ResourceLookup gResourceLookup = BitmapResource;

constexpr size_t kFileHeaderSize = 14;
constexpr size_t kRowsFollowPalette = ~size_t{0};

uint32_t read16(const uint8_t* p) { return p[0] | (p[1] << 8); }
uint32_t read32(const uint8_t* p) {
  return p[0] | (p[1] << 8) | (p[2] << 16) | (static_cast<uint32_t>(p[3]) << 24);
}

// Bytes per row of a width at a depth, padded to 4 bytes.
uint64_t paddedStride(uint64_t width, uint64_t bits) { return (width * bits + 31) / 32 * 4; }

// Limits a copy of the source rectangle (sx, sy, w, h) at (dx, dy) to a source of srcW x srcH and a
// destination of dstW x dstH. False when nothing is left.
struct Span {
  long long dx, dy, w, h, sx, sy;
};
bool clipSpan(Span& s, long long srcW, long long srcH, long long dstW, long long dstH) {
  if (s.sx < 0) { s.dx -= s.sx; s.w += s.sx; s.sx = 0; }
  if (s.sy < 0) { s.dy -= s.sy; s.h += s.sy; s.sy = 0; }
  if (s.dx < 0) { s.sx -= s.dx; s.w += s.dx; s.dx = 0; }
  if (s.dy < 0) { s.sy -= s.dy; s.h += s.dy; s.dy = 0; }
  s.w = std::min({s.w, srcW - s.sx, dstW - s.dx});
  s.h = std::min({s.h, srcH - s.sy, dstH - s.dy});
  return s.w > 0 && s.h > 0;
}

// Calls fn(destination pixel, source x, source y) for every pixel of a clipped copy. The mask, when given,
// must cover the source rectangle too.
template <typename Fn>
void forEachPixel(const SkinBitmap& bitmap, DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                  const SkinBitmap* mask, Fn fn) {
  if (!surface || surface->empty() || bitmap.empty()) return;
  long long srcW = bitmap.width(), srcH = bitmap.height();
  if (mask) {
    if (mask->empty()) return;
    srcW = std::min<long long>(srcW, mask->width());
    srcH = std::min<long long>(srcH, mask->height());
  }
  Span s{dx, dy, w, h, sx, sy};
  if (!clipSpan(s, srcW, srcH, surface->width(), surface->height())) return;
  for (long long j = 0; j < s.h; ++j) {
    uint8_t* out = surface->at(static_cast<int>(s.dx), static_cast<int>(s.dy + j));
    for (long long i = 0; i < s.w; ++i, out += 4) fn(out, static_cast<int>(s.sx + i), static_cast<int>(s.sy + j));
  }
}

// Calls body(std::true_type) for an 8-bit bitmap and body(std::false_type) for a 24-bit one, so that each
// pixel loop is compiled for one depth.
template <typename Body>
void byDepth(int bits, Body body) {
  if (bits == 8)
    body(std::true_type{});
  else
    body(std::false_type{});
}

// The blending rule of partial weights: weight w in 0..256 of colour c over destination d.
inline uint8_t blend(uint8_t d, uint8_t c, int w) { return static_cast<uint8_t>((d * (256 - w) + c * w) >> 8); }

}  // namespace

ResourceLookup defaultResourceLookup() { return gResourceLookup; }
void setDefaultResourceLookup(ResourceLookup lookup) { gResourceLookup = lookup; }

void SkinBitmap::size(int* width, int* height) const {
  if (width) *width = width_;
  if (height) *height = height_;
}

bool SkinBitmap::pixelColour(int x, int y, SkinColour* out) const {
  if (empty() || !out || x < 0 || y < 0 || x >= width_ || y >= height_) return false;
  const uint8_t* p = pixel(x, y);
  if (bits_ == 8) p = &palette_[p[0] * 4];
  *out = SkinColour{p[2], p[1], p[0], 255};
  return true;
}

EditorRect SkinBitmap::opaqueBounds() const {
  int left = width_, top = height_, right = -1, bottom = -1;
  SkinColour c;
  for (int y = 0; y < height_; ++y) {
    for (int x = 0; x < width_; ++x) {
      pixelColour(x, y, &c);
      if (c.r | c.g | c.b) {
        left = std::min(left, x);
        right = std::max(right, x);
        top = std::min(top, y);
        bottom = std::max(bottom, y);
      }
    }
  }
  if (right < 0) return {};
  return {left, top, right - left + 1, bottom - top + 1};
}

void SkinBitmap::copy(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy) const {
  byDepth(bits_, [&](auto eight) {
    forEachPixel(*this, surface, dx, dy, w, h, sx, sy, nullptr, [&](uint8_t* out, int x, int y) {
      const uint8_t* p = colourAt<eight>(x, y);
      out[0] = p[0];
      out[1] = p[1];
      out[2] = p[2];
    });
  });
}

void SkinBitmap::tintedCopy(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                            SkinColour colour) const {
  byDepth(bits_, [&](auto eight) {
    forEachPixel(*this, surface, dx, dy, w, h, sx, sy, nullptr, [&](uint8_t* out, int x, int y) {
      const int weight = greyAt<eight>(x, y) + 1;
      out[0] = blend(out[0], colour.b, weight);
      out[1] = blend(out[1], colour.g, weight);
      out[2] = blend(out[2], colour.r, weight);
    });
  });
}

void SkinBitmap::tintedCopyAlpha(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                                 SkinColour colour, int alpha) const {
  alpha = std::clamp(alpha, 0, 255);
  byDepth(bits_, [&](auto eight) {
    // 8-bit glyphs count grey g as g + 1 so that full coverage at full alpha reaches weight 256.
    constexpr int bias = decltype(eight)::value ? 1 : 0;
    forEachPixel(*this, surface, dx, dy, w, h, sx, sy, nullptr, [&](uint8_t* out, int x, int y) {
      const int weight = (greyAt<eight>(x, y) + bias) * alpha / 255;
      out[0] = blend(out[0], colour.b, weight);
      out[1] = blend(out[1], colour.g, weight);
      out[2] = blend(out[2], colour.r, weight);
    });
  });
}

void SkinBitmap::maskedCopy(DibSurface* surface, int dx, int dy, int w, int h, int sx, int sy,
                            const SkinBitmap* mask) const {
  if (!mask) return;
  byDepth(bits_, [&](auto eight) {
    forEachPixel(*this, surface, dx, dy, w, h, sx, sy, mask, [&](uint8_t* out, int x, int y) {
      const double m = mask->grey(x, y) / 255.0;
      const uint8_t* p = colourAt<eight>(x, y);
      for (int k = 0; k < 3; ++k) out[k] = static_cast<uint8_t>(p[k] * m + out[k] * (1.0 - m));
    });
  });
}

void SkinBitmap::release() {
  std::vector<uint8_t>().swap(rows_);
  width_ = height_ = bits_ = stride_ = 0;
  palette_.fill(0);
}

bool SkinBitmap::loadResource(int id) {
  release();
  if (!lookup_) return false;
  size_t size = 0;
  const uint8_t* data = lookup_(id, &size);
  return loadDib(data, size);
}

bool SkinBitmap::loadDib(const uint8_t* data, size_t size) {
  release();
  return parse(data, size, kRowsFollowPalette);
}

bool SkinBitmap::loadFile(const std::string& path, int requiredWidth, int requiredHeight) {
  release();
  if (requiredWidth <= 0 || requiredHeight <= 0 || requiredWidth > kMaxSide || requiredHeight > kMaxSide)
    return false;
  std::ifstream in(path, std::ios::binary);
  if (!in) return false;
  in.seekg(0, std::ios::end);
  std::streamoff fileSize = in.tellg();
  if (fileSize <= 0) return false;
  in.seekg(0);
  // Only the bytes a file of the required size can use are read: headers, a full palette, the widest rows
  // and room for a gap before them (trailing bytes are ignored).
  uint64_t limit = kFileHeaderSize + 40 + 256 * 4 + 65536 +
                   paddedStride(static_cast<uint64_t>(requiredWidth), 24) * static_cast<uint64_t>(requiredHeight);
  size_t count = static_cast<size_t>(std::min<uint64_t>(static_cast<uint64_t>(fileSize), limit));
  std::vector<uint8_t> bytes;
  try {
    bytes.resize(count);
  } catch (const std::bad_alloc&) {
    return false;
  }
  if (!in.read(reinterpret_cast<char*>(bytes.data()), static_cast<std::streamsize>(count))) return false;
  return loadFileBytes(bytes.data(), bytes.size(), requiredWidth, requiredHeight);
}

bool SkinBitmap::loadFileBytes(const uint8_t* data, size_t size, int requiredWidth, int requiredHeight) {
  release();
  if (!data || size < kFileHeaderSize || data[0] != 'B' || data[1] != 'M') return false;
  uint32_t offBits = read32(data + 10);
  if (offBits < kFileHeaderSize) return false;
  if (!parse(data + kFileHeaderSize, size - kFileHeaderSize, offBits - kFileHeaderSize)) return false;
  if (width_ != requiredWidth || height_ != requiredHeight) {
    release();
    return false;
  }
  return true;
}

bool SkinBitmap::parse(const uint8_t* data, size_t size, size_t pixelOffset) {
  if (!data || size < 4) return false;
  const uint32_t headerSize = read32(data);
  int64_t width = 0, height = 0;
  uint32_t planes = 0, bits = 0, compression = 0, colours = 0;
  size_t entrySize = 0;
  if (headerSize == 12 && size >= 12) {
    width = read16(data + 4);
    height = read16(data + 6);
    planes = read16(data + 8);
    bits = read16(data + 10);
    entrySize = 3;
    colours = bits == 8 ? 256 : 0;
  } else if (headerSize == 40 && size >= 40) {
    width = static_cast<int32_t>(read32(data + 4));
    height = static_cast<int32_t>(read32(data + 8));
    planes = read16(data + 12);
    bits = read16(data + 14);
    compression = read32(data + 16);
    colours = read32(data + 32);
    if (bits == 8 && colours == 0) colours = 256;
    entrySize = 4;
  } else {
    return false;
  }
  if (planes != 1 || (bits != 8 && bits != 24) || compression != 0 || colours > 256) return false;
  const bool topDown = height < 0;
  const int64_t rows = topDown ? -height : height;
  if (width < 1 || width > kMaxSide || rows < 1 || rows > kMaxSide) return false;

  // A 24-bit body may follow an optional palette, which is skipped.
  const uint64_t paletteEnd = headerSize + static_cast<uint64_t>(colours) * entrySize;
  if (paletteEnd > size) return false;
  const uint64_t start = pixelOffset == kRowsFollowPalette ? paletteEnd : pixelOffset;
  if (start < paletteEnd || start > size) return false;
  const uint64_t stride = paddedStride(static_cast<uint64_t>(width), bits);
  if (stride * static_cast<uint64_t>(rows) > size - start) return false;

  try {
    rows_.resize(static_cast<size_t>(stride * rows));
  } catch (const std::bad_alloc&) {
    release();
    return false;
  }
  for (int64_t y = 0; y < rows; ++y) {
    const uint8_t* src = data + start + stride * static_cast<uint64_t>(topDown ? y : rows - 1 - y);
    std::memcpy(rows_.data() + stride * static_cast<uint64_t>(y), src, static_cast<size_t>(stride));
  }
  if (bits == 8) {
    for (uint32_t i = 0; i < colours; ++i) {
      const uint8_t* e = data + headerSize + static_cast<size_t>(i) * entrySize;
      palette_[i * 4] = e[0];
      palette_[i * 4 + 1] = e[1];
      palette_[i * 4 + 2] = e[2];
    }
  }
  width_ = static_cast<int>(width);
  height_ = static_cast<int>(rows);
  bits_ = static_cast<int>(bits);
  stride_ = static_cast<int>(stride);
  return true;
}

}  // namespace ulvetta
