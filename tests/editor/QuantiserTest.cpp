// The octree palette and the back buffer's cached display palette.
#include <gtest/gtest.h>

#include <random>
#include <set>
#include <tuple>

#include "editor/OctreeQuantiser.h"
#include "editor/SkinDraw.h"

namespace ulvetta {
namespace {

std::set<std::tuple<int, int, int>> asSet(const std::vector<SkinColour>& palette) {
  std::set<std::tuple<int, int, int>> out;
  for (const SkinColour& c : palette) out.insert({c.r, c.g, c.b});
  return out;
}

TEST(QuantiserTest, KeepsFewColoursExactlyAndReducesMany) {
  std::mt19937 random(11);
  DibSurface surface;
  ASSERT_TRUE(surface.create(0, 0, 236, 3));
  std::vector<SkinColour> used(236);
  for (SkinColour& c : used) c = {uint8_t(random()), uint8_t(random()), uint8_t(random()), 255};
  for (int p = 0; p < 236 * 3; ++p) fillRect(&surface, p % 236, p / 236, 1, 1, used[(p * 7) % 236]);
  // The surface computes its palette once and keeps it while its contents change.
  EXPECT_EQ(asSet(surface.displayPalette()), asSet(used));
  surface.pixels()[0] ^= 0xFF;
  EXPECT_EQ(asSet(surface.displayPalette()), asSet(used));

  // Thousands of colours: at most 236 entries, each an average, so no red leaves the input's range 40..189.
  OctreeQuantiser many;
  for (int i = 0; i < 20000; ++i) {
    many.add(uint8_t(40 + random() % 150), uint8_t(random()), uint8_t(random()));
    ASSERT_LE(many.leafCount(), 236);
  }
  const auto palette = many.palette();
  EXPECT_GT(palette.size(), 200u);
  for (const SkinColour& c : palette) EXPECT_TRUE(c.r >= 40 && c.r <= 189) << int(c.r);

  // With a limit of 2 the third colour folds the deepest inner nodes: the pair that differs only in the last
  // bit becomes one leaf holding their rounded average.
  OctreeQuantiser two(2);
  two.add(200, 200, 200);
  two.add(201, 201, 201);
  two.add(10, 10, 10);
  EXPECT_EQ(asSet(two.palette()), asSet({{10, 10, 10, 255}, {201, 201, 201, 255}}));
}

}  // namespace
}  // namespace ulvetta
