// The bitmap loader: both header kinds and row orders, resources through an injected table, files from disk,
// and the files it must refuse, leaving the bitmap empty.
#include <gtest/gtest.h>

#include <cstdio>

#include "editor/BmpBuilder.h"
#include "editor/SkinBitmap.h"

namespace ulvetta {
namespace {

// A 24-bit picture whose pixel (x, y) is B = x, G = y, R = 7.
test::BmpLayout gradient(int headerSize, int width, int height, int bits = 24) {
  test::BmpLayout s =
      test::colourBitmap(width, height, [](int x, int y, int ch) { return uint8_t(ch == 0 ? x : ch == 1 ? y : 7); });
  s.headerSize = headerSize;
  s.bits = bits;
  return s;
}

void expectGradient(const SkinBitmap& b, int width, int height) {
  ASSERT_TRUE(b.width() == width && b.height() == height);
  SkinColour c;
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x)
      ASSERT_TRUE(b.pixelColour(x, y, &c) && c.b == uint8_t(x) && c.g == uint8_t(y) && c.r == 7) << x << "," << y;
  EXPECT_FALSE(b.pixelColour(width, 0, &c));
}

std::vector<uint8_t> gResource;
const uint8_t* lookup(int id, size_t* size) {
  *size = id == 202 ? gResource.size() : 0;
  return id == 202 ? gResource.data() : nullptr;
}

TEST(LoaderTest, HeaderKindsRowOrdersResourcesAndFiles) {
  for (const auto& [header, height] : {std::pair{12, 3}, std::pair{40, 3}, std::pair{40, -3}}) {
    const auto file = test::makeFile(gradient(header, 5, height));
    SkinBitmap b(nullptr);
    ASSERT_TRUE(b.loadFileBytes(file.data(), file.size(), 5, 3)) << header << " " << height;
    expectGradient(b, 5, 3);
  }
  // 8-bit through a core header's 3-byte palette entries: index 9 is B 9, G 18, R 27.
  test::BmpLayout core = test::greyBitmap(3, 2, [](int x, int y) { return uint8_t(x + 3 * y + 4); });
  core.headerSize = 12;
  core.palette = [](int i, int ch) { return static_cast<uint8_t>(i * (ch + 1)); };
  gResource = test::makeDib(core);
  SkinBitmap b(lookup);
  SkinColour c;
  ASSERT_TRUE(b.loadResource(202) && b.pixelColour(2, 1, &c));
  EXPECT_TRUE(c.b == 9 && c.g == 18 && c.r == 27);
  EXPECT_FALSE(b.loadResource(999) || !b.empty() || SkinBitmap(nullptr).loadResource(202));

  const std::string path = test::writeFile(testing::TempDir() + "editor_loader.bmp", gradient(40, 750, 167));
  ASSERT_TRUE(b.loadFile(path, 750, 167));
  expectGradient(b, 750, 167);
  EXPECT_FALSE(b.loadFile(path, 750, 166) || !b.empty() || b.loadFile(path + ".missing", 750, 167));
  std::remove(path.c_str());
}

TEST(LoaderTest, RefusedFilesLeaveTheBitmapEmpty) {
  const auto good = test::makeFile(gradient(40, 750, 167));
  auto patched = [&](size_t at, uint32_t value, int bytes) {
    auto f = good;
    for (int i = 0; i < bytes; ++i) f.at(at + i) = static_cast<uint8_t>(value >> (8 * i));
    return f;
  };
  auto cut = [](std::vector<uint8_t> f, size_t size) { return std::vector<uint8_t>(f.begin(), f.begin() + size); };
  test::BmpLayout eight = gradient(40, 750, 167, 8);
  eight.colours = 256;
  const auto paletted = test::makeFile(eight);
  eight.colours = 300;
  const std::pair<const char*, std::vector<uint8_t>> refused[] = {
      {"4-bit body", test::makeFile(gradient(40, 750, 167, 4))},
      {"32-bit body", test::makeFile(gradient(40, 750, 167, 32))},
      {"751 x 167", test::makeFile(gradient(40, 751, 167))},
      {"one byte short", cut(good, good.size() - 1)},
      {"file header only", cut(good, 14)},
      {"palette beyond the file", cut(paletted, 14 + 40 + 100)},
      {"no BM", patched(0, 'X', 1)},
      {"header size 108", patched(14, 108, 4)},
      {"two planes", patched(26, 2, 2)},
      {"compressed", patched(30, 1, 4)},
      {"absurd width", patched(18, 0x40000000, 4)},
      {"absurd height", patched(22, 0x80000000u, 4)},
      {"300 colours", test::makeFile(eight)},
      {"rows beyond the file", patched(10, 0xFFFFFF00u, 4)},
      {"rows inside the header", patched(10, 20, 4)},
  };
  SkinBitmap b(nullptr);
  for (const auto& [name, bytes] : refused) {
    ASSERT_TRUE(b.loadFileBytes(paletted.data(), paletted.size(), 750, 167));
    EXPECT_FALSE(b.loadFileBytes(bytes.data(), bytes.size(), 750, 167)) << name;
    EXPECT_TRUE(b.empty() && b.pixels() == nullptr && b.width() == 0) << name;
  }
}

}  // namespace
}  // namespace ulvetta
