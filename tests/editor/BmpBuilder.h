#pragma once
// Hand-made bitmaps for the editor's tests and benchmark: the bytes of a DIB (header, palette, rows), of a
// whole BMP file, or a SkinBitmap loaded from them.
#include <cstdint>
#include <fstream>
#include <functional>
#include <string>
#include <vector>

#include "editor/SkinBitmap.h"

namespace ulvetta::test {

struct BmpLayout {
  int headerSize = 40;        // 12 (core) or 40 (info)
  int width = 2, height = 2;  // negative height: top-down rows
  int bits = 8;
  uint32_t colours = 256;  // palette entries written (info header: also the stored count)
  // Byte `channel` of pixel (x, y), y from the top: the index of an 8-bit pixel, else B, G, R.
  std::function<uint8_t(int x, int y, int channel)> pixel = [](int, int, int) { return uint8_t{0}; };
  // Channel 0..2 (B, G, R) of palette entry i: grey i unless set.
  std::function<uint8_t(int i, int channel)> palette = [](int i, int) { return static_cast<uint8_t>(i); };
};

inline void put(std::vector<uint8_t>& out, uint32_t v, int bytes) {
  for (int i = 0; i < bytes; ++i) out.push_back(i < 4 ? static_cast<uint8_t>(v >> (8 * i)) : 0);
}

inline std::vector<uint8_t> makeDib(const BmpLayout& s) {
  std::vector<uint8_t> out;
  const int field = s.headerSize == 12 ? 2 : 4, entry = s.headerSize == 12 ? 3 : 4;
  put(out, s.headerSize, 4);
  put(out, s.width, field);
  put(out, s.height, field);
  put(out, 1, 2);
  put(out, s.bits, 2);
  if (s.headerSize == 40) {
    put(out, 0, 16);  // no compression, image size, resolution
    put(out, s.colours, 8);
  }
  for (uint32_t i = 0; i < s.colours; ++i)
    for (int c = 0; c < entry; ++c) out.push_back(c < 3 ? s.palette(int(i), c) : 0);
  const int rows = s.height < 0 ? -s.height : s.height, bytes = s.bits >= 8 ? s.bits / 8 : 1;
  const size_t stride = (size_t(s.width) * s.bits + 31) / 32 * 4;
  for (int r = 0; r < rows; ++r) {
    std::vector<uint8_t> row(stride, 0);
    for (size_t x = 0; x < size_t(s.width) && x * bytes < stride; ++x)
      for (int c = 0; c < bytes; ++c) row[x * bytes + c] = s.pixel(int(x), s.height < 0 ? r : rows - 1 - r, c);
    out.insert(out.end(), row.begin(), row.end());
  }
  return out;
}

// A BMP file: "BM", its size, and the rows' offset after the header and palette.
inline std::vector<uint8_t> makeFile(const BmpLayout& s) {
  const std::vector<uint8_t> dib = makeDib(s);
  std::vector<uint8_t> out{'B', 'M'};
  put(out, static_cast<uint32_t>(14 + dib.size()), 8);
  put(out, 14 + s.headerSize + s.colours * (s.headerSize == 12 ? 3 : 4), 4);
  out.insert(out.end(), dib.begin(), dib.end());
  return out;
}

// An 8-bit grey picture: palette entry i is grey i and pixel (x, y) has index level(x, y).
inline BmpLayout greyBitmap(int width, int height, std::function<uint8_t(int, int)> level) {
  BmpLayout s;
  s.width = width;
  s.height = height;
  s.pixel = [level](int x, int y, int) { return level(x, y); };
  return s;
}

// A 24-bit picture without palette: channel c (B, G, R) of pixel (x, y) is pixel(x, y, c).
inline BmpLayout colourBitmap(int width, int height, std::function<uint8_t(int, int, int)> pixel) {
  BmpLayout s = greyBitmap(width, height, nullptr);
  s.bits = 24;
  s.colours = 0;
  s.pixel = std::move(pixel);
  return s;
}

// Writes layout as a BMP file and returns its path.
inline std::string writeFile(const std::string& path, const BmpLayout& layout) {
  const std::vector<uint8_t> bytes = makeFile(layout);
  std::ofstream(path, std::ios::binary).write(reinterpret_cast<const char*>(bytes.data()), bytes.size());
  return path;
}

// Loads layout's DIB into bitmap; false when the loader refuses it.
inline bool load(SkinBitmap& bitmap, const BmpLayout& layout) {
  const std::vector<uint8_t> dib = makeDib(layout);
  return bitmap.loadDib(dib.data(), dib.size());
}

}  // namespace ulvetta::test
