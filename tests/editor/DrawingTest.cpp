// Pixel arithmetic of the drawing primitives against values worked out by hand from the blending rules.
#include <gtest/gtest.h>

#include "editor/BmpBuilder.h"
#include "editor/SkinDraw.h"

namespace ulvetta {
namespace {

DibSurface greySurface(int w, int h, uint8_t level) {
  DibSurface s;
  EXPECT_TRUE(s.create(0, 0, w, h));
  std::fill(s.pixels(), s.pixels() + w * h * 4, level);
  return s;
}

SkinBitmap loaded(const test::BmpLayout& layout) {
  SkinBitmap b(nullptr);
  EXPECT_TRUE(test::load(b, layout));
  return b;
}

// Grey levels 0, 128 and 255 across three pixels.
const test::BmpLayout kThreeGreys = test::greyBitmap(3, 1, [](int x, int) { return uint8_t(x * 128 - x / 2); });

TEST(FillTest, AlphaZeroHalfAndFullClippedToTheSurface) {
  DibSurface s = greySurface(4, 3, 200);
  fillRect(&s, 0, 0, 4, 3, {1, 2, 3, 0});
  // Weight 129/256 of R 100, G 0, B 200 over 200: (200 x 127 + c x 129) >> 8.
  fillRect(&s, 1, 1, 1, 1, {100, 0, 200, 128});
  EXPECT_TRUE(s.at(1, 1)[2] == 149 && s.at(1, 1)[1] == 99 && s.at(1, 1)[0] == 200 && s.at(0, 0)[0] == 200);
  fillRect(&s, -5, 2, 100, 100, {10, 20, 30, 255});
  EXPECT_TRUE(s.at(0, 2)[2] == 10 && s.at(3, 2)[0] == 30 && s.at(3, 1)[0] == 200);
  EXPECT_FALSE(s.create(0, 0, 0, 10) || s.create(0, 0, 10, 10, 24));
  fillRect(&s, 0, 0, 1, 1, {0, 0, 0, 255});  // an empty surface draws nothing
}

TEST(LineTest, HorizontalVerticalAndDiagonalPixelPairs) {
  const SkinColour c{201, 201, 201, 0};
  // At integer positions the first pixel of the pair takes the colour and the second keeps its own.
  DibSurface s = greySurface(6, 6, 100);
  drawLine(&s, 4, 2, 1, 2, c);
  drawLine(&s, 0, 5, 0, 3, c);
  for (int k = 1; k <= 4; ++k) EXPECT_TRUE(s.at(k, 2)[0] == 201 && s.at(k, 3)[0] == 100) << k;
  for (int k = 3; k <= 5; ++k) EXPECT_TRUE(s.at(0, k)[0] == 201 && s.at(1, k)[0] == 100) << k;
  EXPECT_TRUE(s.at(5, 2)[0] == 100 && s.at(0, 2)[0] == 100);

  // Slope 1/2 along x: halfway positions give both pixels trunc(100/2) + trunc(201/2) = 150.
  s = greySurface(6, 6, 100);
  drawLine(&s, 4, 2, 0, 0, c);
  const int top[5] = {0, 0, 1, 1, 2}, first[5] = {201, 150, 201, 150, 201}, second[5] = {100, 150, 100, 150, 100};
  for (int x = 0; x <= 4; ++x) EXPECT_TRUE(s.at(x, top[x])[0] == first[x] && s.at(x, top[x] + 1)[0] == second[x]) << x;

  // Equal extents step along y; lines running off the surface draw their inside part only.
  s = greySurface(6, 6, 100);
  drawLine(&s, -3, -3, 8, 8, c);
  drawLine(&s, -1000000000, 3, 2000000000, 3, c);
  for (int k = 0; k < 6; ++k) EXPECT_TRUE(s.at(k, k)[0] == 201 && s.at(k, 3)[0] == 201) << k;
}

TEST(TintTest, GreyLevelsWeightTheColourAtSeveralAlphas) {
  const SkinColour tint{200, 200, 200, 255};
  const SkinBitmap greys = loaded(kThreeGreys);
  // tintedCopy weighs g + 1: 200 x 1 >> 8, 200 x 129 >> 8, 200 x 256 >> 8. With alpha the 8-bit weight is
  // trunc((g + 1) x alpha / 255): 0, 64, 128 at alpha 128 and 0, 32, 64 at alpha 64.
  const struct { int alpha, expected[3]; } cases[] = {
      {-1, {0, 100, 200}}, {255, {0, 100, 200}}, {128, {0, 50, 100}}, {64, {0, 25, 50}}, {0, {0, 0, 0}}};
  for (const auto& k : cases) {
    DibSurface s = greySurface(3, 1, 0);
    if (k.alpha < 0)
      greys.tintedCopy(&s, 0, 0, 3, 1, 0, 0, tint);
    else
      greys.tintedCopyAlpha(&s, 0, 0, 3, 1, 0, 0, tint, k.alpha);
    for (int x = 0; x < 3; ++x) EXPECT_EQ(s.at(x, 0)[0], k.expected[x]) << k.alpha << " " << x;
  }
  // A 24-bit mask reads its middle byte and weighs trunc(g x alpha / 255): 255 of 256 at full alpha.
  const SkinBitmap green =
      loaded(test::colourBitmap(2, 2, [](int, int, int ch) { return uint8_t(ch == 1 ? 255 : 0); }));
  DibSurface s = greySurface(2, 2, 0);
  green.tintedCopyAlpha(&s, 0, 0, 2, 2, 0, 0, tint, 255);
  EXPECT_EQ(s.at(1, 1)[0], 199);
}

TEST(CopyTest, PaletteAndMaskedCopiesClippedToTheSurface) {
  // Palette entry i is B = i, G = 2i, R = 3i; pixel (x, y) has index 10 + x + 4y.
  test::BmpLayout layout = test::greyBitmap(4, 2, [](int x, int y) { return uint8_t(10 + x + 4 * y); });
  layout.palette = [](int i, int ch) { return static_cast<uint8_t>(i * (ch + 1)); };
  DibSurface s = greySurface(3, 3, 7);
  loaded(layout).copy(&s, -1, 1, 4, 2, 0, 0);  // the left source column falls off
  EXPECT_TRUE(s.at(0, 1)[0] == 11 && s.at(0, 1)[1] == 22 && s.at(0, 1)[2] == 33);
  EXPECT_TRUE(s.at(2, 2)[0] == 17 && s.at(2, 2)[2] == 51 && s.at(0, 0)[0] == 7);

  // Grey 0 keeps the destination, 255 takes the source, 128 gives trunc(200 x 128/255 + 100 x 127/255).
  const SkinBitmap grey200 = loaded(test::greyBitmap(3, 1, [](int, int) { return uint8_t(200); }));
  const SkinBitmap mask = loaded(kThreeGreys);
  SkinBitmap empty(nullptr);
  s = greySurface(3, 1, 100);
  grey200.maskedCopy(&s, 0, 0, 3, 1, 0, 0, &mask);
  EXPECT_TRUE(s.at(0, 0)[1] == 100 && s.at(1, 0)[1] == 150 && s.at(2, 0)[1] == 200);
  // Missing masks and bitmaps draw nothing.
  empty.copy(&s, 0, 0, 3, 1, 0, 0);
  grey200.maskedCopy(&s, 0, 0, 3, 1, 0, 0, &empty);
  grey200.maskedCopy(&s, 0, 0, 3, 1, 0, 0, nullptr);
  EXPECT_EQ(s.at(0, 0)[1], 100);
}

}  // namespace
}  // namespace ulvetta
