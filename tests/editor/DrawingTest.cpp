// Pixel arithmetic of the drawing primitives against values worked out by hand from the blending rules.
#include <gtest/gtest.h>

#include "editor/BmpBuilder.h"
#include "editor/SkinBitmap.h"
#include "editor/SkinDraw.h"

namespace ulvetta {
namespace {

using test::greyBitmap;
using test::makeDib;

DibSurface greySurface(int w, int h, uint8_t level) {
  DibSurface s;
  EXPECT_TRUE(s.create(0, 0, w, h));
  for (int i = 0; i < w * h * 4; ++i) s.pixels()[i] = level;
  return s;
}

// B, G, R of a pixel packed as 0xRRGGBB.
uint32_t rgb(const DibSurface& s, int x, int y) {
  const uint8_t* p = s.at(x, y);
  return (p[2] << 16) | (p[1] << 8) | p[0];
}

SkinBitmap loaded(const test::BmpSpec& spec) {
  SkinBitmap b(nullptr);
  const auto dib = makeDib(spec);
  EXPECT_TRUE(b.loadDib(dib.data(), dib.size()));
  return b;
}

TEST(SurfaceTest, HeaderDescribesTopDownRowsAndRefusesBadSizes) {
  DibSurface s;
  ASSERT_TRUE(s.create(0, 0, 750, 167));
  EXPECT_EQ(s.header().size, 40u);
  EXPECT_EQ(s.header().width, 750);
  EXPECT_EQ(s.header().height, -167);
  EXPECT_EQ(s.header().bitCount, 32);
  EXPECT_EQ(s.header().sizeImage, 750u * 4 * 167);
  EXPECT_EQ(s.pixels()[750 * 167 * 4 - 1], 0);
  EXPECT_FALSE(s.create(0, 0, 0, 10));
  EXPECT_TRUE(s.empty());
  EXPECT_FALSE(s.create(0, 0, 10, 10, 24));
}

TEST(FillTest, AlphaZeroHalfAndFullWithClipping) {
  DibSurface s = greySurface(4, 3, 200);
  fillRect(&s, 0, 0, 4, 3, {1, 2, 3, 0});
  EXPECT_EQ(rgb(s, 1, 1), 0xC8C8C8u);
  // Weight 129 of 256: (200 x 127 + 100 x 129) >> 8 = 149, (200 x 127 + 0) >> 8 = 99.
  fillRect(&s, 1, 1, 1, 1, {100, 0, 200, 128});
  EXPECT_EQ(rgb(s, 1, 1), (149u << 16) | (99u << 8) | 200u);
  // Partly off every edge: only the inside is written.
  fillRect(&s, -5, 2, 100, 100, {10, 20, 30, 255});
  EXPECT_EQ(rgb(s, 0, 2), 0x0A141Eu);
  EXPECT_EQ(rgb(s, 3, 2), 0x0A141Eu);
  EXPECT_EQ(rgb(s, 3, 1), 0xC8C8C8u);
  fillRect(nullptr, 0, 0, 1, 1, {0, 0, 0, 255});
}

TEST(LineTest, HorizontalVerticalAndDiagonalPixelPairs) {
  const SkinColour c{201, 201, 201, 0};
  // Horizontal: f = 0 at every step, so the row gets the colour and the row below keeps its own.
  DibSurface s = greySurface(6, 6, 100);
  drawLine(&s, 4, 2, 1, 2, c);
  for (int x = 1; x <= 4; ++x) {
    EXPECT_EQ(s.at(x, 2)[0], 201) << x;
    EXPECT_EQ(s.at(x, 3)[0], 100) << x;
  }
  EXPECT_EQ(s.at(0, 2)[0], 100);
  EXPECT_EQ(s.at(5, 2)[0], 100);

  s = greySurface(6, 6, 100);
  drawLine(&s, 3, 0, 3, 4, c);
  for (int y = 0; y <= 4; ++y) EXPECT_EQ(s.at(3, y)[0], 201) << y;
  EXPECT_EQ(s.at(3, 5)[0], 100);
  EXPECT_EQ(s.at(4, 2)[0], 100);

  // Slope 1/2 along x: at odd x the position is halfway, both pixels get 100/2 + 201/2 = 50 + 100.
  s = greySurface(6, 6, 100);
  drawLine(&s, 4, 2, 0, 0, c);
  const uint8_t expected[5][2] = {{201, 100}, {150, 150}, {201, 100}, {150, 150}, {201, 100}};
  const int row[5] = {0, 0, 1, 1, 2};
  for (int x = 0; x <= 4; ++x) {
    EXPECT_EQ(s.at(x, row[x])[0], expected[x][0]) << x;
    EXPECT_EQ(s.at(x, row[x] + 1)[0], expected[x][1]) << x;
  }
  // Equal extents count as steep; lines running off the surface draw their inside part only.
  s = greySurface(6, 6, 100);
  drawLine(&s, -3, -3, 8, 8, c);
  for (int k = 0; k < 6; ++k) EXPECT_EQ(s.at(k, k)[0], 201) << k;
  drawLine(&s, -1000000000, 3, 2000000000, 3, c);
  EXPECT_EQ(s.at(5, 3)[0], 201);
}

TEST(TintTest, GreyLevelsWeightTheColour) {
  // Grey levels 0, 128, 255 of an 8-bit mask over black, tinted with 200.
  const SkinBitmap mask8 = loaded(greyBitmap(3, 1, [](int x, int) { return uint8_t(x == 0 ? 0 : x == 1 ? 128 : 255); }));
  const SkinColour tint{200, 200, 200, 255};
  DibSurface s = greySurface(3, 1, 0);
  mask8.tintedCopy(&s, 0, 0, 3, 1, 0, 0, tint);
  // Weight g + 1: 200 x 1 >> 8 = 0, 200 x 129 >> 8 = 100, 200 x 256 >> 8 = 200.
  EXPECT_EQ(s.at(0, 0)[0], 0);
  EXPECT_EQ(s.at(1, 0)[0], 100);
  EXPECT_EQ(s.at(2, 0)[0], 200);

  // With alpha 128 the 8-bit weights are trunc((g + 1) x 128 / 255) = 0, 64, 128.
  s = greySurface(3, 1, 0);
  mask8.tintedCopyAlpha(&s, 0, 0, 3, 1, 0, 0, tint, 128);
  EXPECT_EQ(s.at(0, 0)[0], 0);
  EXPECT_EQ(s.at(1, 0)[0], 50);
  EXPECT_EQ(s.at(2, 0)[0], 100);
  s = greySurface(3, 1, 0);
  mask8.tintedCopyAlpha(&s, 0, 0, 3, 1, 0, 0, tint, 0);
  EXPECT_EQ(s.at(2, 0)[0], 0);

  // A 24-bit mask reads the middle byte and uses trunc(g x alpha / 255): weight 255 at full alpha.
  test::BmpSpec spec;
  spec.width = 1;
  spec.height = 1;
  spec.pixel = [](int, int, int ch) { return uint8_t(ch == 1 ? 255 : 0); };
  const SkinBitmap mask24 = loaded(spec);
  s = greySurface(1, 1, 0);
  mask24.tintedCopyAlpha(&s, 0, 0, 1, 1, 0, 0, tint, 255);
  EXPECT_EQ(s.at(0, 0)[0], 199);
}

TEST(CopyTest, PaletteAndMaskedCopiesClippedToTheSurface) {
  // 8-bit picture: palette entry i is B = i, G = 2i, R = 3i; pixel (x, y) has index 10 + x + 4y.
  test::BmpSpec spec;
  spec.width = 4;
  spec.height = 2;
  spec.bits = 8;
  spec.colours = 256;
  spec.palette = [](int i, int ch) { return static_cast<uint8_t>(i * (ch + 1)); };
  spec.pixel = [](int x, int y, int) { return static_cast<uint8_t>(10 + x + 4 * y); };
  const SkinBitmap picture = loaded(spec);
  DibSurface s = greySurface(3, 3, 7);
  picture.copy(&s, -1, 1, 4, 2, 0, 0);  // the left source column falls off
  EXPECT_EQ(rgb(s, 0, 1), (33u << 16) | (22u << 8) | 11u);
  EXPECT_EQ(rgb(s, 2, 1), (39u << 16) | (26u << 8) | 13u);
  EXPECT_EQ(rgb(s, 0, 2), (45u << 16) | (30u << 8) | 15u);
  EXPECT_EQ(rgb(s, 0, 0), 0x070707u);

  // Mask grey 0 keeps the destination, 255 takes the source, 128 gives trunc(s x 128/255 + d x 127/255).
  const SkinBitmap grey200 = loaded(greyBitmap(3, 1, [](int, int) { return uint8_t(200); }));
  const SkinBitmap mask = loaded(greyBitmap(3, 1, [](int x, int) { return uint8_t(x == 0 ? 0 : x == 1 ? 128 : 255); }));
  s = greySurface(3, 1, 100);
  grey200.maskedCopy(&s, 0, 0, 3, 1, 0, 0, &mask);
  EXPECT_EQ(s.at(0, 0)[1], 100);
  EXPECT_EQ(s.at(1, 0)[1], 150);
  EXPECT_EQ(s.at(2, 0)[1], 200);

  // Missing surfaces, masks and bitmaps draw nothing.
  SkinBitmap empty(nullptr);
  empty.copy(&s, 0, 0, 3, 1, 0, 0);
  grey200.maskedCopy(&s, 0, 0, 3, 1, 0, 0, &empty);
  grey200.maskedCopy(&s, 0, 0, 3, 1, 0, 0, nullptr);
  grey200.copy(nullptr, 0, 0, 3, 1, 0, 0);
  EXPECT_EQ(s.at(0, 0)[1], 100);
}

}  // namespace
}  // namespace ulvetta
