#include "editor/PushButton.h"

#include "editor/EditorPage.h"
#include "editor/EditorWindow.h"

namespace ulvetta {

PushButton::PushButton(EditorWindow* parent, EditorPage* page, int id, EditorRect rect, int bitmapId, int maskId,
                       PushButtonTarget* target)
    : SkinControl(parent, nullptr, page, id, rect),
      image_(bitmapId, rect, SkinImage::kMasked, maskId),
      target_(target) {}

void PushButton::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  DibSurface* s = surface();
  if (callerChildId == childId_ || disabled_ || !s || !image_.loaded()) return;
  const EditorRect r = clipTo(rect_, clipX, clipY, clipW, clipH);
  if (emptyRect(r)) return;
  const int frame = pressed_ ? 1 : 0;
  image_.draw(s, r.x, r.y, r.w, r.h, frame * rect_.w + r.x - rect_.x, r.y - rect_.y);
}

void PushButton::show(bool pressed) {
  if (pressed == pressed_) return;
  pressed_ = pressed;
  redraw(rect_);
}

bool PushButton::mouse(int x, int y, int event, int) {
  if (disabled_ || !image_.loaded()) return false;
  if (isPress(event)) {
    if (!hit(x, y)) return false;
    captured_ = true;
    show(true);
    return true;
  }
  if (!captured_) return false;
  if (isDrag(event)) {
    show(hit(x, y));
    return true;
  }
  if (!isRelease(event)) return false;
  show(false);
  captured_ = false;
  if (hit(x, y) && target_) target_->set(paramId_, 1.0f);
  notifyLinks(1);
  return true;
}

}  // namespace ulvetta
