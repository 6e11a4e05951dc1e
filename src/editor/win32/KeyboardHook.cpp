#include "editor/win32/KeyboardHook.h"

#include <algorithm>
#include <vector>

#include "editor/EditorWindow.h"
#include "editor/win32/EditorLock.h"

namespace ulvetta {

namespace {

HHOOK g_hook = nullptr;
// Attached windows in order of attachment; the same window may appear more than once.
std::vector<HWND>& attached() {
  static std::vector<HWND> windows;
  return windows;
}

constexpr LPARAM kReleaseBits = (LPARAM{1} << 31) | (LPARAM{1} << 28);  // transition state, extended release

}  // namespace

void attachKeyboardHook(HWND window) {
  EditorLockHold hold;
  if (!g_hook)
    g_hook = SetWindowsHookExW(WH_KEYBOARD, editorKeyboardHook, nullptr, GetWindowThreadProcessId(window, nullptr));
  attached().push_back(window);
}

void detachKeyboardHook(HWND window) {
  EditorLockHold hold;
  std::vector<HWND>& list = attached();
  const auto it = std::find(list.begin(), list.end(), window);
  if (it != list.end()) list.erase(it);
  if (list.empty() && g_hook) {
    UnhookWindowsHookEx(g_hook);
    g_hook = nullptr;
  }
}

LRESULT CALLBACK editorKeyboardHook(int code, WPARAM wParam, LPARAM lParam) {
  EditorLockHold hold;
  if (code >= 0 && (lParam & kReleaseBits) == 0 && (lParam & 0xFFFF) == 1) {
    const HWND foreground = GetForegroundWindow();
    // A copy: a key may close an editor, which detaches its window from the list.
    const std::vector<HWND> windows = attached();
    for (HWND w : windows) {
      if (!IsWindow(w) || !IsChild(foreground, w)) continue;
      auto* editor = reinterpret_cast<EditorWindow*>(GetWindowLongPtrW(w, GWLP_USERDATA));
      if (editor && editor->keyDown(static_cast<int>(wParam & 0xFFFF))) return 1;
    }
  }
  return CallNextHookEx(g_hook, code, wParam, lParam);
}

bool keyboardHookInstalled() {
  EditorLockHold hold;
  return g_hook != nullptr;
}

int attachedEditorWindows() {
  EditorLockHold hold;
  return static_cast<int>(attached().size());
}

}  // namespace ulvetta
