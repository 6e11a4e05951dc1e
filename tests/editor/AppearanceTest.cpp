// Appearance settings and the preset menu against real files in a folder of their own: gradient pixels
// derived by hand from the default colours, the menu actions' writes, pictures refused, copied and kept.
#include <filesystem>
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

uint32_t rgbOf(SkinColour c) { return c.r << 16 | c.g << 8 | c.b; }

struct AppearanceTest : ::testing::Test {
  AppearanceTest() {
    fs::create_directories(dir / "elsewhere");
    fs::create_directories(dir / "module");
    host.folder = (dir / "module").string() + "/";
    host.profile = host.folder + "Ulvetta.ini";
  }
  ~AppearanceTest() override { fs::remove_all(dir); }

  std::string read(const std::string& key) { return ProfileFile(host.profile).read(kAppearanceSection, key); }
  void write(const std::string& key, const std::string& value) {
    ProfileFile(host.profile).write(kAppearanceSection, key, value);
  }
  // A 24-bit picture of one colour, 750 pixels wide.
  static std::string picture(const fs::path& path, int height, uint32_t rgb) {
    return test::writeFile(path.string(), test::colourBitmap(kEditorWidth, height, [rgb](int, int, int channel) {
                             return static_cast<uint8_t>(rgb >> (8 * channel));
                           }));
  }
  // The background drawn from the settings loaded now: R, G, B of (x, y).
  uint32_t drawn(int x, int y, AppearanceSet* loaded = nullptr) {
    AppearanceSet set;
    loadAppearance(set, &rig.core, &host);
    drawAppearanceBackground(set, rig.window.surface());
    if (loaded) *loaded = std::move(set);
    return rig.rgb(x, y);
  }

  test::EditorRig rig;
  test::RecordingHost& host = rig.host;
  const fs::path dir = fs::temp_directory_path() / ("ulvetta-appearance-" + std::to_string(std::random_device()()));
};

// Defaults 19, 23, 35 -> 15, 33, 36. Column 375 (t = 1/2): 17, 28, 35.5 -> 35. Column 749 (t = 749/750):
// (19 + 15 x 749) / 750 = 15.005, (23 + 33 x 749) / 750 = 32.99, (35 + 36 x 749) / 750 = 35.999: 15, 32, 35.
// Row 166 of a vertical one (t = 166/167): 15.02, 32.94, 35.99, so the same 15, 32, 35.
TEST_F(AppearanceTest, DefaultGradientAndAVerticalOneForTheRoomGroupOnly) {
  for (const std::string& profile : {std::string(), host.profile}) {  // no file named, a file not there
    host.profile = profile;
    AppearanceSet set;
    EXPECT_EQ(drawn(0, 166, &set), 0x131723u);
    EXPECT_EQ(rig.rgb(375, 0), 0x111C23u);
    EXPECT_EQ(rig.rgb(749, 0), 0x0F2023u);
    EXPECT_EQ(rgbOf(set.meter), 0x1A1A1Au);
  }
  write("LeftToRightb", "0");
  for (int algorithm = 0; algorithm < kAlgorithmCount; ++algorithm) {
    rig.core.setValue(kAlgorithm, algorithm);
    const bool room = algorithm >= 3 && algorithm <= 5;
    EXPECT_EQ(drawn(749, 0), room ? 0x131723u : 0x0F2023u) << algorithm;
    EXPECT_EQ(rig.rgb(0, 166), room ? 0x0F2023u : 0x131723u) << algorithm;
    EXPECT_EQ(leftToRightChecked(&rig.core, &host), !room) << algorithm;
  }
}

TEST_F(AppearanceTest, StoredColoursAreSigned32BitDecimalsOfRgb) {
  // 19 + 256 x 23 + 65536 x 35 = 2299667; the fourth byte is ignored; out-of-range values saturate.
  const std::pair<const char*, uint32_t> cases[] = {
      {"2299667", 0x131723}, {" \t+2299667 trailing", 0x131723}, {"-1", 0xFFFFFF}, {"none", 0},
      {"16777216", 0},       {"99999999999", 0xFFFFFF},         {"-99999999999", 0}};
  for (const auto& [text, rgb] : cases) EXPECT_EQ(rgbOf(parseColour(text)), rgb) << text;
}

