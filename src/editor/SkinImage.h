#pragma once
// A picture element of a page: a bitmap resource (optionally with a mask or a tint colour) placed at a
// rectangle of the editor. Pages draw it themselves; it never receives events.
#include <memory>

#include "editor/SkinBitmap.h"
#include "editor/SkinColour.h"

namespace ulvetta {

class SkinImage {
 public:
  enum Mode : int { kCopy = 0, kMasked = 1, kTinted = 2 };

  // Loads bitmapId (and maskId when it is not 0) through the default resource lookup.
  SkinImage(int bitmapId, EditorRect rect, Mode mode = kCopy, int maskId = 0, SkinColour colour = {});
  // Shows a picture the caller loaded (a background picture from a file).
  SkinImage(std::unique_ptr<SkinBitmap> bitmap, EditorRect rect);

  // False when the bitmap (or a named mask) could not be loaded.
  bool loaded() const { return !bitmap_->empty() && (!mask_ || !mask_->empty()); }
  const EditorRect& rect() const { return rect_; }
  void moveTo(int x, int y) { rect_.x = x; rect_.y = y; }
  const SkinBitmap& bitmap() const { return *bitmap_; }

  // Draws (sx, sy, w, h) of the bitmap at (x, y) in the image's mode: copy, masked copy (nothing without a
  // mask) or tinted copy.
  void draw(DibSurface* surface, int x, int y, int w, int h, int sx, int sy) const;
  // Draws the whole image at its rectangle.
  void draw(DibSurface* surface) const { draw(surface, rect_.x, rect_.y, rect_.w, rect_.h, 0, 0); }
  // (x, y) relative to the image: inside it, and where there is a mask, on a mask grey level above 196.
  bool hitTest(int x, int y) const;

 private:
  std::unique_ptr<SkinBitmap> bitmap_;
  std::unique_ptr<SkinBitmap> mask_;
  EditorRect rect_;
  Mode mode_ = kCopy;
  SkinColour colour_;
};

}  // namespace ulvetta
