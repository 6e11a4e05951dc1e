#pragma once
// A fader: a masked thumb sliding along a horizontal or vertical track that shows and sets one parameter's
// 0..1 position. A press jumps the thumb under the pointer; with Ctrl or Shift held the drag is a hundred
// times finer; Page Up/Down, Home, End, Up and Down step it while it has the focus.
#include "editor/SkinControl.h"
#include "editor/SkinImage.h"

namespace ulvetta {

class Fader : public SkinControl {
 public:
  enum Orientation : int { kHorizontal = 1, kVertical = 2 };

  // thumb belongs to the page and gives the thumb's size through its rectangle; an orientation without
  // either bit is vertical.
  Fader(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y, int w, int h,
        int orientation, const SkinImage* thumb);

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  void update() override;
  bool mouse(int x, int y, int event, int modifiers) override;
  bool keyDown(int key) override;

  bool horizontal() const { return (options_ & kHorizontal) != 0; }
  // Where the thumb stands at position (0..1): the top of a vertical track is the maximum.
  EditorRect thumbRect(float position) const;

 private:
  // The position under the pointer, clamped to 0..1.
  float pointerPosition(int x, int y) const;
  // Moves the thumb to position, redrawing the union of the old and new thumb, then sets the parameter.
  void moveTo(float position);
  float current() const;

  const SkinImage* thumb_;
  int options_;
  float drawn_ = -1.0f;  // the position last drawn; negative before the first paint
  float start_ = 0.0f;   // the position at the press, the anchor of a fine drag
};

}  // namespace ulvetta
