// The octree palette and the back buffer's cached display palette.
#include <gtest/gtest.h>

#include <algorithm>
#include <random>
#include <set>
#include <tuple>

#include "editor/OctreeQuantiser.h"

namespace ulvetta {
namespace {

using Colour = std::tuple<int, int, int>;

std::set<Colour> asSet(const std::vector<SkinColour>& palette) {
  std::set<Colour> out;
  for (const SkinColour& c : palette) out.insert({c.r, c.g, c.b});
  return out;
}

TEST(QuantiserTest, KeepsFewColoursExactlyAndReducesMany) {
  std::mt19937 random(11);
  DibSurface surface;
  ASSERT_TRUE(surface.create(0, 0, 100, 50));
  std::set<Colour> used;
  for (int i = 0; i < 236; ++i) used.insert({int(random() & 255), int(random() & 255), int(random() & 255)});
  std::vector<Colour> pick(used.begin(), used.end());
  for (int p = 0; p < 100 * 50; ++p) {
    const auto [r, g, b] = pick[(p * 7) % pick.size()];
    uint8_t* px = surface.pixels() + p * 4;
    px[0] = uint8_t(b);
    px[1] = uint8_t(g);
    px[2] = uint8_t(r);
  }
  OctreeQuantiser few;
  few.addSurface(surface);
  EXPECT_EQ(asSet(few.palette()), used);
  // The surface computes its palette once and keeps it while its contents change.
  EXPECT_EQ(asSet(surface.displayPalette()), used);
  surface.pixels()[0] ^= 0xFF;
  EXPECT_EQ(asSet(surface.displayPalette()), used);

  // Thousands of colours: at most 236 entries, each the average of the colours folded into it, so every
  // entry lies inside the cube of its common bits and no channel leaves the range of the input.
  OctreeQuantiser many;
  int lowRed = 255, highRed = 0;
  for (int i = 0; i < 20000; ++i) {
    const int r = 40 + int(random() % 150);
    lowRed = std::min(lowRed, r);
    highRed = std::max(highRed, r);
    many.add(uint8_t(r), uint8_t(random()), uint8_t(random()));
    ASSERT_LE(many.leafCount(), 236);
  }
  const auto palette = many.palette();
  EXPECT_GT(palette.size(), 200u);
  EXPECT_LE(palette.size(), 236u);
  for (const SkinColour& c : palette) {
    EXPECT_GE(c.r, lowRed);
    EXPECT_LE(c.r, highRed);
  }

  // With a limit of 2 the third colour folds the deepest inner nodes: the pair that differs only in the last
  // bit becomes one leaf holding their rounded average.
  OctreeQuantiser two(2);
  two.add(200, 200, 200);
  two.add(201, 201, 201);
  two.add(10, 10, 10);
  EXPECT_EQ(asSet(two.palette()), (std::set<Colour>{{10, 10, 10}, {201, 201, 201}}));
}

}  // namespace
}  // namespace ulvetta
