// The bitmap loader: both header kinds and row orders, resources through an injected table, and the files it
// must refuse (leaving the bitmap empty).
#include <gtest/gtest.h>

#include <cstdio>
#include <fstream>
#include <map>

#include "editor/BmpBuilder.h"
#include "editor/SkinBitmap.h"

namespace ulvetta {
namespace {

using test::BmpSpec;
using test::makeDib;
using test::makeFile;

// Pixel (x, y) of the test pictures: B = x, G = y, R = 7.
BmpSpec gradient(int headerSize, int width, int height, int bits) {
  BmpSpec s;
  s.headerSize = headerSize;
  s.width = width;
  s.height = height;
  s.bits = bits;
  s.pixel = [](int x, int y, int ch) { return uint8_t(ch == 0 ? x : ch == 1 ? y : 7); };
  return s;
}

void expectGradient(const SkinBitmap& b, int width, int height) {
  ASSERT_EQ(b.width(), width);
  ASSERT_EQ(b.height(), height);
  SkinColour c;
  for (int y = 0; y < height; ++y)
    for (int x = 0; x < width; ++x) {
      ASSERT_TRUE(b.pixelColour(x, y, &c));
      ASSERT_EQ(c.b, uint8_t(x));
      ASSERT_EQ(c.g, uint8_t(y));
      ASSERT_EQ(c.r, 7);
    }
}

std::map<int, std::vector<uint8_t>>& resourceTable() {
  static std::map<int, std::vector<uint8_t>> table;
  return table;
}
const uint8_t* lookupResource(int id, size_t* size) {
  auto it = resourceTable().find(id);
  *size = it == resourceTable().end() ? 0 : it->second.size();
  return it == resourceTable().end() ? nullptr : it->second.data();
}

TEST(LoaderTest, BothHeaderKindsAndRowOrdersStoreRowsTopToBottom) {
  for (int header : {12, 40}) {
    for (int height : {3, -3}) {
      if (header == 12 && height < 0) continue;  // the core header's height is unsigned
      SCOPED_TRACE(testing::Message() << "header " << header << " height " << height);
      const auto file = makeFile(gradient(header, 5, height, 24));
      SkinBitmap b(nullptr);
      ASSERT_TRUE(b.loadFileBytes(file.data(), file.size(), 5, 3));
      expectGradient(b, 5, 3);
      EXPECT_EQ(b.stride(), 16);
    }
  }
  // 8-bit with a core header: 3-byte palette entries; index 9 maps to B 9, G 18, R 27.
  BmpSpec core;
  core.headerSize = 12;
  core.width = 3;
  core.height = 2;
  core.bits = 8;
  core.colours = 256;
  core.palette = [](int i, int ch) { return static_cast<uint8_t>(i * (ch + 1)); };
  core.pixel = [](int x, int y, int) { return static_cast<uint8_t>(x + 3 * y + 4); };
  SkinBitmap b(nullptr);
  const auto dib = makeDib(core);
  ASSERT_TRUE(b.loadDib(dib.data(), dib.size()));
  SkinColour c;
  ASSERT_TRUE(b.pixelColour(2, 1, &c));
  EXPECT_EQ(c.b, 9);
  EXPECT_EQ(c.g, 18);
  EXPECT_EQ(c.r, 27);
  EXPECT_FALSE(b.pixelColour(3, 0, &c));
}

TEST(LoaderTest, ResourcesComeThroughTheLookupAndFilesFromDisk) {
  resourceTable()[202] = makeDib(gradient(40, 3, 112, 24));
  SkinBitmap b(lookupResource);
  ASSERT_TRUE(b.loadResource(202));
  expectGradient(b, 3, 112);
  EXPECT_FALSE(b.loadResource(999));
  EXPECT_TRUE(b.empty());
  EXPECT_FALSE(SkinBitmap(nullptr).loadResource(202));

  const std::string path = testing::TempDir() + "editor_loader.bmp";
  const auto file = makeFile(gradient(40, 750, 167, 24));
  std::ofstream(path, std::ios::binary).write(reinterpret_cast<const char*>(file.data()), file.size());
  ASSERT_TRUE(b.loadFile(path, 750, 167));
  expectGradient(b, 750, 167);
  EXPECT_FALSE(b.loadFile(path, 750, 166));
  EXPECT_TRUE(b.empty());
  EXPECT_FALSE(b.loadFile(path + ".missing", 750, 167));
  std::remove(path.c_str());
}

TEST(LoaderTest, RefusedFilesLeaveTheBitmapEmpty) {
  const auto good = makeFile(gradient(40, 750, 167, 24));
  auto patched = [&](size_t at, uint32_t value, int bytes) {
    auto f = good;
    for (int i = 0; i < bytes; ++i) f.at(at + i) = static_cast<uint8_t>(value >> (8 * i));
    return f;
  };
  auto truncated = good;
  truncated.resize(good.size() - 1);
  auto notBm = good;
  notBm[0] = 'X';
  BmpSpec eightBit = gradient(40, 750, 167, 8);
  eightBit.colours = 256;
  const auto paletteFile = makeFile(eightBit);
  auto shortPalette = paletteFile;
  shortPalette.resize(14 + 40 + 100);
  const std::vector<std::pair<const char*, std::vector<uint8_t>>> refused = {
      {"4-bit body", makeFile(gradient(40, 750, 167, 4))},
      {"32-bit body", makeFile(gradient(40, 750, 167, 32))},
      {"751 x 167", makeFile(gradient(40, 751, 167, 24))},
      {"one byte short", truncated},
      {"no BM", notBm},
      {"header size 108", patched(14, 108, 4)},
      {"two planes", patched(26, 2, 2)},
      {"compressed", patched(30, 1, 4)},
      {"absurd width", patched(18, 0x40000000, 4)},
      {"absurd height", patched(22, 0x80000000u, 4)},
      {"300 colours", [&] { auto f = paletteFile; f[46] = 44; f[47] = 1; return f; }()},
      {"palette beyond the file", shortPalette},
      {"rows beyond the file", patched(10, 0xFFFFFF00u, 4)},
      {"rows inside the header", patched(10, 20, 4)},
      {"file header only", std::vector<uint8_t>(good.begin(), good.begin() + 14)},
  };
  SkinBitmap b(nullptr);
  for (const auto& [name, bytes] : refused) {
    ASSERT_TRUE(b.loadFileBytes(good.data(), good.size(), 750, 167));
    EXPECT_FALSE(b.loadFileBytes(bytes.data(), bytes.size(), 750, 167)) << name;
    EXPECT_TRUE(b.empty() && b.pixels() == nullptr && b.width() == 0) << name;
  }
  EXPECT_TRUE(b.loadFileBytes(paletteFile.data(), paletteFile.size(), 750, 167));
}

}  // namespace
}  // namespace ulvetta
