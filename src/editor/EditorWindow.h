#pragma once
// The editor's window-independent side: the 750 x 167 back buffer, the table of the three pages (reverb,
// filter, about), the current page, and the events a platform delivers (mouse with its codes and modifiers,
// keys, the 50 ms tick, focus, paint). Every event goes to the current page; a platform host copies the back
// buffer to its window through WindowHost.
#include <array>

#include "editor/DibSurface.h"
#include "editor/SkinColour.h"
#include "editor/WindowHost.h"

namespace ulvetta {

class EditorPage;

constexpr int kEditorWidth = 750;
constexpr int kEditorHeight = 167;
constexpr EditorRect kEditorRect{0, 0, kEditorWidth, kEditorHeight};
constexpr int kTickMilliseconds = 50;

// Page slots.
constexpr int kReverbPage = 0;
constexpr int kFilterPage = 1;
constexpr int kAboutPage = 2;

// Mouse event codes.
enum MouseEvent : int {
  kLeftPress = 0,
  kRightPress = 1,
  kLeftDrag = 2,
  kRightDrag = 3,
  kLeftRelease = 4,
  kRightRelease = 5,
  kLeftDoubleClick = 6,
  kRightDoubleClick = 7,
  kMove = 8,
};
// Modifier bits of a mouse event.
constexpr int kModifierCtrl = 1;
constexpr int kModifierShift = 2;

// Virtual-key codes the editor handles.
constexpr int kKeyBackspace = 8;
constexpr int kKeyTab = 9;
constexpr int kKeyEnter = 13;
constexpr int kKeyEscape = 27;
constexpr int kKeyPageUp = 33;
constexpr int kKeyPageDown = 34;
constexpr int kKeyEnd = 35;
constexpr int kKeyHome = 36;
constexpr int kKeyLeft = 37;
constexpr int kKeyUp = 38;
constexpr int kKeyRight = 39;
constexpr int kKeyDown = 40;
constexpr int kKeyDelete = 46;

inline bool isPress(int event) {
  return event == kLeftPress || event == kRightPress || event == kLeftDoubleClick || event == kRightDoubleClick;
}
inline bool isDrag(int event) { return event == kLeftDrag || event == kRightDrag; }
inline bool isRelease(int event) { return event == kLeftRelease || event == kRightRelease; }

class EditorWindow {
 public:
  static constexpr int kPageCount = 3;

  EditorWindow();
  EditorWindow(const EditorWindow&) = delete;
  EditorWindow& operator=(const EditorWindow&) = delete;

  // False when the back buffer could not be created.
  bool valid() const { return !surface_.empty(); }

  // The host that shows the editor; null while no window exists (drawing then stays in the back buffer).
  void attach(WindowHost* host) { host_ = host; }
  void detach() { host_ = nullptr; }
  WindowHost* host() const { return host_; }

  DibSurface* surface() { return &surface_; }
  void setActive(bool active) { active_ = active; }
  bool isActive() const { return active_; }

  // Pages register themselves into their slot; an empty slot makes every forwarded event a no-op.
  void setPage(int slot, EditorPage* page);
  EditorPage* page(int slot) const;
  EditorPage* current() const { return page(current_); }

  // Events, each forwarded to the current page. A press takes the mouse capture and a release gives it
  // back (through the host).
  bool keyDown(int key);
  void mouse(int x, int y, int event, int modifiers);
  // The paint event: the current page repaints the back buffer, then (x, y, w, h) is copied to the window.
  void paint(int x, int y, int w, int h);
  void updateControls();
  void tick();
  void focusLost(bool lost);

  // Makes index current when the current slot is filled, paints that page and copies the whole editor.
  void showPage(int index);
  int currentPage() const { return current_; }

  // Copies (x, y, w, h) of the back buffer to the window; nothing without a host.
  void present(int x, int y, int w, int h);
  void presentAll() { present(0, 0, kEditorWidth, kEditorHeight); }
  // Asks the host for a full repaint through its paint event.
  void invalidate();

 private:
  DibSurface surface_;
  std::array<EditorPage*, kPageCount> pages_{};
  WindowHost* host_ = nullptr;
  bool active_ = false;
  int current_ = kReverbPage;
};

}  // namespace ulvetta
