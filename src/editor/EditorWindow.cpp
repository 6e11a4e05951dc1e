#include "editor/EditorWindow.h"

#include "editor/EditorPage.h"

namespace ulvetta {

EditorWindow::EditorWindow() { surface_.create(0, 0, kEditorWidth, kEditorHeight); }

void EditorWindow::setPage(int slot, EditorPage* page) {
  if (slot >= 0 && slot < kPageCount) pages_[slot] = page;
}

EditorPage* EditorWindow::page(int slot) const {
  return slot >= 0 && slot < kPageCount ? pages_[slot] : nullptr;
}

bool EditorWindow::keyDown(int key) {
  EditorPage* p = current();
  return p && p->keyDown(key);
}

void EditorWindow::mouse(int x, int y, int event, int modifiers) {
  if (host_ && (event == kLeftPress || event == kRightPress)) host_->setCapture();
  if (EditorPage* p = current()) p->mouse(x, y, event, modifiers);
  if (host_ && isRelease(event)) host_->releaseCapture();
}

void EditorWindow::paint(int x, int y, int w, int h) {
  EditorPage* p = current();
  if (!p || !valid()) return;
  p->paint();
  present(x, y, w, h);
}

void EditorWindow::updateControls() {
  if (EditorPage* p = current()) p->updateControls();
}

void EditorWindow::tick() {
  if (EditorPage* p = current()) p->tick();
}

void EditorWindow::focusLost(bool lost) {
  if (EditorPage* p = current()) p->focusLost(lost);
}

void EditorWindow::showPage(int index) {
  if (!current() || index < 0 || index >= kPageCount) return;
  current_ = index;
  if (EditorPage* p = current()) p->paint();
  presentAll();
}

void EditorWindow::present(int x, int y, int w, int h) {
  if (host_ && valid()) host_->present(surface_, x, y, w, h);
}

void EditorWindow::invalidate() {
  if (host_) host_->invalidate();
}

}  // namespace ulvetta
