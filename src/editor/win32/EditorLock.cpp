#include "editor/win32/EditorLock.h"

#include <new>

namespace ulvetta {

namespace {
CRITICAL_SECTION* g_lock = nullptr;
}  // namespace

bool createEditorLock() {
  if (g_lock) return true;
  g_lock = new (std::nothrow) CRITICAL_SECTION;
  if (!g_lock) return false;
  InitializeCriticalSection(g_lock);
  return true;
}

void deleteEditorLock() {
  if (!g_lock) return;
  DeleteCriticalSection(g_lock);
  delete g_lock;
  g_lock = nullptr;
}

EditorLockHold::EditorLockHold() : held_(g_lock) {
  if (held_) EnterCriticalSection(held_);
}

EditorLockHold::~EditorLockHold() {
  if (held_) LeaveCriticalSection(held_);
}

}  // namespace ulvetta
