// Text layout of the bitmap fonts: widths, alignment flags, clipping at both edges and unknown characters.
#include <gtest/gtest.h>

#include <numeric>
#include <string>

#include "editor/BitmapFont.h"
#include "editor/BmpBuilder.h"
#include "editor/EditorFonts.h"

namespace ulvetta {
namespace {

// A two-glyph font: "A" is 2 columns of grey 255, "B" 3 columns of grey 127; 2 rows high. Drawn in white at
// alpha 255 on black, A pixels become 255 and B pixels (127 + 1) x 255 / 255 = 128 of 256: 127.
class FontTest : public testing::Test {
 protected:
  void SetUp() override {
    const auto dib = test::makeDib(test::greyBitmap(5, 2, [](int x, int) { return uint8_t(x < 2 ? 255 : 127); }));
    ASSERT_TRUE(font.strip().loadDib(dib.data(), dib.size()));
    const int widths[] = {2, 3};
    font.setGlyphs("AB", widths);
    ASSERT_TRUE(surface.create(0, 0, 12, 8));
  }
  // Row y as one character per pixel: A, B or '.' for untouched black.
  std::string row(int y) const {
    std::string out;
    for (int x = 0; x < surface.width(); ++x) {
      const uint8_t v = surface.at(x, y)[0];
      out += v == 255 ? 'A' : v == 127 ? 'B' : v == 0 ? '.' : '?';
    }
    return out;
  }
  void draw(int flags, int x, int y, const char* text, int clipX = 0, int clipW = 12) {
    drawText(&surface, font, clipX, 0, clipW, 8, flags, x, y, text, {255, 255, 255, 255}, 255);
  }
  BitmapFont font{nullptr};
  DibSurface surface;
};

TEST_F(FontTest, MeasuresLinesAndSkipsUnknownCharacters) {
  EXPECT_EQ(font.textWidth("AB"), 5);
  EXPECT_EQ(font.textWidth("A\nBB\nA"), 6);
  EXPECT_EQ(font.textHeight("A\nBB\nA"), 6);
  EXPECT_EQ(font.glyphOffset('B'), 2);
  EXPECT_EQ(font.textWidth("A?zB"), 5);
  draw(kTextLeft, 1, 0, "A?B");
  EXPECT_EQ(row(0), ".AABBB......");
  EXPECT_EQ(row(1), ".AABBB......");
  EXPECT_EQ(row(2), "............");
}

TEST_F(FontTest, HorizontalAlignment) {
  draw(kTextLeft, 3, 0, "AB");
  EXPECT_EQ(row(1), "...AABBB....");
  draw(kTextRight, 10, 2, "AB\nA");
  EXPECT_EQ(row(2), ".....AABBB..");
  EXPECT_EQ(row(4), "........AA..");
  // Centred in the clip 2..11 (width 9): (9 - 5) / 2 = 2 from its left edge.
  draw(kTextCentre, 0, 6, "BA", 2, 9);
  EXPECT_EQ(row(6), "....BBBAA...");
}

TEST_F(FontTest, VerticalAlignment) {
  // Two lines (4 rows) centred in the clip height 8: they start at row 2.
  draw(kTextLeft | kTextVCentre, 0, 0, "A\nB");
  EXPECT_EQ(row(1), "............");
  EXPECT_EQ(row(2), "AA..........");
  EXPECT_EQ(row(5), "BBB.........");
  EXPECT_EQ(row(6), "............");
  // Bottom-aligned: the block ends at y = 8.
  draw(kTextLeft | kTextBottom, 6, 8, "A");
  EXPECT_EQ(row(5), "BBB.........");
  EXPECT_EQ(row(6), "......AA....");
  EXPECT_EQ(row(7), "......AA....");
}

TEST_F(FontTest, ClipsAtBothEdges) {
  // Clip 3..8: the first glyph starts left of it and is cut, the third crosses the right edge and is cut
  // there, ending its line; the next line starts again at x.
  draw(kTextLeft, 1, 0, "BBAA\nBA", 3, 5);
  EXPECT_EQ(row(0), "...BBBBA....");
  EXPECT_EQ(row(2), "...BAA......");
  // A glyph entirely left of the clip is skipped.
  draw(kTextLeft, 0, 4, "AB", 2, 10);
  EXPECT_EQ(row(4), "..BBB.......");
}

TEST(EditorFontsTest, WidthTablesFillTheirStrips) {
  EXPECT_EQ(kFontCharacterCount, 77);
  EXPECT_EQ(std::string(kFontCharacterSet).find(','), std::string(kFontCharacterSet).find('+') - 1);
  EXPECT_EQ(std::accumulate(kSmallFontWidths.begin(), kSmallFontWidths.end(), 0), kSmallFontWidth);
  EXPECT_EQ(std::accumulate(kLargeFontWidths.begin(), kLargeFontWidths.end(), 0), kLargeFontWidth);
  BitmapFont small(nullptr);
  small.setGlyphs(kFontCharacterSet, kSmallFontWidths.data());
  EXPECT_EQ(small.glyphOffset('z') + small.glyphWidth('z'), kSmallFontWidth);
  EXPECT_EQ(small.textWidth("W1"), 9 + 4);
}

}  // namespace
}  // namespace ulvetta
