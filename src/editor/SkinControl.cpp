#include "editor/SkinControl.h"

#include <algorithm>
#include <cstring>

#include "editor/EditorPage.h"
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

int SkinControl::frameFor(float position) const {
  return std::clamp(static_cast<int>(static_cast<float>(frameCount_ - 1) * position + 0.5f), 0,
                    std::max(frameCount_ - 1, 0));
}

void SkinControl::setFrame(float position) {
  if (!strip_ || frameCount_ <= 0) return;
  drawFrame(frameFor(position));
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

EditorRect SkinControl::clipTo(const EditorRect& area, int x, int y, int w, int h) {
  if (x == -1 && y == -1 && w == -1 && h == -1) return area;
  return intersectRect(area, {x, y, w, h});
}

void SkinControl::redraw(const EditorRect& r) {
  if (!page_ || !surface() || emptyRect(r)) return;
  page_->repaintRect(r.x, r.y, r.w, r.h, childId_);
  paint(r.x, r.y, r.w, r.h, -1);
  page_->redrawAbove(r.x, r.y, r.w, r.h, childId_);
  present(r);
}

void SkinControl::saveArea(const EditorRect& area) {
  DibSurface* s = surface();
  savedArea_ = s ? intersectRect(area, {0, 0, s->width(), s->height()}) : EditorRect{};
  if (emptyRect(savedArea_)) return;
  const size_t row = static_cast<size_t>(savedArea_.w) * 4;
  saved_.resize(row * savedArea_.h);
  for (int j = 0; j < savedArea_.h; ++j)
    std::memcpy(&saved_[row * j], s->at(savedArea_.x, savedArea_.y + j), row);
}

void SkinControl::restoreOutside(const EditorRect& area, const EditorRect& clip) {
  DibSurface* s = surface();
  if (!s || emptyRect(savedArea_) || !(intersectRect(area, savedArea_) == savedArea_)) return;
  const EditorRect& a = savedArea_;
  const EditorRect in = intersectRect(a, clip);
  const size_t row = static_cast<size_t>(a.w) * 4;
  for (int j = 0; j < a.h; ++j) {
    const uint8_t* from = &saved_[row * j];
    uint8_t* to = s->at(a.x, a.y + j);
    const int y = a.y + j;
    if (emptyRect(in) || y < in.y || y >= in.y + in.h) {
      std::memcpy(to, from, row);
      continue;
    }
    std::memcpy(to, from, static_cast<size_t>(in.x - a.x) * 4);
    const int right = in.x + in.w - a.x;
    std::memcpy(to + right * 4, from + right * 4, static_cast<size_t>(a.w - right) * 4);
  }
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
