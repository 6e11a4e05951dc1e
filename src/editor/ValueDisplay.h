#pragma once
// A parameter's value as text in a small box, with in-place typed entry: a press starts editing with the
// whole text selected, digits, "-" and "." are typed at a blinking caret, Enter stores the text through the
// core and Escape or a press elsewhere drops it.
#include <string>

#include "editor/BitmapFont.h"
#include "editor/SkinControl.h"

namespace ulvetta {

class ValueDisplay : public SkinControl {
 public:
  // Pixels added on the left and right, and on the top and bottom, of the box for the area it restores.
  static constexpr int kMarginX = 8;
  static constexpr int kMarginY = 2;

  ValueDisplay(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y, int w,
               int h);

  void setFont(const BitmapFont* font, SkinColour colour);
  // Starts editing the full-precision text with all of it selected and the caret at its end.
  void beginEdit();
  // Leaves editing without storing and redraws the value.
  void endEdit();

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  void update() override;
  bool mouse(int x, int y, int event, int modifiers) override;
  bool keyDown(int key) override;
  void tick() override;
  EditorRect bounds() const override;

  bool editing() const { return editing_; }
  const std::string& text() const { return text_; }
  int caret() const { return caret_; }
  bool allSelected() const { return selectAll_; }
  bool caretShown() const { return caretVisible_; }
  // The x of the edited text's first pixel (it scrolls to keep the caret inside the box).
  int textStart() const { return textStart_; }

 private:
  bool ready() const;
  int textTop() const;
  int caretX() const;
  // Scrolls the text so that the caret stays between the box's left edge + 1 and right edge - 2.
  void keepCaretInside();
  void insert(char c);
  void erase(int index);
  // Shows the caret, restarts the blink and redraws after a key.
  void keyDone();

  const BitmapFont* font_ = nullptr;
  SkinColour colour_;
  bool editing_ = false;
  bool selectAll_ = false;
  bool caretVisible_ = false;
  int blinkTicks_ = 0;
  std::string text_;  // the text being edited
  int caret_ = 0;     // index into text_: the caret stands before this character
  int textStart_ = 0;
};

}  // namespace ulvetta
