#pragma once
// The editor's window host on Windows: shows the back buffer in the property page's dialog window and turns
// the window's messages into editor events (the 50 ms timer, mouse codes with capture, keys, focus, paint and
// palette messages). The choosers, message boxes, the preset menu and dialogs are the system's own.
//
// Threads: everything runs on the thread that owns the window.
#include <windows.h>

#include <string>

#include "editor/WindowHost.h"

namespace ulvetta {

class EditorWindow;

class Win32WindowHost : public WindowHost {
 public:
  static constexpr UINT_PTR kTimerId = 1;

  Win32WindowHost();
  ~Win32WindowHost() override;
  Win32WindowHost(const Win32WindowHost&) = delete;
  Win32WindowHost& operator=(const Win32WindowHost&) = delete;

  // The editor whose back buffer is shown, and the window it is shown in (null while none exists).
  void setEditor(EditorWindow* editor) { editor_ = editor; }
  void setWindow(HWND window) { window_ = window; }
  HWND window() const { return window_; }

  // The editor's handling of one window message; the result the dialog procedure returns.
  LRESULT handleMessage(UINT message, WPARAM wParam, LPARAM lParam);

  void present(const DibSurface& surface, int x, int y, int w, int h) override;
  void invalidate() override;
  void setCapture() override;
  void releaseCapture() override;
  int caretBlinkTime() override;
  void messageBox(const std::string& text) override;
  void openDocument(const std::string& target) override;
  bool chooseColour(SkinColour initial, SkinColour* chosen) override;
  bool chooseBitmapFile(const std::string& initial, std::string* chosen) override;
  int trackMenu(const std::vector<MenuItem>& items, int x, int y) override;
  void runPresetDialog(bool save, ReverbCore& core, const std::string& folder) override;
  // The module path with everything from its last "." replaced by ".ini".
  std::string profilePath() override;
  std::string moduleFolder() override;
  // "Presets\" in the module's folder.
  std::string presetFolder() override;

 private:
  // The palette for a display of bits per pixel (made on first use), or null where none is needed.
  HPALETTE paletteFor(HDC dc, int bits);
  // Selects and realises the palette in the window; true when colours changed and the window was redrawn.
  bool realisePalette();
  void mouse(int event, WPARAM wParam, LPARAM lParam);

  EditorWindow* editor_ = nullptr;
  HWND window_ = nullptr;
  HPALETTE palette_ = nullptr;
  int paletteBits_ = 0;
};

}  // namespace ulvetta
