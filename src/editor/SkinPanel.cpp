#include "editor/SkinPanel.h"

#include <cstring>

#include "editor/EditorWindow.h"

namespace ulvetta {

SkinPanel::SkinPanel(ReverbCore* core, EditorWindow* window) : core_(core), window_(window) {}

SkinControl* SkinPanel::addChild(std::unique_ptr<SkinControl> control) {
  if (!control) return nullptr;
  control->setChildId(nextChildId());
  children_.push_back(std::move(control));
  return children_.back().get();
}

DibSurface* SkinPanel::surface() const {
  if (!window_ || !window_->valid()) return nullptr;
  return window_->surface();
}

void SkinPanel::paint() {
  DibSurface* s = surface();
  if (!s) return;
  if (background_.width() != s->width() || background_.height() != s->height())
    if (!background_.create(0, 0, s->width(), s->height())) return;
  paintBackground(&background_);
  std::memcpy(s->pixels(), background_.pixels(), static_cast<size_t>(s->stride()) * s->height());
  for (auto& c : children_) c->paint(-1, -1, -1, -1, -1);
}

void SkinPanel::restoreBackground(int x, int y, int w, int h) {
  DibSurface* s = surface();
  if (!s || background_.empty()) return;
  const EditorRect r = intersectRect({x, y, w, h}, {0, 0, s->width(), s->height()});
  for (int j = r.y; j < r.y + r.h; ++j)
    std::memcpy(s->at(r.x, j), background_.at(r.x, j), static_cast<size_t>(r.w) * 4);
}

void SkinPanel::updateControls() {
  for (auto& c : children_) c->update();
}

void SkinPanel::repaintRect(int x, int y, int w, int h, int childId) {
  restoreBackground(x, y, w, h);
  const EditorRect clip{x, y, w, h};
  for (auto& c : children_) {
    if (c->childId() >= childId) break;
    if (!emptyRect(intersectRect(clip, c->bounds()))) c->paint(x, y, w, h, childId);
  }
}

void SkinPanel::redrawAbove(int x, int y, int w, int h, int childId) {
  const EditorRect clip{x, y, w, h};
  for (auto& c : children_)
    if (c->childId() > childId && !emptyRect(intersectRect(clip, c->bounds()))) c->paint(x, y, w, h, childId);
}

bool SkinPanel::offerMouse(int x, int y, int event, int modifiers) {
  for (auto it = children_.rbegin(); it != children_.rend(); ++it)
    if ((*it)->mouse(x, y, event, modifiers)) return true;
  return false;
}

void SkinPanel::mouse(int x, int y, int event, int modifiers) { offerMouse(x, y, event, modifiers); }

bool SkinPanel::keyDown(int key) {
  for (auto it = children_.rbegin(); it != children_.rend(); ++it)
    if ((*it)->keyDown(key)) return true;
  return false;
}

void SkinPanel::tick() {
  for (auto& c : children_) c->tick();
}

void SkinPanel::focusLost(bool lost) {
  for (auto& c : children_) c->focusLost(lost);
}

}  // namespace ulvetta
