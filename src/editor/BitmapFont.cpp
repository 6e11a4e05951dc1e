#include "editor/BitmapFont.h"

#include <algorithm>

namespace ulvetta {

void BitmapFont::setGlyphs(std::string_view characterSet, const int* widths) {
  width_.fill(0);
  offset_.fill(0);
  if (!widths) return;
  int position = 0;
  for (size_t k = 0; k < characterSet.size(); ++k) {
    unsigned char c = static_cast<unsigned char>(characterSet[k]);
    width_[c] = widths[k];
    offset_[c] = position;
    position += widths[k];
  }
}

int BitmapFont::textWidth(std::string_view text) const {
  int widest = 0, line = 0;
  for (char ch : text) {
    if (ch == '\n') {
      line = 0;
      continue;
    }
    line += width_[static_cast<unsigned char>(ch)];
    widest = std::max(widest, line);
  }
  return widest;
}

int BitmapFont::textHeight(std::string_view text) const {
  return lineHeight() * (1 + static_cast<int>(std::count(text.begin(), text.end(), '\n')));
}

void drawText(DibSurface* surface, const BitmapFont& font, int clipX, int clipY, int clipW, int clipH, int flags,
              int x, int y, std::string_view text, SkinColour colour, int alpha) {
  if (!surface || surface->empty() || font.strip().empty()) return;
  const int lineHeight = font.lineHeight();
  int top = y;
  if (flags & kTextVCentre)
    top = clipY + (clipH - font.textHeight(text)) / 2;
  else if (flags & kTextBottom)
    top = y - font.textHeight(text);
  const int clipRight = clipX + clipW;

  size_t lineStart = 0;
  while (lineStart <= text.size()) {
    size_t lineEnd = std::min(text.find('\n', lineStart), text.size());
    std::string_view line = text.substr(lineStart, lineEnd - lineStart);
    int pen = x;
    if (flags & kTextCentre)
      pen = clipX + (clipW - font.textWidth(line)) / 2;
    else if (flags & kTextRight)
      pen = x - font.textWidth(line);
    for (char ch : line) {
      const unsigned char c = static_cast<unsigned char>(ch);
      const int w = font.glyphWidth(c);
      const int left = pen;
      pen += w;
      if (w == 0 || pen <= clipX) continue;
      const int cut = std::max(0, clipX - left);
      const int visible = std::min(pen, clipRight) - (left + cut);
      if (visible > 0)
        font.strip().tintedCopyAlpha(surface, left + cut, top, visible, lineHeight, font.glyphOffset(c) + cut, 0,
                                     colour, alpha);
      if (pen > clipRight) break;
    }
    top += lineHeight;
    lineStart = lineEnd + 1;
  }
}

}  // namespace ulvetta
