#pragma once
// The base of every control on an editor page: its rectangle in the back buffer, the parameter it shows, its
// child id (the stacking order on its page), an optional strip of frames, its focus, capture and disabled
// flags, and the links to the controls that redraw when it changes (a fader and its value display).
#include <cstdint>
#include <memory>
#include <vector>

#include "editor/SkinBitmap.h"
#include "editor/SkinColour.h"

namespace ulvetta {

class DibSurface;
class EditorPage;
class EditorWindow;
class ReverbCore;

// The smallest rectangle holding both (an empty one gives the other).
EditorRect unionRect(const EditorRect& a, const EditorRect& b);
// The overlap of a and b; w or h 0 when they do not overlap.
EditorRect intersectRect(const EditorRect& a, const EditorRect& b);
inline bool emptyRect(const EditorRect& r) { return r.w <= 0 || r.h <= 0; }

class SkinControl {
 public:
  // parent gives the back buffer and the window, core the parameter, page the background under the control.
  SkinControl(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, EditorRect rect);
  virtual ~SkinControl() = default;
  SkinControl(const SkinControl&) = delete;
  SkinControl& operator=(const SkinControl&) = delete;

  // Redraws the part of the control inside the clip (all -1: the whole control) into the back buffer; draws
  // nothing when callerChildId is this control's own id or the control is disabled.
  virtual void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId);
  // Redraws from the current parameter value and copies the control to the window.
  virtual void update() {}
  // Mouse event (codes of EditorWindow.h); true when the control used it.
  virtual bool mouse(int x, int y, int event, int modifiers);
  virtual bool keyDown(int key);
  virtual void tick() {}
  virtual void focusLost(bool) {}
  // Draws strip frame trunc((frames - 1) x position + 0.5) at the control's corner.
  virtual void setFrame(float position);
  // As setFrame, then copies the rectangle to the window.
  virtual void setFrameAndPresent(float position);
  virtual void disable() { disabled_ = true; }
  virtual void enable() { disabled_ = false; }
  void setZ(int z) { z_ = z; }

  // Loads the strip of frames (each as wide as the control) from a bitmap resource; false on failure.
  bool loadStrip(int resourceId);
  int frameCount() const { return frameCount_; }
  int currentFrame() const { return frame_; }

  // Link protocol: a.link(b) makes b redraw (update) when a notifies kind 1.
  void link(SkinControl* other) { links_.push_back(other); }
  void notifyLinks(int kind);

  const EditorRect& rect() const { return rect_; }
  // Everything the control may draw on (an open drop-up list reaches above its box).
  virtual EditorRect bounds() const { return rect_; }
  int paramId() const { return paramId_; }
  int childId() const { return childId_; }
  void setChildId(int id) { childId_ = id; }
  bool disabled() const { return disabled_; }
  bool hasFocus() const { return hasFocus_; }
  bool captured() const { return captured_; }

 protected:
  // The back buffer, or null when there is no window object.
  DibSurface* surface() const;
  // Copies (x, y, w, h) of the back buffer to the window.
  void present(int x, int y, int w, int h) const;
  void present(const EditorRect& r) const { present(r.x, r.y, r.w, r.h); }
  // The strip frame that shows position: trunc((frames - 1) x position + 0.5), within the strip.
  int frameFor(float position) const;
  // Draws strip frame number frame (kept as the current frame).
  void drawFrame(int frame);
  bool contains(int x, int y) const {
    return x >= rect_.x && y >= rect_.y && x < rect_.x + rect_.w && y < rect_.y + rect_.h;
  }
  // The part of area inside the paint clip (x, y, w, h); all -1 is the whole area.
  static EditorRect clipTo(const EditorRect& area, int x, int y, int w, int h);
  // Restores r from the page (background and the controls below), paints this control inside r, redraws
  // the controls above and copies r to the window.
  void redraw(const EditorRect& r);
  // Runs draw, which may touch any pixel of area, and puts back every pixel of area outside clip: text and
  // lines cannot clip themselves, and drawing twice over a pixel outside a restored rectangle darkens it.
  template <class Draw>
  void drawClipped(const EditorRect& area, const EditorRect& clip, Draw draw) {
    const bool whole = intersectRect(area, clip) == area;
    if (!whole) saveArea(area);
    draw();
    if (!whole) restoreOutside(area, clip);
  }

  EditorWindow* parent_;
  ReverbCore* core_;
  EditorPage* page_;
  int paramId_;
  EditorRect rect_;
  int childId_ = 0;
  std::unique_ptr<SkinBitmap> strip_;
  int frameCount_ = 0;
  int frame_ = -1;
  bool hasFocus_ = false;
  bool captured_ = false;
  bool moved_ = false;
  bool disabled_ = false;
  int z_ = -1;

 private:
  void saveArea(const EditorRect& area);
  void restoreOutside(const EditorRect& area, const EditorRect& clip);

  std::vector<SkinControl*> links_;
  std::vector<uint8_t> saved_;  // pixels of the area drawClipped is drawing on, row by row
  EditorRect savedArea_;
};

}  // namespace ulvetta
