#pragma once
// The editor's process-wide lock: guards the keyboard hook and its list of attached windows, and is held
// while a mouse press, a focus loss or a hooked key is handled, so that those never interleave. Taken before
// the core's lock, never while holding it.
#include <windows.h>

namespace ulvetta {

// Made when the module is attached to the process; false when it could not be allocated.
bool createEditorLock();
// Deleted when the module is detached.
void deleteEditorLock();

// Holds the editor lock for its lifetime (nothing when the lock was never made).
class EditorLockHold {
 public:
  EditorLockHold();
  ~EditorLockHold();
  EditorLockHold(const EditorLockHold&) = delete;
  EditorLockHold& operator=(const EditorLockHold&) = delete;

 private:
  CRITICAL_SECTION* held_;
};

}  // namespace ulvetta
