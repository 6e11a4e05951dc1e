#pragma once
// Writes the Turtle files of the LV2 bundle (manifest, plugin description, factory presets) and of a bundle
// of user presets, all from the parameter table, so the description cannot drift from the plugin.
#include <array>
#include <cstdint>
#include <string>
#include <vector>

#include "filter/ParamTable.h"

namespace ulvetta::lv2 {

// A preset: its name and the value of every parameter in steps, by id.
struct PresetValues {
  std::string name;
  std::array<int32_t, kParamCount> steps{};
};

// The eight factory presets: each algorithm with the values it starts with.
std::vector<PresetValues> factoryPresets();
// The values of a settings record; false when the bytes are not one.
bool presetFromRecord(const std::string& name, const uint8_t* record, size_t size, PresetValues* out);

// A Turtle number: decimal notation with a point, never an exponent.
std::string turtleNumber(double value);
// A string literal with quotes, backslashes and control characters escaped.
std::string turtleString(const std::string& text);

// The plugin bundle: manifest.ttl (the plugin in binary, its X11 user interface in uiBinary unless that is
// empty, the factory presets), the plugin description, and the factory presets' file.
std::string manifestTtl(const std::string& binary, const std::string& uiBinary);
std::string pluginTtl();
std::string factoryPresetsTtl();

// A bundle of user presets for the plugin: its manifest naming every preset, and the file of one preset.
std::string userPresetUri(const std::string& name);
std::string userPresetFileName(size_t index);
std::string userManifestTtl(const std::vector<PresetValues>& presets);
std::string userPresetTtl(const PresetValues& preset);
// One preset's description under uri, without the prefix lines.
std::string presetTtl(const PresetValues& preset, const std::string& uri);

}  // namespace ulvetta::lv2
