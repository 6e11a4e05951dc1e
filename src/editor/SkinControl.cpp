#include "editor/SkinControl.h"

#include <algorithm>

#include "editor/EditorWindow.h"

namespace ulvetta {

SkinControl::SkinControl(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, EditorRect rect)
    : parent_(parent), core_(core), page_(page), paramId_(paramId), rect_(rect) {}

void SkinControl::paint(int, int, int, int, int callerChildId) {
  if (callerChildId == childId_ || disabled_ || frame_ < 0) return;
  drawFrame(frame_);
}

bool SkinControl::mouse(int, int, int, int) { return false; }
bool SkinControl::keyDown(int) { return false; }

void SkinControl::setFrame(float position) {
  if (!strip_ || frameCount_ <= 0) return;
  drawFrame(std::clamp(static_cast<int>(static_cast<float>(frameCount_ - 1) * position + 0.5f), 0,
                       frameCount_ - 1));
}

void SkinControl::drawFrame(int frame) {
  DibSurface* s = surface();
  if (!strip_ || !s) return;
  frame_ = frame;
  strip_->copy(s, rect_.x, rect_.y, rect_.w, rect_.h, frame * rect_.w, 0);
}

void SkinControl::setFrameAndPresent(float position) {
  setFrame(position);
  if (surface()) present(rect_);
}

bool SkinControl::loadStrip(int resourceId) {
  strip_ = std::make_unique<SkinBitmap>();
  if (!strip_->loadResource(resourceId) || rect_.w <= 0) {
    strip_.reset();
    frameCount_ = 0;
    return false;
  }
  frameCount_ = strip_->width() / rect_.w;
  return frameCount_ > 0;
}

void SkinControl::notifyLinks(int kind) {
  if (kind != 1) return;
  for (SkinControl* c : links_) c->update();
}

DibSurface* SkinControl::surface() const {
  if (!parent_ || !parent_->valid()) return nullptr;
  return parent_->surface();
}

void SkinControl::present(int x, int y, int w, int h) const {
  if (parent_) parent_->present(x, y, w, h);
}

EditorRect unionRect(const EditorRect& a, const EditorRect& b) {
  if (emptyRect(a)) return b;
  if (emptyRect(b)) return a;
  const int left = std::min(a.x, b.x), top = std::min(a.y, b.y);
  const int right = std::max(a.x + a.w, b.x + b.w), bottom = std::max(a.y + a.h, b.y + b.h);
  return {left, top, right - left, bottom - top};
}

EditorRect intersectRect(const EditorRect& a, const EditorRect& b) {
  const int left = std::max(a.x, b.x), top = std::max(a.y, b.y);
  const int right = std::min(a.x + a.w, b.x + b.w), bottom = std::min(a.y + a.h, b.y + b.h);
  if (right <= left || bottom <= top) return {left, top, 0, 0};
  return {left, top, right - left, bottom - top};
}

}  // namespace ulvetta
