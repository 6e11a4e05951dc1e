#pragma once
// Colours and rectangles of the editor's drawing layer.
#include <cstdint>

namespace ulvetta {

// A drawing colour: R, G, B and the opacity A (255 opaque).
struct SkinColour {
  uint8_t r = 0, g = 0, b = 0, a = 255;
};

// A rectangle in editor pixels from the top left of the editor area.
struct EditorRect {
  int32_t x = 0, y = 0, w = 0, h = 0;
};

inline bool operator==(const EditorRect& l, const EditorRect& r) {
  return l.x == r.x && l.y == r.y && l.w == r.w && l.h == r.h;
}

}  // namespace ulvetta
