// The reverb and filter pages driven through the headless host as a user would: scripted mouse and keys,
// parameter values read back from the core and pixels read from the back buffer, with references derived by
// hand (the default gradient, the pictures' own pixels, a thumb moved by a known number of rows).
#include <gtest/gtest.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <vector>

#include "editor/PageSet.h"
#include "editor/SkinBitmap.h"
#include "editor/headless/EventScript.h"
#include "editor/headless/HeadlessHost.h"
#include "filter/ReverbCore.h"
#include "platform/ProfileFile.h"

namespace ulvetta {
namespace {

// Column x of the default horizontal gradient from 19, 23, 35 to 15, 33, 36, as 0xRRGGBB.
uint32_t gradient(int x) {
  const double t = x / 750.0;
  auto mix = [t](int a, int b, int shift) { return static_cast<uint32_t>(a * (1 - t) + b * t) << shift; };
  return mix(19, 15, 16) | mix(23, 33, 8) | mix(35, 36, 0);
}

uint32_t rgbOf(const uint8_t* bgr) { return bgr[2] << 16 | bgr[1] << 8 | bgr[0]; }

uint32_t pictureAt(int resource, int x, int y) {
  SkinBitmap b;
  SkinColour c;
  EXPECT_TRUE(b.loadResource(resource) && b.pixelColour(x, y, &c)) << resource;
  return c.r << 16 | c.g << 8 | c.b;
}

class WorkingPagesTest : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(pages.failed());
    host.show(&pages.window());
    host.settle();
  }
  uint32_t pixel(int x, int y) { return rgbOf(pages.window().surface()->at(x, y)); }
  void play(const std::string& text) {
    EventScript script;
    std::string error;
    ASSERT_TRUE(script.parse(text, "script", &error)) << error;
    script.play(pages.window(), host);
  }
  // A change made outside the editor, announced as automation announces it.
  void changeElsewhere(int32_t id, int32_t value) {
    core.setValue(id, value);
    core.notifyListeners(id);
  }
  bool wholeEditorPresented() const {
    for (const EditorRect& r : host.presented())
      if (r == kEditorRect) return true;
    return false;
  }

  ReverbCore core;
  HeadlessHost host;
  PageSet pages{core, &host};
};

// The optional columns per Algorithm: Pre Delay (frame 255, 15; fader 273..294), Diffusion (419; 437..458) and
// Early Reflections (460; 478..499). A hidden column shows only the gradient over its whole height and its
// fader ignores a press.
TEST_F(WorkingPagesTest, AlgorithmDecidesWhichColumnsShowAndRespond) {
  struct Column {
    int32_t id;
    int frameX, faderX;
  };
  const Column columns[] = {{kPreDelay, 255, 273}, {kDiffusion, 419, 437}, {kEarlyReflections, 460, 478}};
  const uint32_t frameCorner = pictureAt(204, 0, 0);
  for (int algorithm : {0, 3, 7}) {
    changeElsewhere(kAlgorithm, algorithm);
    host.settle();
    for (const Column& c : columns) {
      const bool shown = algorithm == 0 || (algorithm == 7 && c.id != kEarlyReflections);
      SCOPED_TRACE("algorithm " + std::to_string(algorithm) + ", parameter " + std::to_string(c.id));
      if (shown) {
        EXPECT_EQ(pixel(c.frameX, 15), frameCorner);
      } else {
        int off = 0;
        for (int y = 15; y < 154; ++y)
          for (int x = c.frameX; x < c.frameX + 38; ++x) off += pixel(x, y) != gradient(x);
        EXPECT_EQ(off, 0);
      }
      // A press at the top of the track raises a responding fader from half way to its maximum.
      core.setNormalized(c.id, 0.5f);
      core.notifyListeners(c.id);
      const float half = core.getNormalized(c.id);
      play("press " + std::to_string(c.faderX + 11) + " 42\nrelease " + std::to_string(c.faderX + 11) + " 42");
      EXPECT_EQ(core.getNormalized(c.id), shown ? 1.0f : half);
    }
  }
}

