#pragma once
// A button drawn from a strip of two frames (normal, pressed) masked over its page. A press on the mask shows
// the pressed frame while the pointer stays on it; releasing there sends (id, 1.0) to the button's target.
#include "editor/SkinControl.h"
#include "editor/SkinImage.h"

namespace ulvetta {

// What a push button sets when clicked (the about page for its return button).
class PushButtonTarget {
 public:
  virtual ~PushButtonTarget() = default;
  virtual void set(int id, float value) = 0;
};

class PushButton : public SkinControl {
 public:
  // bitmapId holds the two frames side by side, each rect.w x rect.h; maskId their grey-level mask.
  PushButton(EditorWindow* parent, EditorPage* page, int id, EditorRect rect, int bitmapId, int maskId,
             PushButtonTarget* target);

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  bool mouse(int x, int y, int event, int modifiers) override;
  bool pressed() const { return pressed_; }

 private:
  bool hit(int x, int y) const { return image_.hitTest(x - rect_.x, y - rect_.y); }
  // Redraws the button in the given frame when it changes and copies it to the window.
  void show(bool pressed);

  SkinImage image_;
  PushButtonTarget* target_;
  bool pressed_ = false;
};

}  // namespace ulvetta
