#pragma once
// Hand-made bitmaps for the editor tests: the bytes of a DIB (header, palette, rows) or of a whole BMP file.
#include <cstdint>
#include <functional>
#include <vector>

namespace ulvetta::test {

struct BmpSpec {
  int headerSize = 40;  // 12 (core) or 40 (info)
  int width = 2;
  int height = 2;  // negative for top-down rows
  int bits = 24;
  int planes = 1;
  uint32_t compression = 0;
  uint32_t colours = 0;  // palette entries written (info header: also the stored count)
  // Value of (x, y, channel) with y counted from the top; channel 0 for 8-bit indices, 0..2 = B, G, R.
  std::function<uint8_t(int x, int y, int channel)> pixel = [](int, int, int) { return uint8_t{0}; };
  // Palette entry i, channel 0..2 = B, G, R.
  std::function<uint8_t(int i, int channel)> palette = [](int i, int) { return static_cast<uint8_t>(i); };
};

inline void put(std::vector<uint8_t>& out, uint32_t v, int bytes) {
  for (int i = 0; i < bytes; ++i) out.push_back(i < 4 ? static_cast<uint8_t>(v >> (8 * i)) : 0);
}

inline std::vector<uint8_t> makeDib(const BmpSpec& s) {
  std::vector<uint8_t> out;
  put(out, static_cast<uint32_t>(s.headerSize), 4);
  const int rows = s.height < 0 ? -s.height : s.height;
  if (s.headerSize == 12) {
    put(out, static_cast<uint32_t>(s.width), 2);
    put(out, static_cast<uint32_t>(s.height), 2);
    put(out, static_cast<uint32_t>(s.planes), 2);
    put(out, static_cast<uint32_t>(s.bits), 2);
  } else {
    put(out, static_cast<uint32_t>(s.width), 4);
    put(out, static_cast<uint32_t>(s.height), 4);
    put(out, static_cast<uint32_t>(s.planes), 2);
    put(out, static_cast<uint32_t>(s.bits), 2);
    put(out, s.compression, 4);
    put(out, 0, 12);
    put(out, s.colours, 4);
    put(out, 0, 4);
  }
  for (uint32_t i = 0; i < s.colours; ++i) {
    for (int c = 0; c < 3; ++c) out.push_back(s.palette(static_cast<int>(i), c));
    if (s.headerSize != 12) out.push_back(0);
  }
  const int bytesPerPixel = s.bits >= 8 ? s.bits / 8 : 1;
  const size_t stride = (static_cast<size_t>(s.width) * s.bits + 31) / 32 * 4;
  for (int r = 0; r < rows; ++r) {
    const int y = s.height < 0 ? r : rows - 1 - r;  // stored order to picture row
    std::vector<uint8_t> row(stride, 0);
    for (int x = 0; x < s.width && static_cast<size_t>(x * bytesPerPixel) < stride; ++x)
      for (int c = 0; c < bytesPerPixel; ++c) row[x * bytesPerPixel + c] = s.pixel(x, y, c);
    out.insert(out.end(), row.begin(), row.end());
  }
  return out;
}

// A BMP file: "BM", the file size, and the rows' offset after the header and palette.
inline std::vector<uint8_t> makeFile(const BmpSpec& s) {
  const std::vector<uint8_t> dib = makeDib(s);
  const uint32_t paletteBytes = s.colours * (s.headerSize == 12 ? 3 : 4);
  std::vector<uint8_t> out{'B', 'M'};
  put(out, static_cast<uint32_t>(14 + dib.size()), 4);
  put(out, 0, 4);
  put(out, 14 + static_cast<uint32_t>(s.headerSize) + paletteBytes, 4);
  out.insert(out.end(), dib.begin(), dib.end());
  return out;
}

// An 8-bit bitmap of grey levels: palette entry i is grey i, and pixel (x, y) has index level(x, y).
inline BmpSpec greyBitmap(int width, int height, std::function<uint8_t(int, int)> level) {
  BmpSpec s;
  s.width = width;
  s.height = height;
  s.bits = 8;
  s.colours = 256;
  s.pixel = [level](int x, int y, int) { return level(x, y); };
  return s;
}

}  // namespace ulvetta::test
