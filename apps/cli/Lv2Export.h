// `ulvetta presets export-lv2`: the user presets of a folder as an LV2 preset bundle for the plugin.
#pragma once

#include <string>

namespace ulvetta {

class PresetFolder;

// The default bundle: $HOME/.lv2/ulvetta-presets.lv2 (where LV2 hosts look for a user's bundles).
std::string defaultLv2PresetBundle();

// Writes every valid preset of folder into bundle (a manifest and one file per preset), replacing a bundle
// that is already there only once the new one is complete. Returns the number of presets written; throws
// CliError when the bundle cannot be written.
int exportLv2Presets(const PresetFolder& folder, const std::string& bundle);

}  // namespace ulvetta
