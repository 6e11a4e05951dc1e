#include "editor/PresetMenu.h"

#include <utility>

#include "editor/Appearance.h"
#include "editor/EditorWindow.h"
#include "presets/PresetFile.h"

namespace ulvetta {

namespace {

MenuItem item(std::string text, int id, bool checked = false) {
  MenuItem m;
  m.text = std::move(text);
  m.id = id;
  m.checked = checked;
  return m;
}

}  // namespace

std::vector<MenuItem> buildPresetMenu(const std::vector<std::string>& presets, bool leftToRight) {
  MenuItem quickLoad = item("&Quick Load", 0);
  for (size_t k = 0; k < presets.size(); ++k)
    quickLoad.submenu.push_back(item(presets[k], kQuickLoadFirst + static_cast<int>(k)));
  quickLoad.greyed = presets.empty();
  return {
      item("&Load Preset", kLoadPresetCommand),
      item("&Save Preset", kSavePresetCommand),
      quickLoad,
      MenuItem(),
      item("Left To Right Gradient", kLeftToRightGradient, leftToRight),
      item("Set Background Colour 1", kSetBackgroundColour1),
      item("Set Background Colour 2", kSetBackgroundColour2),
      item("Set Meter Background Colour", kSetMeterColour),
      item("Set Background Bitmap", kSetBackgroundBitmap),
  };
}

void showPresetMenu(EditorWindow& window, int x, int y, ReverbCore& core) {
  WindowHost* host = window.host();
  if (!host) return;
  const PresetFolder folder(host->presetFolder(), false);
  const std::vector<std::string> presets = folder.list();
  const int id = host->trackMenu(buildPresetMenu(presets, leftToRightChecked(&core, host)), x, y);
  if (id == kLoadPresetCommand || id == kSavePresetCommand)
    host->runPresetDialog(id == kSavePresetCommand, core, folder.directory());
  else if (id >= kQuickLoadFirst && static_cast<size_t>(id - kQuickLoadFirst) < presets.size())
    folder.load(presets[static_cast<size_t>(id - kQuickLoadFirst)], core);
  else
    runAppearanceCommand(id, window, &core);
}

}  // namespace ulvetta
