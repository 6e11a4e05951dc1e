#pragma once
// What the editor asks of the platform that shows it: copying the back buffer to the window, repaint
// requests, mouse capture, the caret period, messages, choosers, the preset menu and dialogs, and where the
// appearance file, the module's folder and the presets are. The Win32 property page implements it over its
// dialog window; the headless host renders into the back buffer and answers from a script.
#include <string>
#include <vector>

#include "editor/DibSurface.h"
#include "editor/SkinColour.h"

namespace ulvetta {

class ReverbCore;

// One entry of a popup menu: a command, a separator (empty text) or a submenu (non-empty submenu).
struct MenuItem {
  std::string text;
  int id = 0;  // command id; 0 for separators and submenus
  bool checked = false;
  bool greyed = false;
  std::vector<MenuItem> submenu;
};

class WindowHost {
 public:
  virtual ~WindowHost() = default;

  // Copies (x, y, w, h) of the back buffer to the same place in the window.
  virtual void present(const DibSurface& surface, int x, int y, int w, int h) = 0;
  // Marks the whole window for repainting; the window system's next paint event redraws it.
  virtual void invalidate() = 0;
  virtual void setCapture() = 0;
  virtual void releaseCapture() = 0;
  // The user's caret blink period in milliseconds.
  virtual int caretBlinkTime() = 0;
  // An information message with an OK button, owned by no window.
  virtual void messageBox(const std::string& text) = 0;
  // Opens a web address or a document with the user's program for it; failures are not reported.
  virtual void openDocument(const std::string& target) = 0;
  // The colour chooser, starting at initial; false when the user cancels.
  virtual bool chooseColour(SkinColour initial, SkinColour* chosen) = 0;
  // The file chooser for a bitmap ("Bitmaps", *.bmp, title "Select Bitmap"), starting at initial; false
  // when the user cancels. chosen receives the full path.
  virtual bool chooseBitmapFile(const std::string& initial, std::string* chosen) = 0;
  // Shows the popup menu centred horizontally on (x, y), in editor pixels, and returns the chosen command
  // id, or 0 when nothing was chosen.
  virtual int trackMenu(const std::vector<MenuItem>& items, int x, int y) = 0;
  // Runs the Save Preset As (save true) or Load Preset dialog on the presets in folder.
  virtual void runPresetDialog(bool save, ReverbCore& core, const std::string& folder) = 0;
  // The appearance profile file; empty when there is none (the defaults show and the menu actions write
  // nothing).
  virtual std::string profilePath() = 0;
  // The module's folder with a trailing separator: background pictures are looked up and copied here.
  virtual std::string moduleFolder() = 0;
  // The folder of the user's presets.
  virtual std::string presetFolder() = 0;
};

}  // namespace ulvetta
