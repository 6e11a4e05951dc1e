#include "editor/Fader.h"

#include <algorithm>

#include "editor/EditorPage.h"
#include "editor/EditorWindow.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

Fader::Fader(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y, int w, int h,
             int orientation, const SkinImage* thumb)
    : SkinControl(parent, core, page, paramId, {x, y, w, h}),
      thumb_(thumb),
      options_((orientation & (kHorizontal | kVertical)) ? orientation : kVertical) {}

EditorRect Fader::thumbRect(float position) const {
  if (!thumb_) return {};
  const int tw = thumb_->rect().w, th = thumb_->rect().h;
  if (horizontal())
    return {rect_.x + static_cast<int>(static_cast<float>(rect_.w - tw) * position + 0.5f), rect_.y, tw, th};
  return {rect_.x, rect_.y + static_cast<int>(static_cast<float>(rect_.h - th) * (1.0f - position) + 0.5f), tw,
          th};
}

float Fader::current() const { return drawn_ >= 0.0f ? drawn_ : core_->getNormalized(paramId_); }

void Fader::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  DibSurface* s = surface();
  if (!thumb_ || !s || !core_ || callerChildId == childId_ || disabled_) return;
  const float v = core_->getNormalized(paramId_);
  const EditorRect t = thumbRect(v);
  const EditorRect part = clipTo(t, clipX, clipY, clipW, clipH);
  drawn_ = v;
  if (!emptyRect(part)) thumb_->draw(s, part.x, part.y, part.w, part.h, part.x - t.x, part.y - t.y);
}

void Fader::update() {
  if (!thumb_ || !core_ || disabled_) return;
  redraw(rect_);
}

float Fader::pointerPosition(int x, int y) const {
  const int tw = thumb_->rect().w, th = thumb_->rect().h;
  const float r = horizontal() ? static_cast<float>(x - (rect_.x + tw / 2)) / static_cast<float>(rect_.w - tw)
                               : 1.0f - static_cast<float>(y - (rect_.y + th / 2)) / static_cast<float>(rect_.h - th);
  return std::clamp(r, 0.0f, 1.0f);
}

void Fader::moveTo(float position) {
  if (page_) {
    const EditorRect t = thumbRect(position);
    const EditorRect area = drawn_ >= 0.0f ? unionRect(thumbRect(drawn_), t) : t;
    page_->repaintRect(area.x, area.y, area.w, area.h, childId_);
    thumb_->draw(surface(), t.x, t.y, t.w, t.h, 0, 0);
    page_->redrawAbove(area.x, area.y, area.w, area.h, childId_);
    present(area);
  }
  drawn_ = position;
  core_->notifyHost(paramId_, position);
  notifyLinks(1);
}

bool Fader::mouse(int x, int y, int event, int modifiers) {
  if (disabled_ || !thumb_ || !core_ || !surface()) return false;
  const bool fine = (modifiers & (kModifierCtrl | kModifierShift)) != 0;
  if (isPress(event)) {
    if (!contains(x, y)) {
      hasFocus_ = captured_ = false;
      return false;
    }
    hasFocus_ = captured_ = true;
    if (fine) {
      start_ = core_->getNormalized(paramId_);
      return true;
    }
    const float r = pointerPosition(x, y);
    if (r != current()) moveTo(r);
    start_ = r;
    return true;
  }
  if (isDrag(event)) {
    if (!captured_) return false;
    const float r = pointerPosition(x, y);
    const float v = std::clamp(fine ? (r + 99.0f * start_) * 0.01f : r, 0.0f, 1.0f);
    if (v != current()) moveTo(v);
    return true;
  }
  if (isRelease(event)) captured_ = false;
  return false;
}

bool Fader::keyDown(int key) {
  if (!hasFocus_ || disabled_ || !thumb_ || !core_ || !surface() || key < kKeyPageUp || key > kKeyDown) return false;
  const float v = core_->getNormalized(paramId_);
  float position = v;
  switch (key) {
    case kKeyPageUp: position = v + 0.1f; break;
    case kKeyPageDown: position = v - 0.1f; break;
    case kKeyEnd: position = 0.0f; break;
    case kKeyHome: position = 1.0f; break;
    case kKeyUp: position = v + 0.01f; break;
    case kKeyDown: position = v - 0.01f; break;
    default: return false;  // Left and Right
  }
  core_->notifyHost(paramId_, std::clamp(position, 0.0f, 1.0f));
  update();
  notifyLinks(1);
  return true;
}

}  // namespace ulvetta
