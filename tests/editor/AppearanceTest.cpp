// Appearance settings and the preset menu against real files in a folder of their own: gradient pixels
// derived by hand from the default colours, the menu actions' writes, pictures refused and copied, and the
// preset menu's Quick Load submenu.
#include <filesystem>
#include <fstream>
#include <iterator>
#include <optional>
#include <random>

#include "editor/Appearance.h"
#include "editor/BmpBuilder.h"
#include "editor/EditorRig.h"
#include "editor/PresetMenu.h"
#include "platform/ProfileFile.h"
#include "presets/PresetFile.h"

namespace ulvetta {
namespace {

namespace fs = std::filesystem;

// Answers the choosers and the menu from the test, records what was asked.
class ScriptedHost : public test::RecordingHost {
 public:
  std::string profilePath() override { return profile; }
  std::string moduleFolder() override { return folder; }
  std::string presetFolder() override { return presets; }
  bool chooseColour(SkinColour initial, SkinColour* chosen) override {
    asked.push_back(initial);
    if (colour) *chosen = *colour;
    return colour.has_value();
  }
  bool chooseBitmapFile(const std::string&, std::string* chosen) override {
    *chosen = file;
    return !file.empty();
  }
  void messageBox(const std::string& text) override { messages.push_back(text); }
  int trackMenu(const std::vector<MenuItem>& items, int, int) override {
    menu = items;
    return answer;
  }
  void runPresetDialog(bool save, ReverbCore&, const std::string& where) override {
    dialogs.push_back((save ? "save " : "load ") + where);
  }

  std::string profile, folder, presets, file;
  std::optional<SkinColour> colour;
  int answer = 0;
  std::vector<SkinColour> asked;
  std::vector<std::string> messages, dialogs;
  std::vector<MenuItem> menu;
};

uint32_t rgbOf(SkinColour c) { return c.r << 16 | c.g << 8 | c.b; }
uint32_t rgbAt(const DibSurface& s, int x, int y) { return s.at(x, y)[2] << 16 | s.at(x, y)[1] << 8 | s.at(x, y)[0]; }

struct AppearanceTest : ::testing::Test {
  void SetUp() override {
    std::random_device seed;
    dir = fs::temp_directory_path() / ("ulvetta-appearance-" + std::to_string(seed()));
    fs::create_directories(dir / "module");
    fs::create_directories(dir / "elsewhere");
    host.profile = (dir / "module" / "Ulvetta.ini").string();
    host.folder = (dir / "module").string() + "/";
    host.presets = (dir / "module" / "Presets").string() + "/";
    rig.window.attach(&host);
  }
  void TearDown() override { fs::remove_all(dir); }

  std::string read(const std::string& key) { return ProfileFile(host.profile).read(kAppearanceSection, key); }
  void write(const std::string& key, const std::string& value) {
    ASSERT_TRUE(ProfileFile(host.profile).write(kAppearanceSection, key, value));
  }
  // A 24-bit picture of one colour.
  std::string picture(const fs::path& path, int height, SkinColour colour) {
    test::BmpLayout layout;
    layout.width = kEditorWidth;
    layout.height = height;
    layout.bits = 24;
    layout.colours = 0;
    const uint8_t bgr[3] = {colour.b, colour.g, colour.r};
    layout.pixel = [bgr](int, int, int channel) { return bgr[channel]; };
    const std::vector<uint8_t> bytes = test::makeFile(layout);
    std::ofstream(path, std::ios::binary).write(reinterpret_cast<const char*>(bytes.data()), bytes.size());
    return path.string();
  }
  AppearanceSet load() {
    AppearanceSet set;
    loadAppearance(set, &rig.core, &host);
    return set;
  }
  DibSurface drawn(const AppearanceSet& set) {
    DibSurface s;
    s.create(0, 0, kEditorWidth, kEditorHeight);
    drawAppearanceBackground(set, &s);
    return s;
  }

