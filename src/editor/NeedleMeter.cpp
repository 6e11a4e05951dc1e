#include "editor/NeedleMeter.h"

#include <algorithm>
#include <cmath>

#include "editor/EditorPage.h"
#include "editor/SkinDraw.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

NeedleMeter::NeedleMeter(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId)
    : SkinControl(parent, core, page, paramId, kClip) {}

void NeedleMeter::setGeometry(int pivotX, int pivotY, int clipX, int clipY, int clipW, int clipH, int length,
                              float alpha, SkinColour colour) {
  pivotX_ = pivotX;
  pivotY_ = pivotY;
  rect_ = {clipX, clipY, clipW, clipH};
  length_ = length;
  alpha_ = alpha;
  colour_ = colour;
}

NeedleMeter::Needle NeedleMeter::needleAt(float level) const {
  constexpr double kPi = 3.14159265358979323846;
  // In double precision: at level 0.5 the angle is a right angle and the tip must land on the pivot's column.
  const double alpha = alpha_;
  const double theta = (kPi - 2.0 * alpha) * (1.0 - static_cast<double>(level)) + alpha;
  Needle n;
  n.tipX = static_cast<int>(pivotX_ + std::cos(theta) * length_);
  n.tipY = static_cast<int>(pivotY_ - std::sin(theta) * length_);
  // The needle starts at the face area's lower edge, on the line from the pivot to the tip.
  n.baseY = rect_.y + rect_.h;
  const int dx = n.tipX - pivotX_, dy = pivotY_ - n.tipY;
  const double slope = dy == 0 ? 1.0 : static_cast<double>(dx) / dy;
  n.baseX = pivotX_ + static_cast<int>(std::round(slope * (pivotY_ - n.baseY)));
  // Both ends inclusive, plus the column and row after them: the anti-aliased line shares each step with
  // the next pixel, which rounding can touch even at an end point.
  const int left = std::min(n.baseX, n.tipX), top = std::min(n.baseY, n.tipY);
  n.bounds = {left, top, std::max(n.baseX, n.tipX) - left + 2, std::max(n.baseY, n.tipY) - top + 2};
  return n;
}

EditorRect NeedleMeter::bounds() const { return shown_ ? unionRect(rect_, drawn_.bounds) : rect_; }

void NeedleMeter::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  DibSurface* s = surface();
  if (!s || !core_ || !page_ || callerChildId == childId_ || disabled_) return;
  const Needle n = needleAt(level_ < kFloor ? 0.0f : level_);
  const EditorRect clip = clipTo(n.bounds, clipX, clipY, clipW, clipH);
  if (!emptyRect(clip))
    drawClipped(n.bounds, clip, [&] { drawLine(s, n.baseX, n.baseY, n.tipX, n.tipY, colour_); });
  drawn_ = n;
  shown_ = true;
}

void NeedleMeter::tick() {
  if (!surface() || !core_ || !page_ || disabled_) return;
  if (core_->getStatus(kStatusStopped) != 0.0f) {
    level_ *= kFallBack;
    if (level_ < kFloor) level_ = 0.0f;
  } else {
    level_ = core_->getStatus(kStatusLevel);
  }
  const Needle n = needleAt(level_ < kFloor ? 0.0f : level_);
  if (shown_ && n.tipX == drawn_.tipX && n.tipY == drawn_.tipY) return;  // the same picture
  redraw(shown_ ? unionRect(drawn_.bounds, n.bounds) : n.bounds);
}

}  // namespace ulvetta
