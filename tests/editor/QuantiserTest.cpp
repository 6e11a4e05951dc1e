// The octree palette and the PNG presenter.
#include <gtest/gtest.h>
#include <png.h>

#include <algorithm>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <random>
#include <set>
#include <tuple>

#include "editor/OctreeQuantiser.h"
#include "editor/headless/PngPresenter.h"

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

TEST(PngPresenterTest, WritesTheRectangleAndNothingOnFailure) {
  DibSurface surface;
  ASSERT_TRUE(surface.create(0, 0, 7, 5));
  for (int y = 0; y < 5; ++y)
    for (int x = 0; x < 7; ++x) {
      uint8_t* p = surface.at(x, y);
      p[0] = uint8_t(x * 30);  // blue
      p[1] = uint8_t(y * 40);  // green
      p[2] = 99;               // red
    }
  const std::string path = testing::TempDir() + "editor_present.png";
  PngPresenter presenter(path);
  ASSERT_TRUE(presenter.present(surface, 2, 1, 10, 3)) << presenter.error();  // clipped to 5 x 3

  png_image image;
  std::memset(&image, 0, sizeof image);
  image.version = PNG_IMAGE_VERSION;
  ASSERT_TRUE(png_image_begin_read_from_file(&image, path.c_str()));
  image.format = PNG_FORMAT_RGB;
  std::vector<uint8_t> rgb(PNG_IMAGE_SIZE(image));
  ASSERT_TRUE(png_image_finish_read(&image, nullptr, rgb.data(), 0, nullptr));
  ASSERT_EQ(image.width, 5u);
  ASSERT_EQ(image.height, 3u);
  for (int y = 0; y < 3; ++y)
    for (int x = 0; x < 5; ++x) {
      const uint8_t* p = &rgb[(y * 5 + x) * 3];
      EXPECT_EQ(p[0], 99);
      EXPECT_EQ(p[1], (y + 1) * 40);
      EXPECT_EQ(p[2], (x + 2) * 30);
    }
  std::remove(path.c_str());

  const std::string dir = testing::TempDir() + "editor_present_dir";
  std::filesystem::create_directories(dir);
  PngPresenter blocked(dir);  // a directory cannot be replaced by a file
  EXPECT_FALSE(blocked.present(surface, 0, 0, 7, 5));
  EXPECT_FALSE(blocked.error().empty());
  EXPECT_TRUE(std::filesystem::is_directory(dir));
  for (const auto& entry : std::filesystem::directory_iterator(testing::TempDir()))
    EXPECT_EQ(entry.path().filename().string().rfind("editor_present_dir.", 0), std::string::npos);
  PngPresenter nowhere(testing::TempDir() + "no/such/dir/x.png");
  EXPECT_FALSE(nowhere.present(surface, 0, 0, 7, 5));
  EXPECT_FALSE(PngPresenter(path).present(surface, 7, 0, 3, 3));
  EXPECT_FALSE(std::filesystem::exists(path));
  std::filesystem::remove(dir);
}

}  // namespace
}  // namespace ulvetta
