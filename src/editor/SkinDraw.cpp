#include "editor/SkinDraw.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <utility>

namespace ulvetta {

void fillRect(DibSurface* surface, int x, int y, int w, int h, SkinColour colour) {
  if (!surface || surface->empty() || colour.a == 0) return;
  const long long left = std::max<long long>(x, 0), top = std::max<long long>(y, 0);
  const long long right = std::min<long long>(static_cast<long long>(x) + w, surface->width());
  const long long bottom = std::min<long long>(static_cast<long long>(y) + h, surface->height());
  const int weight = colour.a + 1;
  const uint8_t c[3] = {colour.b, colour.g, colour.r};
  const uint32_t opaque = colour.b | (colour.g << 8) | (colour.r << 16);
  for (long long j = top; j < bottom; ++j) {
    uint8_t* p = surface->at(static_cast<int>(left), static_cast<int>(j));
    if (colour.a == 255) {
      for (long long i = left; i < right; ++i, p += 4) std::memcpy(p, &opaque, 4);
      continue;
    }
    for (long long i = left; i < right; ++i, p += 4)
      for (int k = 0; k < 3; ++k) p[k] = static_cast<uint8_t>((p[k] * (256 - weight) + c[k] * weight) >> 8);
  }
}

namespace {

// Gives pixel (x, y) the share (1 - f) of the colour over the share f of what is there; each product is
// truncated before the sum.
void sharePixel(DibSurface* surface, long long x, long long y, double f, const uint8_t c[3]) {
  if (x < 0 || y < 0 || x >= surface->width() || y >= surface->height()) return;
  uint8_t* p = surface->at(static_cast<int>(x), static_cast<int>(y));
  for (int k = 0; k < 3; ++k)
    p[k] = static_cast<uint8_t>(static_cast<int>(p[k] * f) + static_cast<int>(c[k] * (1.0 - f)));
}

}  // namespace

void drawLine(DibSurface* surface, int x1, int y1, int x2, int y2, SkinColour colour) {
  if (!surface || surface->empty()) return;
  const uint8_t c[3] = {colour.b, colour.g, colour.r};
  const long long dx = static_cast<long long>(x2) - x1, dy = static_cast<long long>(y2) - y1;
  const bool steep = std::llabs(dx) <= std::llabs(dy);
  // Major and minor coordinates of both ends, the first end with the smaller major coordinate.
  long long a1 = steep ? y1 : x1, b1 = steep ? x1 : y1, a2 = steep ? y2 : x2, b2 = steep ? x2 : y2;
  if (a2 < a1) {
    std::swap(a1, a2);
    std::swap(b1, b2);
  }
  const double slope = a2 == a1 ? 0.0 : static_cast<double>(b2 - b1) / static_cast<double>(a2 - a1);
  // Steps off the surface draw nothing: the walk starts at the surface's first row or column and stops at
  // its last.
  const long long majorSize = steep ? surface->height() : surface->width();
  long long a = a1;
  double p = static_cast<double>(b1);
  if (a < 0) {
    p += slope * static_cast<double>(-a);
    a = 0;
  }
  for (const long long last = std::min(a2, majorSize - 1); a <= last; ++a, p += slope) {
    // floor keeps f in 0..1 on both sides of zero.
    const double i = std::floor(p);
    const double f = p - i;
    const long long minor = static_cast<long long>(i);
    if (steep) {
      sharePixel(surface, minor, a, f, c);
      sharePixel(surface, minor + 1, a, 1.0 - f, c);
    } else {
      sharePixel(surface, a, minor, f, c);
      sharePixel(surface, a, minor + 1, 1.0 - f, c);
    }
  }
}

}  // namespace ulvetta
