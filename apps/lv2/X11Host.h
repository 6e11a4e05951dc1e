#pragma once
// The editor's window host on X11, for the LV2 plugin's user interface: a 750 x 167 child window of the host's
// widget, the back buffer copied with XPutImage, pointer and key events mapped to the editor's codes, and the
// preset menu as a small popup drawn with the editor's own font. There are no colour or file choosers and no
// preset dialogs here (LV2 hosts keep presets themselves); those menu items do nothing.
#include <memory>
#include <string>

#include "editor/BitmapFont.h"
#include "editor/WindowHost.h"

namespace ulvetta {

class EditorWindow;

class X11Host : public WindowHost {
 public:
  // Opens its own connection to the display; parent 0 makes a top-level window. configFolder (with a trailing
  // separator) holds the appearance file and background pictures.
  X11Host(unsigned long parent, std::string configFolder, std::string presetFolder);
  ~X11Host() override;  // closes the display connection
  X11Host(const X11Host&) = delete;
  X11Host& operator=(const X11Host&) = delete;

  // False when the display could not be opened or has no 24-bit true-colour visual.
  bool ok() const;
  unsigned long window() const;
  // Shows the editor in the window; the host must outlive the editor window's use of it.
  void show(EditorWindow* editor);
  // Handles every pending X event. False once the window was destroyed.
  bool processEvents();

  void present(const DibSurface& surface, int x, int y, int w, int h) override;
  void invalidate() override { invalid_ = true; }
  void setCapture() override {}      // X grabs the pointer for the window while a button is held
  void releaseCapture() override {}
  int caretBlinkTime() override { return 500; }
  void messageBox(const std::string& text) override;
  void openDocument(const std::string& target) override;
  bool chooseColour(SkinColour, SkinColour*) override { return false; }
  bool chooseBitmapFile(const std::string&, std::string*) override { return false; }
  int trackMenu(const std::vector<MenuItem>& items, int x, int y) override;
  void runPresetDialog(bool, ReverbCore&, const std::string&) override {}
  std::string profilePath() override { return configFolder_ + "Ulvetta.ini"; }
  std::string moduleFolder() override { return configFolder_; }
  std::string presetFolder() override { return presetFolder_; }

 private:
  // The X11 side (display, window, graphics context, visual) and the event handling, kept out of this header
  // so that Xlib's macros never meet the rest of the code.
  struct X;
  // A press or release (an XButtonEvent) as the editor's mouse event, with double clicks told apart.
  void button(const void* event, bool press);

  std::unique_ptr<X> x_;
  EditorWindow* editor_ = nullptr;
  BitmapFont menuFont_;
  std::string configFolder_, presetFolder_;
  bool invalid_ = false;
};

}  // namespace ulvetta
