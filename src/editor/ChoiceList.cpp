#include "editor/ChoiceList.h"

#include <cmath>

#include "editor/EditorPage.h"
#include "editor/EditorWindow.h"
#include "editor/SkinDraw.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

ChoiceList::ChoiceList(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y, int w,
                       int h, int listHeight)
    : SkinControl(parent, core, page, paramId, {x, y, w, h}), listHeight_(listHeight) {}

void ChoiceList::setFont(const BitmapFont* font, SkinColour colour) {
  font_ = font;
  colour_ = colour;
}

void ChoiceList::addItem(const std::string& text) { items_.push_back(text); }

bool ChoiceList::ready() const { return font_ && !font_->strip().empty() && core_ && surface() && !disabled_; }

EditorRect ChoiceList::bounds() const { return open_ ? unionRect(rect_, listRect()) : rect_; }

EditorRect ChoiceList::lineRect(int k) const {
  const int line = font_ ? font_->lineHeight() + 2 : 0;
  return {rect_.x, listRect().y + k * line, rect_.w, line};
}

void ChoiceList::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  if (!ready() || callerChildId == childId_) return;
  DibSurface* s = surface();
  const EditorRect box = clipTo(rect_, clipX, clipY, clipW, clipH);
  const int value = core_->getValue(paramId_);
  if (!emptyRect(box) && value >= 0 && value < static_cast<int>(items_.size()))
    drawClipped(rect_, box, [&] {
      drawText(s, *font_, rect_.x, rect_.y, rect_.w, rect_.h, kTextLeft | kTextVCentre, rect_.x + kTextIndent, 0,
               items_[value], colour_, 255);
    });
  const EditorRect list = listRect();
  const EditorRect clip = clipTo(list, clipX, clipY, clipW, clipH);
  if (!open_ || emptyRect(clip)) return;
  // The texts stand 3 pixels below their line's top, where the highlight starts; the last one may reach
  // below the list, where the clip cuts it.
  const int lastTop = lineRect(static_cast<int>(items_.size()) - 1).y + 3;
  drawClipped(unionRect(list, {list.x, lastTop, list.w, font_->lineHeight()}), clip, [&] {
    fillRect(s, clip.x, clip.y, clip.w, clip.h, kListColour);
    for (int k = 0; k < static_cast<int>(items_.size()); ++k) {
      const EditorRect line = lineRect(k);
      if (k == hovered_) fillRect(s, line.x, line.y, line.w, line.h, kHoverColour);
      drawText(s, *font_, list.x, list.y, list.w, list.h, kTextLeft, list.x + kTextIndent, line.y + 3, items_[k],
               k == hovered_ ? colour_ : kItemTextColour, 255);
    }
  });
}

void ChoiceList::update() {
  if (ready()) redraw(bounds());
}

void ChoiceList::setOpen(bool open) {
  open_ = open;
  captured_ = open;
  hovered_ = -1;
  moved_ = false;
  if (page_) page_->refresh(kRefreshAll);
}

void ChoiceList::hover(int y) {
  const int line = font_->lineHeight() + 2;
  const int k = static_cast<int>(std::floor(static_cast<double>(y - listRect().y) / line));
  if (k < 0 || k >= static_cast<int>(items_.size()) || k == hovered_) return;
  const EditorRect changed = hovered_ >= 0 ? unionRect(lineRect(hovered_), lineRect(k)) : lineRect(k);
  hovered_ = k;
  redraw(intersectRect(changed, listRect()));
}

bool ChoiceList::mouse(int x, int y, int event, int) {
  if (!ready()) return false;
  if (isPress(event)) {
    if (contains(x, y)) {
      setOpen(!open_);
      return true;
    }
    return open_ || captured_;
  }
  if ((isDrag(event) && captured_) || (event == kMove && open_)) {
    if (isDrag(event)) moved_ = true;
    hover(y);
    return true;
  }
  if (!isRelease(event)) return false;
  if (!open_) {
    captured_ = false;
    return false;
  }
  if (contains(x, y) && !moved_) {
    captured_ = false;
  } else if (x < rect_.x || x > rect_.x + rect_.w) {
    setOpen(false);
  } else if (hovered_ >= 0) {
    const int chosen = hovered_;
    core_->setValue(paramId_, chosen);
    setOpen(false);
  } else {
    captured_ = false;
  }
  return true;
}

}  // namespace ulvetta
