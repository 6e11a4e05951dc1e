#include "editor/ValueDisplay.h"

#include <algorithm>

#include "editor/EditorPage.h"
#include "editor/EditorWindow.h"
#include "editor/SkinDraw.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

namespace {

constexpr SkinColour kEditBackground{255, 255, 255, 255};
constexpr SkinColour kEditText{0, 0, 0, 255};
constexpr int kDefaultBlinkMilliseconds = 500;

// The character a key types into the text, or 0.
char typedCharacter(int key) {
  if (key >= '0' && key <= '9') return static_cast<char>(key);
  if (key >= 96 && key <= 105) return static_cast<char>('0' + key - 96);  // numeric pad digits
  if (key == 109 || key == 189) return '-';                               // pad minus, minus
  if (key == 110 || key == 188 || key == 190) return '.';                 // pad decimal, comma, period
  return 0;
}

}  // namespace

ValueDisplay::ValueDisplay(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y,
                           int w, int h)
    : SkinControl(parent, core, page, paramId, {x, y, w, h}) {}

void ValueDisplay::setFont(const BitmapFont* font, SkinColour colour) {
  font_ = font;
  colour_ = colour;
}

bool ValueDisplay::ready() const { return font_ && !font_->strip().empty() && core_ && surface() && !disabled_; }

EditorRect ValueDisplay::bounds() const {
  return {rect_.x - kMarginX, rect_.y - kMarginY, rect_.w + 2 * kMarginX, rect_.h + 2 * kMarginY};
}

int ValueDisplay::textTop() const { return rect_.y + (rect_.h - font_->lineHeight()) / 2; }

int ValueDisplay::caretX() const { return textStart_ + font_->textWidth(std::string_view(text_).substr(0, caret_)); }

void ValueDisplay::keepCaretInside() {
  const int left = rect_.x + 1, right = rect_.x + rect_.w - 2;
  const int x = caretX();
  if (x < left) textStart_ += left - x;
  if (x > right) textStart_ -= x - right;
}

void ValueDisplay::beginEdit() {
  if (!ready()) return;
  char buffer[ReverbCore::kTextCapacity];
  text_ = core_->getValueText(paramId_, buffer, true);
  editing_ = selectAll_ = caretVisible_ = true;
  blinkTicks_ = 0;
  caret_ = static_cast<int>(text_.size());
  textStart_ = rect_.x + (rect_.w - font_->textWidth(text_)) / 2;
  keepCaretInside();
  redraw(bounds());
}

void ValueDisplay::endEdit() {
  editing_ = selectAll_ = false;
  redraw(bounds());
}

void ValueDisplay::paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) {
  if (!ready() || callerChildId == childId_) return;
  const EditorRect area = bounds();
  const EditorRect clip = clipTo(area, clipX, clipY, clipW, clipH);
  if (emptyRect(clip)) return;
  DibSurface* s = surface();
  drawClipped(area, clip, [&] {
    if (!editing_) {
      char buffer[ReverbCore::kTextCapacity];
      drawText(s, *font_, rect_.x, rect_.y, rect_.w, rect_.h, kTextCentre | kTextVCentre, 0, 0,
               core_->getValueText(paramId_, buffer, false), colour_, 255);
      return;
    }
    const int top = textTop(), height = font_->lineHeight();
    fillRect(s, area.x, area.y, area.w, area.h, kEditBackground);
    if (selectAll_) {
      const EditorRect r = intersectRect(area, {textStart_ - 1, top - 1, font_->textWidth(text_) + 2, height + 2});
      fillRect(s, r.x, r.y, r.w, r.h, colour_);
    }
    drawText(s, *font_, rect_.x, rect_.y, rect_.w, rect_.h, kTextLeft, textStart_, top, text_, kEditText, 255);
    if (caretVisible_ && !selectAll_) drawLine(s, caretX(), top - 1, caretX(), top + height, colour_);
  });
}

void ValueDisplay::update() {
  if (ready()) redraw(bounds());
}

bool ValueDisplay::mouse(int x, int y, int event, int) {
  if (!ready()) return false;
  if (!isPress(event)) return false;
  if (!contains(x, y)) {
    if (!editing_) return false;
    endEdit();
    return true;
  }
  if (!editing_) {
    beginEdit();
    return true;
  }
  selectAll_ = false;
  const int end = textStart_ + font_->textWidth(text_);
  if (x < textStart_) {
    caret_ = 0;
  } else if (x >= end) {
    caret_ = static_cast<int>(text_.size());
  } else {
    int left = textStart_;
    caret_ = 0;
    while (caret_ < static_cast<int>(text_.size()) && left + font_->glyphWidth(static_cast<unsigned char>(text_[caret_])) <= x)
      left += font_->glyphWidth(static_cast<unsigned char>(text_[caret_++]));
  }
  keyDone();
  return true;
}

void ValueDisplay::insert(char c) {
  if (selectAll_) {
    text_.clear();
    caret_ = 0;
    selectAll_ = false;
  }
  text_.insert(text_.begin() + caret_, c);
  ++caret_;
}

void ValueDisplay::erase(int index) {
  if (selectAll_) {
    text_.clear();
    caret_ = 0;
    selectAll_ = false;
    return;
  }
  if (index < 0 || index >= static_cast<int>(text_.size())) return;
  text_.erase(text_.begin() + index);
  if (index < caret_) --caret_;
}

bool ValueDisplay::keyDown(int key) {
  if (!ready() || !editing_) return false;
  const int length = static_cast<int>(text_.size());
  switch (key) {
    case kKeyBackspace: erase(caret_ - 1); break;
    case kKeyDelete: erase(caret_); break;
    case kKeyEnter:
      core_->setValueText(paramId_, text_.c_str());
      endEdit();
      notifyLinks(1);
      return true;
    case kKeyEscape: endEdit(); return true;
    case kKeyEnd:
    case kKeyHome:
    case kKeyLeft:
    case kKeyRight:
      caret_ = key == kKeyEnd ? length : key == kKeyHome ? 0 : key == kKeyLeft ? std::max(caret_ - 1, 0)
                                                                               : std::min(caret_ + 1, length);
      selectAll_ = false;
      break;
    default:
      if (const char c = typedCharacter(key)) {
        insert(c);
        break;
      }
      return true;  // consumed, nothing typed
  }
  keyDone();
  return true;
}

void ValueDisplay::keyDone() {
  blinkTicks_ = 0;
  caretVisible_ = true;
  keepCaretInside();
  redraw(bounds());
}

void ValueDisplay::tick() {
  if (!ready() || !editing_) return;
  WindowHost* host = parent_->host();
  const int period = (host ? host->caretBlinkTime() : kDefaultBlinkMilliseconds) / kTickMilliseconds;
  if (++blinkTicks_ < period) return;
  caretVisible_ = !caretVisible_;
  blinkTicks_ = 0;
  redraw(bounds());
}

}  // namespace ulvetta
