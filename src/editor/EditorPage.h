#pragma once
// One page of the editor (reverb, filter or about) as the window and the controls see it: painting into the
// back buffer, restoring a rectangle under a control, routing events, and the core it edits.
#include <cstdint>

namespace ulvetta {

class ReverbCore;
class EditorWindow;

class EditorPage {
 public:
  virtual ~EditorPage() = default;

  // Paints the whole page into the back buffer (nothing is copied to the window).
  virtual void paint() = 0;
  // Every control redraws from the current values and copies itself to the window.
  virtual void updateControls() = 0;
  // Restores (x, y, w, h) to the page background and every control added before childId.
  virtual void repaintRect(int x, int y, int w, int h, int childId) = 0;
  // Paints the controls added after childId that overlap (x, y, w, h).
  virtual void redrawAbove(int x, int y, int w, int h, int childId) = 0;
  virtual void mouse(int x, int y, int event, int modifiers) = 0;
  // True when the key was used.
  virtual bool keyDown(int key) = 0;
  virtual void tick() = 0;
  virtual void focusLost(bool lost) = 0;
  // 10000: reload the appearance and repaint everything; 1001..1099: one parameter changed.
  virtual void refresh(int32_t code) = 0;
  virtual ReverbCore* core() = 0;
  virtual EditorWindow* window() = 0;
};

}  // namespace ulvetta
