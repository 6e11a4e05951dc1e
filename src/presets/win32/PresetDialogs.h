#pragma once
// The Save Preset As and Load Preset dialogs (resources 1010 and 1011) over a folder of preset files: a
// simple combo box of the presets with Delete, confirm and Cancel. Browsing the Load dialog applies each
// preset as its name is picked or typed; Cancel there restores the settings from before the dialog.
//
// Threads: the window thread of the owner; the core's own lock covers every state call.
#include <windows.h>

#include <string>

namespace ulvetta {

class ReverbCore;

// Control and dialog ids of the resource script.
enum PresetDialogIds : int {
  kSavePresetDialog = 1010,
  kLoadPresetDialog = 1011,
  kPresetCombo = 168,
  kPresetDelete = 169,
  kPresetSaveLabel = 170,
};

// Runs a dialog modally over owner. name receives the last preset name when it ends. Returns 1 (confirmed)
// or 2 (cancelled); 0 when the dialog could not be created, after telling the user so.
int runSavePresetDialog(HWND owner, const std::string& folder, const std::string& note, ReverbCore& core,
                        std::string* name);
int runLoadPresetDialog(HWND owner, const std::string& folder, const std::string& note, ReverbCore& core,
                        std::string* name);

// The name the last dialog of the process ended with; empty until one has.
std::string lastPresetName();

}  // namespace ulvetta
