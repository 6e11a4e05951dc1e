#include "editor/Appearance.h"

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <filesystem>
#include <limits>
#include <system_error>
#include <utility>

#include "editor/EditorPage.h"
#include "editor/EditorWindow.h"
#include "editor/SkinDraw.h"
#include "filter/ParamTable.h"
#include "filter/ReverbCore.h"
#include "platform/ProfileFile.h"

namespace ulvetta {

namespace {

constexpr char kBack1[] = "Back1";
constexpr char kBack2[] = "Back2";
constexpr char kMeter[] = "Meter";
constexpr char kLeftToRight[] = "LeftToRight";
constexpr char kBitmap[] = "Bitmap";
constexpr char kBitmapRefused[] = "Sorry, bitmap could not be loaded";

// The settings of the group the core's Algorithm belongs to, in the host's profile file.
class GroupSettings {
 public:
  GroupSettings(ReverbCore* core, WindowHost* host)
      : file_(host ? host->profilePath() : std::string()),
        suffix_(appearanceSuffix(core ? core->getValue(kAlgorithm) : -1)) {}

  bool exists() const { return !file_.path().empty(); }
  std::string read(const char* key) const { return file_.read(kAppearanceSection, key + suffix_); }
  void write(const char* key, const std::string& value) const {
    file_.write(kAppearanceSection, key + suffix_, value);
  }
  SkinColour colour(const char* key, SkinColour fallback) const {
    const std::string text = read(key);
    return text.empty() ? fallback : parseColour(text);
  }

