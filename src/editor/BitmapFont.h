#pragma once
// A bitmap font: a strip of white-on-black glyphs side by side and the width and strip position of each
// character, drawn tinted into the back buffer by drawText.
#include <array>
#include <string_view>

#include "editor/SkinBitmap.h"

namespace ulvetta {

class BitmapFont {
 public:
  explicit BitmapFont(ResourceLookup lookup = defaultResourceLookup()) : strip_(lookup) {}

  SkinBitmap& strip() { return strip_; }
  const SkinBitmap& strip() const { return strip_; }

  // The k-th character of characterSet gets widths[k] pixels, at the sum of the widths before it; every other
  // character gets width 0. widths holds one entry per character of the set.
  void setGlyphs(std::string_view characterSet, const int* widths);

  int glyphWidth(unsigned char c) const { return width_[c]; }
  int glyphOffset(unsigned char c) const { return offset_[c]; }
  // Pixels: the widest line (lines are separated by character 10), and the line height times the line count.
  int textWidth(std::string_view text) const;
  int textHeight(std::string_view text) const;
  int lineHeight() const { return strip_.height(); }

 private:
  SkinBitmap strip_;
  std::array<int, 256> width_{};
  std::array<int, 256> offset_{};
};

// drawText flags.
enum TextFlags : int {
  kTextLeft = 1,      // lines start at x
  kTextCentre = 2,    // each line centred in the clip width
  kTextRight = 4,     // each line ends at x
  kTextVCentre = 16,  // the block centred in the clip height
  kTextBottom = 32,   // the block ends at y
};

// Draws text in colour at alpha (0..255). Glyphs left of the clip's left edge are skipped (the first visible
// one cut at the edge); a glyph crossing the right edge is cut there and ends its line.
void drawText(DibSurface* surface, const BitmapFont& font, int clipX, int clipY, int clipW, int clipH, int flags,
              int x, int y, std::string_view text, SkinColour colour, int alpha);

}  // namespace ulvetta
