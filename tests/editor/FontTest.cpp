// Text layout of the bitmap fonts: widths, alignment flags, clipping at both edges and unknown characters.
#include <gtest/gtest.h>

#include <tuple>
#include <numeric>
#include <string>

#include "editor/BitmapFont.h"
#include "editor/BmpBuilder.h"
#include "editor/EditorFonts.h"

namespace ulvetta {
namespace {

// A two-glyph font 2 rows high: "A" is 2 columns of grey 255, "B" 3 columns of grey 127. In white at alpha 255
// on black, A pixels become 255 and B pixels 255 x 128 >> 8 = 127.
class FontTest : public testing::Test {
 protected:
  void SetUp() override {
    ASSERT_TRUE(test::load(font.strip(), test::greyBitmap(5, 2, [](int x, int) { return uint8_t(x < 2 ? 255 : 127); })));
    const int widths[] = {2, 3};
    font.setGlyphs("AB", widths);
    ASSERT_TRUE(surface.create(0, 0, 12, 8));
  }
  // Row y, one character per pixel: A, B, or '.' for untouched black.
  std::string row(int y) const {
    std::string out;
    for (int x = 0; x < 12; ++x) out += "?.AB"[(surface.at(x, y)[0] == 0) + 2 * (surface.at(x, y)[0] == 255) + 3 * (surface.at(x, y)[0] == 127)];
    return out;
  }
  void draw(int flags, int x, int y, const char* text, int clipX = 0, int clipW = 12) {
    drawText(&surface, font, clipX, 0, clipW, 8, flags, x, y, text, {255, 255, 255, 255}, 255);
  }
  BitmapFont font{nullptr};
  DibSurface surface;
};

TEST_F(FontTest, MeasuresLinesAndSkipsUnknownCharacters) {
  EXPECT_EQ(font.textWidth("A\nBB?\nA"), 6);
  EXPECT_EQ(font.textHeight("A\nBB\nA"), 6);
  draw(kTextLeft, 1, 0, "A?B");
  EXPECT_EQ(row(1), ".AABBB......");
  EXPECT_EQ(row(2), "............");
}

TEST_F(FontTest, AlignmentFlags) {
  draw(kTextRight, 10, 0, "AB\nA");
  EXPECT_EQ(row(0), ".....AABBB..");
  EXPECT_EQ(row(2), "........AA..");
  draw(kTextCentre, 0, 4, "BA", 2, 9);  // (9 - 5) / 2 = 2 into the clip 2..11
  EXPECT_EQ(row(4), "....BBBAA...");
  surface.create(0, 0, 12, 8);
  draw(kTextLeft | kTextVCentre, 0, 0, "A\nB");  // 4 rows centred in 8
  EXPECT_EQ(row(1) + row(2) + row(5) + row(6), "............AA..........BBB.....................");
  draw(kTextLeft | kTextBottom, 6, 8, "A");  // ends at y = 8
  EXPECT_EQ(row(6) + row(7), "......AA..........AA....");
}

TEST_F(FontTest, ClipsAtBothEdges) {
  // Clip 3..8: the first glyph is cut at the left edge, the third at the right edge, which ends its line;
  // the next line starts again at x. A glyph wholly left of the clip is skipped.
  draw(kTextLeft, 1, 0, "BBAA\nBA", 3, 5);
  EXPECT_EQ(row(0), "...BBBBA....");
  EXPECT_EQ(row(2), "...BAA......");
  draw(kTextLeft, 0, 4, "AB", 2, 10);
  EXPECT_EQ(row(4), "..BBB.......");
}

// The module's glyph strips, read through the same parser as a picked file, against the width tables: the
// widths fill the strip, every glyph but the space has ink in its own cell, and two cells never touch.
TEST(EditorFontsTest, EveryGlyphHasInkInItsOwnCell) {
  const std::tuple<int, const int*, int, int> strips[] = {
      {kSmallFontResource, kSmallFontWidths.data(), kSmallFontWidth, kSmallFontHeight},
      {kLargeFontResource, kLargeFontWidths.data(), kLargeFontWidth, kLargeFontHeight}};
  for (const auto& [id, widths, width, height] : strips) {
    SkinBitmap strip;
    ASSERT_TRUE(strip.loadResource(id) && strip.width() == width && strip.height() == height) << id;
    ASSERT_EQ(std::accumulate(widths, widths + kFontCharacterCount, 0), width) << id;
    auto blank = [&](int x) {
      SkinColour c;
      for (int y = 0; y < height; ++y)
        if (strip.pixelColour(x, y, &c) && c.g != 0) return false;
      return true;
    };
    for (int k = 0, x0 = 0; k < kFontCharacterCount; x0 += widths[k++]) {
      bool ink = false;
      for (int x = x0; x < x0 + widths[k]; ++x) ink = ink || !blank(x);
      EXPECT_EQ(ink, k != 0) << id << ": glyph " << k;
      EXPECT_TRUE(k == 0 || blank(x0 - 1) || blank(x0)) << id << ": glyphs " << k - 1 << " and " << k << " touch";
    }
  }
}

}  // namespace
}  // namespace ulvetta
