#pragma once
// A drop-up list bound to an integer parameter (the Algorithm): the box shows the current item; a press on
// the box opens the list above it, the pointer highlights a line and a release on it selects that item.
#include <string>
#include <vector>

#include "editor/BitmapFont.h"
#include "editor/SkinControl.h"

namespace ulvetta {

class ChoiceList : public SkinControl {
 public:
  static constexpr int kTextIndent = 5;  // pixels from the left edge of the box and of the list to the text
  static constexpr SkinColour kListColour{222, 222, 222, 255};
  static constexpr SkinColour kHoverColour{24, 113, 118, 255};
  static constexpr SkinColour kItemTextColour{32, 32, 32, 255};

  // The list is listHeight pixels high, one pixel above the box.
  ChoiceList(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y, int w, int h,
             int listHeight);

  void setFont(const BitmapFont* font, SkinColour colour);
  // Item k (in order of addition) stands for the value k.
  void addItem(const std::string& text);

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  void update() override;
  bool mouse(int x, int y, int event, int modifiers) override;
  // The box, and the list above it while open.
  EditorRect bounds() const override;

  bool isOpen() const { return open_; }
  int hovered() const { return hovered_; }
  EditorRect listRect() const { return {rect_.x, rect_.y - listHeight_ - 1, rect_.w, listHeight_}; }
  // Line k of the open list: line height + 2 pixels each, from the list's top.
  EditorRect lineRect(int k) const;

 private:
  bool ready() const;
  void setOpen(bool open);
  void hover(int y);

  const BitmapFont* font_ = nullptr;
  SkinColour colour_;
  int listHeight_;
  std::vector<std::string> items_;
  bool open_ = false;
  int hovered_ = -1;
};

}  // namespace ulvetta
