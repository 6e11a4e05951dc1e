#pragma once
// The thread keyboard hook that brings keys to editors shown inside a host's dialog, whose dialog manager
// would otherwise take TAB, arrows and Enter for itself. One hook serves every attached editor window of the
// process; it is installed with the first and removed with the last. Every call takes the editor lock.
#include <windows.h>

namespace ulvetta {

// Adds window (whose user data is its EditorWindow) to the attached list, installing the hook for the
// thread that owns window when none is installed.
void attachKeyboardHook(HWND window);
// Removes the first entry equal to window; the hook goes with the last entry.
void detachKeyboardHook(HWND window);

// The hook procedure: a key press (not a release, not an auto-repeat) goes to the attached windows in order
// that still exist and sit inside the foreground window, until one uses it; a used key is swallowed.
LRESULT CALLBACK editorKeyboardHook(int code, WPARAM wParam, LPARAM lParam);

// For tests: whether the hook is installed, and how many windows are attached.
bool keyboardHookInstalled();
int attachedEditorWindows();

}  // namespace ulvetta
