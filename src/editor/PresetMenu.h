#pragma once
// The working pages' right-click menu: the preset dialogs, a Quick Load submenu of the user's presets and the
// appearance actions, built anew each time it is shown and carried out through the window's host.
#include <string>
#include <vector>

#include "editor/WindowHost.h"

namespace ulvetta {

class EditorWindow;
class ReverbCore;

enum PresetMenuCommand : int {
  kLoadPresetCommand = 20000,
  kSavePresetCommand = 20001,
  kQuickLoadFirst = 21000,  // the k-th listed preset is kQuickLoadFirst + k
};

// The menu's items in order: "&Load Preset", "&Save Preset", the "&Quick Load" submenu (one item per name
// in presets, greyed when there is none), a separator and the five appearance items ("Left To Right
// Gradient" checked as leftToRight says).
std::vector<MenuItem> buildPresetMenu(const std::vector<std::string>& presets, bool leftToRight);

// Shows the menu at (x, y) through the window's host and carries out the choice: the dialogs through the
// host, a Quick Load item by loading that preset into core, an appearance item through its action.
// Choosing nothing does nothing; so does a window without a host.
void showPresetMenu(EditorWindow& window, int x, int y, ReverbCore& core);

}  // namespace ulvetta
