#pragma once
// A small editor for the editor's tests: a real core whose meter figures the test sets and whose notifyHost
// positions it records, the editor window on a page with a plain background, and a recording host.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <optional>
#include <ostream>
#include <string>
#include <vector>

#include "editor/BitmapFont.h"
#include "editor/EditorFonts.h"
#include "editor/EditorWindow.h"
#include "editor/SkinDraw.h"
#include "editor/SkinImage.h"
#include "editor/SkinPanel.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

inline void PrintTo(const EditorRect& r, std::ostream* os) { *os << r.x << ", " << r.y << ", " << r.w << " x " << r.h; }

namespace test {

// Records what the editor copies, shows, asks and opens, and answers the choosers and the menu from its fields.
class RecordingHost : public WindowHost {
 public:
  void present(const DibSurface&, int x, int y, int w, int h) override { presented.push_back({x, y, w, h}); }
  void invalidate() override {}
  void setCapture() override {}
  void releaseCapture() override {}
  int caretBlinkTime() override { return 500; }
  void messageBox(const std::string& text) override { messages.push_back(text); }
  void openDocument(const std::string& target) override { opened.push_back(target); }
  bool chooseColour(SkinColour initial, SkinColour* chosen) override {
    asked.push_back(initial);
    if (colour) *chosen = *colour;
    return colour.has_value();
  }
  bool chooseBitmapFile(const std::string&, std::string* chosen) override { return !(*chosen = file).empty(); }
  int trackMenu(const std::vector<MenuItem>& items, int, int) override {
    menu = items;
    return answer;
  }
  void runPresetDialog(bool save, ReverbCore&, const std::string& where) override {
    dialogs.push_back((save ? "save " : "load ") + where);
  }
  std::string profilePath() override { return profile; }
  std::string moduleFolder() override { return folder; }
  std::string presetFolder() override { return folder + "Presets/"; }

  std::vector<EditorRect> presented;
  std::string profile, folder, file;  // the profile file, the module's folder, the picture chosen
  std::optional<SkinColour> colour;   // the colour chosen; none: the chooser is cancelled
  int answer = 0;                     // the menu command chosen
  std::vector<SkinColour> asked;      // the starting colour of every chooser shown
  std::vector<std::string> messages, opened, dialogs;
  std::vector<MenuItem> menu;
};

class TestCore : public ReverbCore {
 public:
  float getStatus(int32_t code) override {
    if (code == kStatusStopped) return stopped ? 1.0f : 0.0f;
    return code == kStatusLevel ? level : ReverbCore::getStatus(code);
  }
  void notifyHost(int32_t id, float position) override {
    notified.push_back(position);
    ReverbCore::notifyHost(id, position);
  }

  bool stopped = false;
  float level = 0.0f;
  std::vector<float> notified;  // every position handed to notifyHost
};

// Full refreshes repaint the page and copy it all, as a working page does while it is shown.
class PlainPage : public SkinPanel {
 public:
  static constexpr SkinColour kBackground{40, 80, 120, 255};
  using SkinPanel::SkinPanel;
  void refresh(int32_t code) override {
    if (code != kRefreshAll) return;
    ++fullRefreshes;
    paint();
    window_->presentAll();
  }
  int fullRefreshes = 0;

 protected:
  void paintBackground(DibSurface* target) override {
    fillRect(target, 0, 0, target->width(), target->height(), kBackground);
  }
};

struct EditorRig {
  EditorRig() {
    window.attach(&host);
    window.setPage(kReverbPage, &page);
    font.strip().loadResource(kSmallFontResource);
    font.setGlyphs(kFontCharacterSet, kSmallFontWidths.data());
  }
  // Adds a control (parent, core and page first) on top of the page's stack.
  template <class Control, class... Args>
  Control* add(Args... args) {
    return static_cast<Control*>(page.addChild(std::make_unique<Control>(&window, &core, &page, args...)));
  }
  // Paints the page and forgets what that presented.
  void show() {
    page.paint();
    host.presented.clear();
  }
  void mouse(int event, int x, int y, int modifiers = 0) { window.mouse(x, y, event, modifiers); }
  void keys(std::initializer_list<int> codes) {
    for (int k : codes) window.keyDown(k);
  }
  // R, G and B of a back-buffer pixel as 0xRRGGBB.
  uint32_t rgb(int x, int y) {
    const uint8_t* p = window.surface()->at(x, y);
    return p[2] << 16 | p[1] << 8 | p[0];
  }
  // A surface of the editor's size holding the plain background.
  static DibSurface background() {
    DibSurface s;
    s.create(0, 0, kEditorWidth, kEditorHeight);
    fillRect(&s, 0, 0, kEditorWidth, kEditorHeight, PlainPage::kBackground);
    return s;
  }
  // The number of back-buffer pixels in r that differ from reference.
  int differences(const DibSurface& reference, const EditorRect& r = kEditorRect) {
    int n = 0;
    for (int y = r.y; y < r.y + r.h; ++y)
      for (int x = r.x; x < r.x + r.w; ++x) n += std::memcmp(window.surface()->at(x, y), reference.at(x, y), 3) != 0;
    return n;
  }

  TestCore core;
  EditorWindow window;
  RecordingHost host;
  PlainPage page{&core, &window};
  BitmapFont font;
};

constexpr uint32_t kBackgroundRgb = 40 << 16 | 80 << 8 | 120;

}  // namespace test
}  // namespace ulvetta
