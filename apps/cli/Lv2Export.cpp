#include "Lv2Export.h"

#include <unistd.h>

#include <algorithm>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <system_error>
#include <vector>

#include "CliSetup.h"
#include "Lv2Turtle.h"
#include "presets/PresetFile.h"

namespace ulvetta {

namespace fs = std::filesystem;

std::string defaultLv2PresetBundle() {
  const char* home = std::getenv("HOME");
  if (home == nullptr || home[0] != '/')
    throw CliError("no LV2 folder: HOME is not set, so name the bundle folder (for example ~/.lv2/mine.lv2)");
  return std::string(home) + "/.lv2/ulvetta-presets.lv2";
}

namespace {

void writeText(const fs::path& path, const std::string& text) {
  std::ofstream out(path, std::ios::binary | std::ios::trunc);
  out << text;
  if (!out.flush()) throw CliError("cannot write " + inQuotes(path.string()) + "; no preset bundle was written");
}

}  // namespace

int exportLv2Presets(const PresetFolder& folder, const std::string& bundle) {
  std::vector<std::string> names = folder.list();
  std::sort(names.begin(), names.end());
  std::vector<lv2::PresetValues> presets;
  for (const std::string& name : names) {
    StateBytes record;
    lv2::PresetValues values;
    if (folder.read(name, record) == PresetResult::Ok &&
        lv2::presetFromRecord(name, record.data(), record.size(), &values))
      presets.push_back(values);
  }
  if (presets.empty())
    throw CliError("the folder " + inQuotes(folder.directory()) + " holds no presets, so no bundle was written");

  // The bundle is built beside its final name and moved into place whole.
  const fs::path target = fs::path(bundle).lexically_normal();
  const fs::path parent = target.has_parent_path() ? target.parent_path() : fs::path(".");
  const std::string stem = target.filename().string();
  const fs::path building = parent / ("." + stem + ".new-" + std::to_string(::getpid()));
  const fs::path old = parent / ("." + stem + ".old-" + std::to_string(::getpid()));
  std::error_code ec;
  fs::create_directories(parent, ec);
  fs::remove_all(building, ec);
  if (!fs::create_directory(building, ec))
    throw CliError("cannot create the folder " + inQuotes(building.string()) + "; no preset bundle was written");
  try {
    writeText(building / "manifest.ttl", lv2::userManifestTtl(presets));
    for (size_t i = 0; i < presets.size(); ++i)
      writeText(building / lv2::userPresetFileName(i), lv2::userPresetTtl(presets[i]));
    const bool replacing = fs::exists(target, ec);
    if (replacing) fs::rename(target, old);
    fs::rename(building, target);
    if (replacing) fs::remove_all(old, ec);
  } catch (const fs::filesystem_error&) {
    fs::remove_all(building, ec);
    throw CliError("cannot put the preset bundle at " + inQuotes(target.string()) + "; nothing was changed there");
  } catch (...) {
    fs::remove_all(building, ec);
    throw;
  }
  return static_cast<int>(presets.size());
}

}  // namespace ulvetta
