#include "editor/headless/HeadlessHost.h"

#include "editor/EditorWindow.h"
#include "presets/PresetFile.h"

namespace ulvetta {
namespace {

// A scripted save replaces an existing preset, as a user answering yes would.
class AlwaysReplace : public OverwriteQuestion {
 public:
  bool confirmOverwrite(const std::string&, const std::string&) override { return true; }
};

}  // namespace

HeadlessHost::HeadlessHost(std::string profilePath, std::string moduleFolder, std::string presetFolder)
    : profilePath_(std::move(profilePath)),
      moduleFolder_(std::move(moduleFolder)),
      presetFolder_(std::move(presetFolder)) {}

void HeadlessHost::show(EditorWindow* window) {
  window_ = window;
  if (!window) return;
  window->attach(this);
  window->setActive(true);
  invalid_ = true;
}

void HeadlessHost::settle() {
  if (!invalid_ || !window_) return;
  invalid_ = false;
  window_->paint(0, 0, kEditorWidth, kEditorHeight);
}

void HeadlessHost::present(const DibSurface&, int x, int y, int w, int h) { presented_.push_back({x, y, w, h}); }

HeadlessHost::Answer HeadlessHost::next() {
  if (answers_.empty()) return {};
  Answer a = std::move(answers_.front());
  answers_.pop_front();
  return a;
}

bool HeadlessHost::chooseColour(SkinColour, SkinColour* chosen) {
  const Answer a = next();
  if (a.kind != Answer::kColour) return false;
  *chosen = a.colour;
  return true;
}

bool HeadlessHost::chooseBitmapFile(const std::string&, std::string* chosen) {
  Answer a = next();
  if (a.kind != Answer::kFile) return false;
  *chosen = std::move(a.file);
  return true;
}

int HeadlessHost::trackMenu(const std::vector<MenuItem>& items, int x, int y) {
  menus_.push_back({items, x, y});
  const Answer a = next();
  return a.kind == Answer::kMenu ? a.menuId : 0;
}

void HeadlessHost::runPresetDialog(bool save, ReverbCore& core, const std::string& folder) {
  dialogs_.push_back({save, folder});
  const Answer a = next();
  if (a.kind != Answer::kFile) return;
  const PresetFolder presets(folder);
  if (save) {
    AlwaysReplace replace;
    presets.save(a.file, core, replace);
  } else {
    presets.load(a.file, core);
  }
}

}  // namespace ulvetta
