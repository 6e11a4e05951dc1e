#include "editor/StatusBar.h"

#include <algorithm>
#include <cmath>

#include "editor/SkinDraw.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

StatusBar::StatusBar(EditorWindow* parent, ReverbCore* core, EditorPage* page, int x, int y, int w, int h,
                     int statusCode, SkinColour colour)
    : SkinControl(parent, core, page, -1, {x, y, w, h}), statusCode_(statusCode), colour_(colour) {}

void StatusBar::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  DibSurface* s = surface();
  if (!s || !core_ || callerChildId == childId_ || disabled_) return;
  const EditorRect bar = clipTo({rect_.x, rect_.y, length_, rect_.h}, clipX, clipY, clipW, clipH);
  if (!emptyRect(bar)) fillRect(s, bar.x, bar.y, bar.w, bar.h, colour_);
  shown_ = true;
}

void StatusBar::tick() {
  if (!surface() || !core_ || !page_ || disabled_) return;
  const double figure = static_cast<double>(core_->getStatus(statusCode_));
  // round() rounds halves away from zero.
  const int length = static_cast<int>(std::clamp(std::round(rect_.w * figure), 0.0, static_cast<double>(rect_.w)));
  if (shown_ && length == length_) return;
  length_ = length;
  redraw(rect_);
}

}  // namespace ulvetta
