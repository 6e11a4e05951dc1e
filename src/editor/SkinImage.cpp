#include "editor/SkinImage.h"

namespace ulvetta {

SkinImage::SkinImage(int bitmapId, EditorRect rect, Mode mode, int maskId, SkinColour colour)
    : bitmap_(std::make_unique<SkinBitmap>()), rect_(rect), mode_(mode), colour_(colour) {
  bitmap_->loadResource(bitmapId);
  if (maskId != 0) {
    mask_ = std::make_unique<SkinBitmap>();
    mask_->loadResource(maskId);
  }
}

SkinImage::SkinImage(std::unique_ptr<SkinBitmap> bitmap, EditorRect rect)
    : bitmap_(bitmap ? std::move(bitmap) : std::make_unique<SkinBitmap>()), rect_(rect) {}

void SkinImage::draw(DibSurface* surface, int x, int y, int w, int h, int sx, int sy) const {
  switch (mode_) {
    case kCopy:
      bitmap_->copy(surface, x, y, w, h, sx, sy);
      break;
    case kMasked:
      if (mask_) bitmap_->maskedCopy(surface, x, y, w, h, sx, sy, mask_.get());
      break;
    case kTinted:
      bitmap_->tintedCopy(surface, x, y, w, h, sx, sy, colour_);
      break;
  }
}

bool SkinImage::hitTest(int x, int y) const {
  if (x < 0 || y < 0 || x >= rect_.w || y >= rect_.h) return false;
  if (!mask_) return true;
  if (x >= mask_->width() || y >= mask_->height()) return false;
  return mask_->grey(x, y) > 196;
}

}  // namespace ulvetta
