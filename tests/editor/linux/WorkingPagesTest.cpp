// The reverb and filter pages driven through the headless host as a user would: scripted mouse and keys,
// parameter values read back from the core and pixels read from the back buffer, with references derived by
// hand (the default gradient, the pictures' own pixels, a thumb moved by a known number of rows).
#include <gtest/gtest.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <vector>

#include "editor/PageSet.h"
#include "editor/SkinBitmap.h"
#include "editor/headless/EventScript.h"
#include "editor/headless/HeadlessHost.h"
#include "filter/ReverbCore.h"

namespace ulvetta {
namespace {

struct Rgb {
  int r, g, b;
  bool operator==(const Rgb& o) const { return r == o.r && g == o.g && b == o.b; }
};
std::ostream& operator<<(std::ostream& os, const Rgb& c) { return os << c.r << "," << c.g << "," << c.b; }

// Column x of the default horizontal gradient from 19, 23, 35 to 15, 33, 36.
Rgb gradient(int x) {
  const double t = x / 750.0;
  auto mix = [t](int a, int b) { return static_cast<int>(a * (1 - t) + b * t); };
  return {mix(19, 15), mix(23, 33), mix(35, 36)};
}

Rgb pictureAt(int resource, int x, int y) {
  SkinBitmap b;
  SkinColour c;
  EXPECT_TRUE(b.loadResource(resource) && b.pixelColour(x, y, &c)) << resource;
  return {c.r, c.g, c.b};
}

class WorkingPagesTest : public ::testing::Test {
 protected:
  void SetUp() override {
    host.show(&pages.window());
    host.settle();
  }
  Rgb pixel(int x, int y) {
    const uint8_t* p = pages.window().surface()->at(x, y);
    return {p[2], p[1], p[0]};
  }
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

TEST_F(WorkingPagesTest, DraggingDecayToTheTopSetsItsMaximum) {
  ASSERT_FALSE(pages.failed());
  play("press 325 100\ndrag 325 60\ndrag 325 0\nrelease 325 0");
  EXPECT_EQ(core.getValue(kDecay), 100);
}

// The optional columns per Algorithm: Pre Delay (frame 255, 15; fader 273..294), Diffusion (419; 437..458) and
// Early Reflections (460; 478..499). A hidden column shows only the gradient over its whole height and its
// fader ignores a press.
TEST_F(WorkingPagesTest, AlgorithmDecidesWhichColumnsShowAndRespond) {
  struct Column {
    int32_t id;
    int frameX, faderX;
  };
  const Column columns[] = {{kPreDelay, 255, 273}, {kDiffusion, 419, 437}, {kEarlyReflections, 460, 478}};
  const Rgb frameCorner = pictureAt(204, 0, 0);
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
          for (int x = c.frameX; x < c.frameX + 38; ++x) off += !(pixel(x, y) == gradient(x));
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
  const Rgb button1Lit = pictureAt(219, 6, 6), button1Dim = pictureAt(221, 6, 6);
  ASSERT_FALSE(button1Lit == button1Dim);
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

TEST_F(WorkingPagesTest, RightPressOpensTheMenuAndNeverReachesAControl) {
  const int32_t decay = core.getValue(kDecay);
  play("rpress 325 60\nrrelease 325 60\nkey 36");  // Home would raise a focused fader to its top
  ASSERT_EQ(host.menus().size(), 1u);
  EXPECT_EQ(host.menus()[0].x, 325);
  EXPECT_EQ(host.menus()[0].y, 60);
  EXPECT_EQ(core.getValue(kDecay), decay);
}

// A menu action reaches the profile file and the page repaints with it at once.
TEST_F(WorkingPagesTest, MenuColourChoiceRepaintsThePage) {
  const std::filesystem::path dir = std::filesystem::temp_directory_path() / ("pages-" + std::to_string(getpid()));
  std::filesystem::create_directories(dir);
  const std::string profile = (dir / "Ulvetta.ini").string();
  std::ofstream(profile) << "[Colours]\r\n";
  {
    HeadlessHost withProfile(profile, dir.string() + "/");
    PageSet set(core, &withProfile);
    withProfile.show(&set.window());
    withProfile.settle();
    withProfile.queueMenu(20010);  // Set Background Colour 1
    withProfile.queueColour({200, 100, 50, 255});
    set.window().mouse(700, 5, kRightPress, 0);
    const uint8_t* p = set.window().surface()->at(0, 100);
    EXPECT_EQ((Rgb{p[2], p[1], p[0]}), (Rgb{200, 100, 50}));
  }
  std::filesystem::remove_all(dir);
}

TEST_F(WorkingPagesTest, ChangesMadeElsewhereRedrawTheCurrentPage) {
  // Decay 47 of 100 puts the thumb's top at 39 + trunc(95 x 0.53 + 0.5) = 89; 80 puts it at 58. The groove
  // is the same all along, so the thumb's pixels move by 31 rows unchanged.
  std::vector<Rgb> before;
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