  test::EditorRig rig;
  ScriptedHost host;
  fs::path dir;
};

// Defaults 19, 23, 35 -> 15, 33, 36. Column 375 (t = 1/2): 17, 28, 35.5 -> 35. Column 749 (t = 749/750):
// (19 + 15 x 749) / 750 = 15.005, (23 + 33 x 749) / 750 = 32.99, (35 + 36 x 749) / 750 = 35.999, so 15, 32, 35.
TEST_F(AppearanceTest, DefaultGradientWithoutAProfileFile) {
  for (const std::string& profile : {std::string(), host.profile}) {  // no file named, a file not there
    host.profile = profile;
    const AppearanceSet set = load();
    EXPECT_TRUE(set.leftToRight);
    EXPECT_EQ(rgbOf(set.meter), 0x1A1A1Au);
    EXPECT_FALSE(set.background);
    const DibSurface s = drawn(set);
    for (int y : {0, 166}) {
      EXPECT_EQ(rgbAt(s, 0, y), 0x131723u);
      EXPECT_EQ(rgbAt(s, 375, y), 0x111C23u);
      EXPECT_EQ(rgbAt(s, 749, y), 0x0F2023u);
    }
  }
}

// Row 166 of the vertical gradient: (19 + 15 x 166) / 167 = 15.02, (23 + 33 x 166) / 167 = 32.94,
// (35 + 36 x 166) / 167 = 35.99, so 15, 32, 35; row 0 is Back1 across the whole width.
TEST_F(AppearanceTest, ZeroUnderLeftToRightbMakesRoomsVerticalOnly) {
  write("LeftToRightb", "0");
  for (int algorithm = 0; algorithm < kAlgorithmCount; ++algorithm) {
    rig.core.setValue(kAlgorithm, algorithm);
    const bool room = algorithm >= 3 && algorithm <= 5;
    const AppearanceSet set = load();
    EXPECT_EQ(set.leftToRight, !room) << algorithm;
    EXPECT_EQ(leftToRightChecked(&rig.core, &host), !room) << algorithm;
    const DibSurface s = drawn(set);
    EXPECT_EQ(rgbAt(s, 749, 0), room ? 0x131723u : 0x0F2023u) << algorithm;
    EXPECT_EQ(rgbAt(s, 0, 166), room ? 0x0F2023u : 0x131723u) << algorithm;
  }
}

TEST_F(AppearanceTest, StoredColoursAreSigned32BitDecimalsOfRgb) {
  // 19 + 256 x 23 + 65536 x 35 = 2299667; the fourth byte is ignored; out-of-range values saturate.
  const std::pair<const char*, uint32_t> cases[] = {
      {"2299667", 0x131723}, {" \t+2299667 trailing", 0x131723}, {"-1", 0xFFFFFF}, {"none", 0},
      {"16777216", 0},       {"99999999999", 0xFFFFFF},         {"-99999999999", 0}};
  for (const auto& [text, rgb] : cases) EXPECT_EQ(rgbOf(parseColour(text)), rgb) << text;
  EXPECT_EQ(colourText({19, 23, 35, 255}), "2299667");
}

TEST_F(AppearanceTest, ColourActionsWriteTheCurrentGroupAndDropItsPicture) {
  rig.core.setValue(kAlgorithm, 4);
  write("Back2b", "2299667");
  write("Bitmapb", "mine.bmp");
  write("Bitmapa", "plates.bmp");
  host.colour = SkinColour{1, 2, 3, 255};  // stored as 1 + 512 + 196608
  EXPECT_TRUE(runAppearanceCommand(kSetBackgroundColour1, rig.window, &rig.core));
  EXPECT_TRUE(runAppearanceCommand(kSetBackgroundColour2, rig.window, &rig.core));
  ASSERT_EQ(host.asked.size(), 2u);
  EXPECT_EQ(rgbOf(host.asked[0]), 0x131723u);  // nothing stored: the default
  EXPECT_EQ(rgbOf(host.asked[1]), 0x131723u);  // the stored 2299667
  EXPECT_EQ(read("Back1b"), "197121");
  EXPECT_EQ(read("Back2b"), "197121");
  EXPECT_EQ(read("Bitmapb"), "");
  EXPECT_EQ(read("Bitmapa"), "plates.bmp");

  write("Bitmapb", "mine.bmp");
  EXPECT_TRUE(runAppearanceCommand(kSetMeterColour, rig.window, &rig.core));
  EXPECT_EQ(rgbOf(host.asked.back()), 0x1A1A1Au);
  EXPECT_EQ(read("Meterb"), "197121");
  EXPECT_EQ(read("Bitmapb"), "mine.bmp");  // the meter colour keeps the picture

  host.colour.reset();  // cancelled: nothing changes
  runAppearanceCommand(kSetBackgroundColour1, rig.window, &rig.core);
  EXPECT_EQ(read("Bitmapb"), "mine.bmp");
  EXPECT_EQ(rig.page.fullRefreshes, 4);
  EXPECT_FALSE(runAppearanceCommand(20014, rig.window, &rig.core));
}

TEST_F(AppearanceTest, GradientItemFlipsTheCheckOfTheCurrentGroup) {
  EXPECT_TRUE(leftToRightChecked(&rig.core, &host));
  setGradientDirection(rig.window, &rig.core);
  EXPECT_EQ(read("LeftToRighta"), "0");
  EXPECT_FALSE(leftToRightChecked(&rig.core, &host));
  setGradientDirection(rig.window, &rig.core);
  EXPECT_EQ(read("LeftToRighta"), "1");
  EXPECT_EQ(rig.page.fullRefreshes, 2);
}

TEST_F(AppearanceTest, WithoutAProfileFileActionsAskAndWriteNothing) {
  host.profile.clear();
  host.colour = SkinColour{1, 2, 3, 255};
  host.file = picture(dir / "elsewhere" / "pic.bmp", kEditorHeight, {1, 2, 3, 255});
  for (int id : {kSetBackgroundColour1, kSetBackgroundColour2, kLeftToRightGradient, kSetMeterColour,
                 kSetBackgroundBitmap})
    runAppearanceCommand(id, rig.window, &rig.core);
  EXPECT_TRUE(host.asked.empty());
  EXPECT_EQ(std::distance(fs::directory_iterator(dir / "module"), fs::directory_iterator()), 0);
  EXPECT_EQ(rig.page.fullRefreshes, 5);
}

TEST_F(AppearanceTest, BackgroundPictureIsCheckedCopiedAndShown) {
  rig.core.setValue(kAlgorithm, 7);
  host.file = picture(dir / "elsewhere" / "tall.bmp", kEditorHeight + 1, {1, 2, 3, 255});
  chooseBackgroundBitmap(rig.window, &rig.core);
  EXPECT_EQ(host.messages, std::vector<std::string>{"Sorry, bitmap could not be loaded"});
  EXPECT_FALSE(fs::exists(dir / "module" / "tall.bmp"));
  EXPECT_EQ(read("Bitmapc"), "");

  // A picture of that name already in the module's folder stays, and the stored name refers to it.
  picture(dir / "module" / "pic.bmp", kEditorHeight, {200, 100, 50, 255});
  host.file = picture(dir / "elsewhere" / "pic.bmp", kEditorHeight, {1, 2, 3, 255});
  chooseBackgroundBitmap(rig.window, &rig.core);
  EXPECT_EQ(read("Bitmapc"), "pic.bmp");
  AppearanceSet set = load();
  ASSERT_TRUE(set.background);
  EXPECT_EQ(rgbAt(drawn(set), 10, 10), 0xC86432u);

  host.file = picture(dir / "elsewhere" / "new.bmp", kEditorHeight, {1, 2, 3, 255});
  chooseBackgroundBitmap(rig.window, &rig.core);
  EXPECT_TRUE(fs::exists(dir / "module" / "new.bmp"));
  set = load();
  ASSERT_TRUE(set.background);
  EXPECT_EQ(rgbAt(drawn(set), 749, 166), 0x010203u);

  // A stored path is used as it is; a picture of the wrong size is left out when loading.
  write("Bitmapc", (dir / "elsewhere" / "tall.bmp").string());
  EXPECT_FALSE(load().background);
  write("Bitmapc", (dir / "elsewhere" / "pic.bmp").string());
  EXPECT_TRUE(load().background);
}

struct Yes : OverwriteQuestion {
  bool confirmOverwrite(const std::string&, const std::string&) override { return true; }
};

TEST_F(AppearanceTest, PresetMenuListsQuickLoadAndCarriesOutTheChoice) {
  showPresetMenu(rig.window, 10, 20, rig.core);
  ASSERT_EQ(host.menu.size(), 9u);
  EXPECT_EQ(host.menu[2].text, "&Quick Load");
  EXPECT_TRUE(host.menu[2].greyed);
  EXPECT_TRUE(host.menu[2].submenu.empty());
  EXPECT_TRUE(host.menu[4].checked);

  rig.core.setValue(kAlgorithm, 6);
  Yes yes;
  ASSERT_EQ(PresetFolder(host.presets).save("Long Plate", rig.core, yes), PresetResult::Ok);
  rig.core.setValue(kAlgorithm, 1);
  write("LeftToRighta", "0");
  host.answer = kQuickLoadFirst;
  showPresetMenu(rig.window, 10, 20, rig.core);
  EXPECT_FALSE(host.menu[2].greyed);
  ASSERT_EQ(host.menu[2].submenu.size(), 1u);
  EXPECT_EQ(host.menu[2].submenu[0].text, "Long Plate");
  EXPECT_FALSE(host.menu[4].checked);
  EXPECT_EQ(rig.core.getValue(kAlgorithm), 6);

  for (int id : {kLoadPresetCommand, kSavePresetCommand}) {
    host.answer = id;
    showPresetMenu(rig.window, 10, 20, rig.core);
  }
  EXPECT_EQ(host.dialogs, (std::vector<std::string>{"load " + host.presets, "save " + host.presets}));
  host.answer = kLeftToRightGradient;
  showPresetMenu(rig.window, 10, 20, rig.core);
  EXPECT_EQ(read("LeftToRightc"), "0");
}

}  // namespace
}  // namespace ulvetta
