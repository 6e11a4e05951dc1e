#pragma once
// A page made of a background and an ordered list of controls. The background (everything the page draws
// itself) is rendered into a cache at each full paint, so restoring a rectangle under a control copies it
// from there and repaints only the controls below in the stacking order. Children get child ids 0, 1, 2, ...
// in order of addition; events go to them from the last added to the first.
#include <memory>
#include <vector>

#include "editor/DibSurface.h"
#include "editor/EditorPage.h"
#include "editor/SkinControl.h"

namespace ulvetta {

class SkinPanel : public EditorPage {
 public:
  SkinPanel(ReverbCore* core, EditorWindow* window);

  // Takes the control, gives it the next child id and returns it (null when control is null).
  SkinControl* addChild(std::unique_ptr<SkinControl> control);
  int nextChildId() const { return static_cast<int>(children_.size()); }
  const std::vector<std::unique_ptr<SkinControl>>& children() const { return children_; }
  void destroyControls() { children_.clear(); }

  // Renders the background into the cache, copies it to the back buffer and paints every child.
  void paint() override;
  void updateControls() override;
  void repaintRect(int x, int y, int w, int h, int childId) override;
  void redrawAbove(int x, int y, int w, int h, int childId) override;
  // Offers the event to the children from last to first, stopping at the first that uses it.
  void mouse(int x, int y, int event, int modifiers) override;
  bool keyDown(int key) override;
  void tick() override;
  void focusLost(bool lost) override;
  void refresh(int32_t) override {}
  ReverbCore* core() override { return core_; }
  EditorWindow* window() override { return window_; }

 protected:
  // Draws everything of the page that is not a control into target (a surface of the editor's size).
  virtual void paintBackground(DibSurface* target) = 0;
  bool offerMouse(int x, int y, int event, int modifiers);
  // The back buffer, or null without a window object.
  DibSurface* surface() const;
  // Restores (x, y, w, h) of the back buffer from the background cache.
  void restoreBackground(int x, int y, int w, int h);

  ReverbCore* core_;
  EditorWindow* window_;

 private:
  std::vector<std::unique_ptr<SkinControl>> children_;
  DibSurface background_;
};

}  // namespace ulvetta