TEST_F(AppearanceTest, MenuActionsWriteTheCurrentGroupOnlyWithAProfileFile) {
  rig.core.setValue(kAlgorithm, 4);
  write("Back2b", "2299667");
  write("Bitmapb", "mine.bmp");
  write("Bitmapa", "plates.bmp");
  host.colour = SkinColour{1, 2, 3, 255};  // stored as 1 + 512 + 196608
  for (int id : {kSetBackgroundColour1, kSetBackgroundColour2}) EXPECT_TRUE(runAppearanceCommand(id, rig.window, &rig.core));
  ASSERT_EQ(host.asked.size(), 2u);
  EXPECT_EQ(rgbOf(host.asked[0]), 0x131723u);  // nothing stored: the default
  EXPECT_EQ(rgbOf(host.asked[1]), 0x131723u);  // the stored 2299667
  EXPECT_EQ(read("Back1b") + read("Back2b") + read("Bitmapb") + read("Bitmapa"), "197121197121plates.bmp");
  write("Bitmapb", "mine.bmp");
  runAppearanceCommand(kSetMeterColour, rig.window, &rig.core);
  EXPECT_EQ(read("Meterb") + read("Bitmapb"), "197121mine.bmp");  // the meter colour keeps the picture
  host.colour.reset();  // cancelled: nothing changes
  runAppearanceCommand(kSetBackgroundColour1, rig.window, &rig.core);
  EXPECT_EQ(read("Bitmapb"), "mine.bmp");
  for (const char* expected : {"0", "1"}) {
    runAppearanceCommand(kLeftToRightGradient, rig.window, &rig.core);
    EXPECT_EQ(read("LeftToRightb"), expected);
  }
  EXPECT_EQ(rig.page.fullRefreshes, 6);
  EXPECT_FALSE(runAppearanceCommand(20014, rig.window, &rig.core));

  fs::remove(host.profile);
  host.profile.clear();
  host.colour = SkinColour{1, 2, 3, 255};
  host.file = picture(dir / "elsewhere" / "pic.bmp", kEditorHeight, 0x010203);
  for (int id : {kSetBackgroundColour1, kLeftToRightGradient, kSetMeterColour, kSetBackgroundBitmap})
    runAppearanceCommand(id, rig.window, &rig.core);
  EXPECT_EQ(host.asked.size(), 4u);  // none asked since the cancelled one
  EXPECT_TRUE(fs::is_empty(dir / "module"));
}

TEST_F(AppearanceTest, BackgroundPictureIsCheckedCopiedAndShown) {
  rig.core.setValue(kAlgorithm, 7);
  host.file = picture(dir / "elsewhere" / "tall.bmp", kEditorHeight + 1, 0x010203);
  chooseBackgroundBitmap(rig.window, &rig.core);
  EXPECT_EQ(host.messages, std::vector<std::string>{"Sorry, bitmap could not be loaded"});
  EXPECT_EQ(read("Bitmapc"), "");
  EXPECT_TRUE(fs::is_empty(dir / "module"));
  // A picture of that name already in the module's folder stays, and the stored name refers to it.
  picture(dir / "module" / "pic.bmp", kEditorHeight, 0xC86432);
  host.file = picture(dir / "elsewhere" / "pic.bmp", kEditorHeight, 0x010203);
  chooseBackgroundBitmap(rig.window, &rig.core);
  EXPECT_EQ(read("Bitmapc"), "pic.bmp");
  EXPECT_EQ(drawn(10, 10), 0xC86432u);
  host.file = picture(dir / "elsewhere" / "new.bmp", kEditorHeight, 0x010203);
  chooseBackgroundBitmap(rig.window, &rig.core);
  EXPECT_EQ(drawn(749, 166), 0x010203u);
  EXPECT_TRUE(fs::exists(dir / "module" / "new.bmp"));
  // A stored path is used as it is; a picture of the wrong size is left out when loading.
  write("Bitmapc", (dir / "elsewhere" / "tall.bmp").string());
  EXPECT_EQ(drawn(0, 0), 0x131723u);
  write("Bitmapc", (dir / "elsewhere" / "pic.bmp").string());
  EXPECT_EQ(drawn(0, 0), 0x010203u);
}

TEST_F(AppearanceTest, PresetMenuListsQuickLoadAndCarriesOutTheChoice) {
  showPresetMenu(rig.window, 10, 20, rig.core);
  ASSERT_EQ(host.menu.size(), 9u);
  EXPECT_TRUE(host.menu[2].greyed && host.menu[2].submenu.empty() && host.menu[4].checked);
  struct : OverwriteQuestion {
    bool confirmOverwrite(const std::string&, const std::string&) override { return true; }
  } yes;
  rig.core.setValue(kAlgorithm, 6);
  ASSERT_EQ(PresetFolder(host.presetFolder()).save("Long Plate", rig.core, yes), PresetResult::Ok);
  rig.core.setValue(kAlgorithm, 1);
  write("LeftToRighta", "0");
  for (int id : {int(kQuickLoadFirst), int(kLoadPresetCommand), int(kSavePresetCommand), int(kLeftToRightGradient)}) {
    host.answer = id;
    showPresetMenu(rig.window, 10, 20, rig.core);
  }
  ASSERT_EQ(host.menu[2].submenu.size(), 1u);
  EXPECT_EQ(host.menu[2].submenu[0].text, "Long Plate");
  EXPECT_EQ(rig.core.getValue(kAlgorithm), 6);  // Quick Loaded
  EXPECT_EQ(host.dialogs, (std::vector<std::string>{"load " + host.presetFolder(), "save " + host.presetFolder()}));
  EXPECT_EQ(read("LeftToRightc"), "0");
}

}  // namespace
}  // namespace ulvetta