 private:
  ProfileFile file_;
  std::string suffix_;
};

// A picture value with a folder separator is a path; a bare name lives in the module's folder. "/" counts as
// well as "\": it is the separator on Linux and also separates folders in a Windows path.
std::string picturePath(const std::string& value, WindowHost* host) {
  if (value.find_first_of("/\\") != std::string::npos) return value;
  return host->moduleFolder() + value;
}

std::string fileName(const std::string& path) {
  const size_t cut = path.find_last_of("/\\");
  return cut == std::string::npos ? path : path.substr(cut + 1);
}

void refreshCurrentPage(EditorWindow& window) {
  if (EditorPage* page = window.current()) page->refresh(kRefreshAll);
}

void chooseColour(EditorWindow& window, ReverbCore* core, const char* key, SkinColour fallback,
                  bool dropsPicture) {
  const GroupSettings settings(core, window.host());
  SkinColour chosen;
  if (settings.exists() && window.host()->chooseColour(settings.colour(key, fallback), &chosen)) {
    settings.write(key, colourText(chosen));
    if (dropsPicture) settings.write(kBitmap, "");
  }
  refreshCurrentPage(window);
}

}  // namespace

const char* appearanceSuffix(int32_t algorithm) {
  if (algorithm >= 0 && algorithm <= 2) return "a";
  if (algorithm >= 3 && algorithm <= 5) return "b";
  if (algorithm == 6 || algorithm == 7) return "c";
  return "";
}

SkinColour parseColour(const std::string& text) {
  size_t i = 0;
  while (i < text.size() && (text[i] == ' ' || (text[i] >= '\t' && text[i] <= '\r'))) ++i;
  bool negative = false;
  if (i < text.size() && (text[i] == '+' || text[i] == '-')) negative = text[i++] == '-';
  int64_t magnitude = 0;
  for (; i < text.size() && text[i] >= '0' && text[i] <= '9'; ++i)
    magnitude = std::min<int64_t>(magnitude * 10 + (text[i] - '0'), int64_t{1} << 32);
  const int64_t value = std::clamp<int64_t>(negative ? -magnitude : magnitude,
                                            std::numeric_limits<int32_t>::min(),
                                            std::numeric_limits<int32_t>::max());
  const uint32_t bits = static_cast<uint32_t>(value);
  return {static_cast<uint8_t>(bits), static_cast<uint8_t>(bits >> 8), static_cast<uint8_t>(bits >> 16), 255};
}

std::string colourText(SkinColour colour) {
  return std::to_string(colour.r + 256 * colour.g + 65536 * colour.b);
}

void loadAppearance(AppearanceSet& set, ReverbCore* core, WindowHost* host) {
  set.background.reset();
  const GroupSettings settings(core, host);
  set.meter = settings.colour(kMeter, kDefaultMeter);
  const std::string picture = settings.read(kBitmap);
  if (!picture.empty()) {
    auto bitmap = std::make_unique<SkinBitmap>();
    if (bitmap->loadFile(picturePath(picture, host), kEditorWidth, kEditorHeight))
      set.background = std::make_unique<SkinImage>(std::move(bitmap), kEditorRect);
  }
  const std::string direction = settings.read(kLeftToRight);
  set.leftToRight = direction.empty() || direction[0] != '0';
  set.back1 = settings.colour(kBack1, kDefaultBack1);
  set.back2 = settings.colour(kBack2, kDefaultBack2);
}

void drawAppearanceBackground(const AppearanceSet& set, DibSurface* target) {
  if (!target || target->empty()) return;
  if (set.background) {
    set.background->draw(target);
    return;
  }
  const int steps = set.leftToRight ? kEditorWidth : kEditorHeight;
  for (int k = 0; k < steps; ++k) {
    const double t = static_cast<double>(k) / steps;
    auto mix = [t](uint8_t a, uint8_t b) {
      return static_cast<uint8_t>(std::trunc(a * (1.0 - t) + b * t));
    };
    const SkinColour c{mix(set.back1.r, set.back2.r), mix(set.back1.g, set.back2.g),
                       mix(set.back1.b, set.back2.b), 255};
    if (set.leftToRight)
      fillRect(target, k, 0, 1, kEditorHeight, c);
    else
      fillRect(target, 0, k, kEditorWidth, 1, c);
  }
}

bool leftToRightChecked(ReverbCore* core, WindowHost* host) {
  return GroupSettings(core, host).read(kLeftToRight) != "0";
}

void setGradientDirection(EditorWindow& window, ReverbCore* core) {
  const GroupSettings settings(core, window.host());
  if (settings.exists()) settings.write(kLeftToRight, leftToRightChecked(core, window.host()) ? "0" : "1");
  refreshCurrentPage(window);
}

void chooseBackground1(EditorWindow& window, ReverbCore* core) {
  chooseColour(window, core, kBack1, kDefaultBack1, true);
}

void chooseBackground2(EditorWindow& window, ReverbCore* core) {
  chooseColour(window, core, kBack2, kDefaultBack2, true);
}

void chooseMeterColour(EditorWindow& window, ReverbCore* core) {
  chooseColour(window, core, kMeter, kDefaultMeter, false);
}

void chooseBackgroundBitmap(EditorWindow& window, ReverbCore* core) {
  WindowHost* host = window.host();
  const GroupSettings settings(core, host);
  std::string chosen;
  if (settings.exists() && host->chooseBitmapFile(settings.read(kBitmap), &chosen)) {
    SkinBitmap check;
    if (!check.loadFile(chosen, kEditorWidth, kEditorHeight)) {
      host->messageBox(kBitmapRefused);
      return;
    }
    // A file of that name already in the module's folder is kept, and the stored name then refers to it.
    const std::string name = fileName(chosen);
    std::error_code ignored;
    std::filesystem::copy_file(std::filesystem::u8path(chosen),
                               std::filesystem::u8path(host->moduleFolder() + name),
                               std::filesystem::copy_options::none, ignored);
    settings.write(kBitmap, name);
  }
  refreshCurrentPage(window);
}

bool runAppearanceCommand(int id, EditorWindow& window, ReverbCore* core) {
  using Action = void (*)(EditorWindow&, ReverbCore*);
  static constexpr std::pair<int, Action> kActions[] = {
      {kSetBackgroundColour1, chooseBackground1}, {kSetBackgroundColour2, chooseBackground2},
      {kLeftToRightGradient, setGradientDirection}, {kSetMeterColour, chooseMeterColour},
      {kSetBackgroundBitmap, chooseBackgroundBitmap}};
  for (const auto& [command, action] : kActions) {
    if (command != id) continue;
    action(window, core);
    return true;
  }
  return false;
}

}  // namespace ulvetta