TEST_F(WorkingPagesTest, TabAndPageButtonsSwitchPagesAndTheLogoShowsAbout) {
  const uint32_t button1Lit = pictureAt(219, 6, 6), button1Dim = pictureAt(221, 6, 6);
  ASSERT_NE(button1Lit, button1Dim);
  EXPECT_EQ(pixel(512, 145), button1Lit);
  play("key 9");
  EXPECT_EQ(pages.window().currentPage(), kFilterPage);
  EXPECT_EQ(pixel(512, 145), button1Dim);
  EXPECT_TRUE(wholeEditorPresented());
  play("key 9");
  EXPECT_EQ(pages.window().currentPage(), kReverbPage);
  // The lit button of the current page is not a page switch: the press goes to the controls, which ignore it.
  play("press 510 142\nrelease 510 142");
  EXPECT_EQ(pages.window().currentPage(), kReverbPage);
  play("press 525 142\nrelease 525 142");
  EXPECT_EQ(pages.window().currentPage(), kFilterPage);
  host.clearPresented();
  play("press 100 15\nrelease 100 15");
  EXPECT_EQ(pages.window().currentPage(), kAboutPage);
  EXPECT_TRUE(wholeEditorPresented());
  EXPECT_FALSE(pages.window().keyDown(kKeyTab));
}

// A right press opens the menu where it was made and never reaches a control (Home would raise a focused
// fader to its top); a colour chosen from it reaches the profile file and the page repaints with it at once.
TEST_F(WorkingPagesTest, RightPressOpensTheMenuAndItsColourChoiceRepaintsThePage) {
  const std::filesystem::path dir = std::filesystem::temp_directory_path() / ("pages-" + std::to_string(getpid()));
  std::filesystem::create_directories(dir);
  std::ofstream(dir / "Ulvetta.ini") << "[Colours]\r\n";
  const int32_t decay = core.getValue(kDecay);
  {
    HeadlessHost withProfile((dir / "Ulvetta.ini").string(), dir.string() + "/");
    PageSet set(core, &withProfile);
    withProfile.show(&set.window());
    withProfile.settle();
    withProfile.queueMenu(20010);  // Set Background Colour 1
    withProfile.queueColour({200, 100, 50, 255});
    set.window().mouse(325, 60, kRightPress, 0);
    set.window().mouse(325, 60, kRightRelease, 0);
    set.window().keyDown(kKeyHome);
    ASSERT_EQ(withProfile.menus().size(), 1u);
    EXPECT_TRUE(withProfile.menus()[0].x == 325 && withProfile.menus()[0].y == 60);
    EXPECT_EQ(rgbOf(set.window().surface()->at(0, 100)), 0xC86432u);
  }
  // 200 + 100 x 256 + 50 x 65536
  EXPECT_EQ(ProfileFile((dir / "Ulvetta.ini").string()).read("Colours", "Back1a"), "3302600");
  EXPECT_EQ(core.getValue(kDecay), decay);
  std::filesystem::remove_all(dir);
}

TEST_F(WorkingPagesTest, ChangesMadeElsewhereRedrawTheCurrentPage) {
  // Decay 47 of 100 puts the thumb's top at 39 + trunc(95 x 0.53 + 0.5) = 89; 80 puts it at 58. The groove
  // is the same all along, so the thumb's pixels move by 31 rows unchanged.
  std::vector<uint32_t> before;
  for (int y = 89; y < 104; ++y)
    for (int x = 314; x < 336; ++x) before.push_back(pixel(x, y));
  changeElsewhere(kDecay, 80);
  EXPECT_TRUE(host.invalid());
  host.settle();
  size_t k = 0;
  for (int y = 58; y < 73; ++y)
    for (int x = 314; x < 336; ++x) ASSERT_EQ(pixel(x, y), before[k++]) << x << "," << y;

  // The page that is not shown ignores refreshes; a whole new state repaints the current one at once.
  pages.window().showPage(kAboutPage);
  host.settle();
  changeElsewhere(kDecay, 10);
  EXPECT_FALSE(host.invalid());
  pages.window().showPage(kReverbPage);
  host.clearPresented();
  uint8_t state[88];
  ASSERT_TRUE(core.saveState(state));
  core.loadState(state, sizeof state);
  EXPECT_TRUE(wholeEditorPresented());
}

}  // namespace
}  // namespace ulvetta
