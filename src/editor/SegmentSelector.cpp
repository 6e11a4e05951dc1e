#include "editor/SegmentSelector.h"

#include "editor/EditorWindow.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

SegmentSelector::SegmentSelector(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x,
                                 int y, int w, int h, int stripResource, int zoneCount)
    : SkinControl(parent, core, page, paramId, {x, y, w, h}), zoneCount_(zoneCount) {
  loadStrip(stripResource);
  if (zoneCount > 0) zones_.reserve(static_cast<size_t>(zoneCount));
}

void SegmentSelector::addZone(int x, int y, int w, int h, float position) {
  if (static_cast<int>(zones_.size()) < zoneCount_) zones_.push_back({{x, y, w, h}, position});
}

void SegmentSelector::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  DibSurface* s = surface();
  if (!strip_ || frameCount_ <= 0 || !s || !core_ || callerChildId == childId_ || disabled_) return;
  frame_ = frameFor(core_->getNormalized(paramId_));
  const EditorRect part = clipTo(rect_, clipX, clipY, clipW, clipH);
  if (!emptyRect(part))
    strip_->copy(s, part.x, part.y, part.w, part.h, frame_ * rect_.w + part.x - rect_.x, part.y - rect_.y);
}

void SegmentSelector::update() {
  if (core_ && !disabled_) setFrameAndPresent(core_->getNormalized(paramId_));
}

bool SegmentSelector::mouse(int x, int y, int event, int) {
  if (!isPress(event) || disabled_ || !strip_ || !core_ || !surface()) return false;
  for (const Zone& z : zones_) {
    if (x < z.rect.x || y < z.rect.y || x >= z.rect.x + z.rect.w || y >= z.rect.y + z.rect.h) continue;
    setFrameAndPresent(z.position);
    core_->notifyHost(paramId_, z.position);
    hasFocus_ = true;
    return true;
  }
  hasFocus_ = false;
  return false;
}

}  // namespace ulvetta
