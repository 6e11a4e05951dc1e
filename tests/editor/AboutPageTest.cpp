// The about page in a window whose reverb slot holds a plain page: the credit cycle's panels against the
// background picture with the renderer's fill and text drawn on it, the link area's edges and the return
// button's frames from the strip and mask resources.
#include "editor/AboutPage.h"
#include "editor/EditorRig.h"

namespace ulvetta {
namespace {

struct AboutPageTest : ::testing::Test {
  AboutPageTest() {
    rig.host.folder = "/opt/ulvetta/";
    font.strip().loadResource(kLargeFontResource);
    font.setGlyphs(kFontCharacterSet, kLargeFontWidths.data());
    picture.draw(&reference);
    rig.window.showPage(kAboutPage);
  }
  void ticks(int n) {
    while (n-- > 0) rig.window.tick();
  }
  int differences(const EditorRect& r) { return rig.differences(reference, r); }
  // The panel of text at opacity 1: the text's box centred in the credit area, 6 pixels around it.
  EditorRect opaquePanel(const std::string& text) {
    const int tw = font.textWidth(text), th = font.textHeight(text);
    const EditorRect panel{405 + (340 - tw) / 2 - 6, 23 + (90 - th) / 2 - 6, tw + 12, th + 12};
    fillRect(&reference, panel.x, panel.y, panel.w, panel.h, {0, 0, 0, 90});
    drawText(&reference, font, panel.x, panel.y, panel.w, panel.h, kTextCentre | kTextVCentre, 0, 0, text,
             {255, 255, 255, 255}, 255);
    return panel;
  }

  test::EditorRig rig;
  test::RecordingHost& host = rig.host;
  std::unique_ptr<AboutPage> page = AboutPage::create(&rig.window, &rig.core);
  BitmapFont font;
  SkinImage picture{196, kEditorRect};
  DibSurface reference = test::EditorRig::background();
};

TEST(AboutPage, OpacityRisesOverFifteenTicksAndFallsOverTwenty) {
  const std::pair<int, float> cases[] = {{80, 0}, {94, 14.0f / 15}, {95, 1}, {139, 1}, {140, 0.95f}, {159, 0}};
  for (const auto& [t, a] : cases) EXPECT_FLOAT_EQ(AboutPage::opacity({"x", 80, 159, 15, 20}, t), a) << t;
}

TEST_F(AboutPageTest, CreditCycleShowsFadesRestartsAndResumes) {
  const std::string first = page->creditLines().front().text;
  ticks(15);
  const EditorRect panel = opaquePanel(first);
  EXPECT_EQ(differences(panel), 0);
  ASSERT_FALSE(host.presented.empty());
  EXPECT_EQ(host.presented.back(), panel);  // a tick copies its panel only

  ticks(559 - 15);  // t = 559: the last line at opacity 0 leaves its panel plain
  picture.draw(&reference);
  EXPECT_EQ(page->tickCount(), 559);
  EXPECT_EQ(differences(host.presented.back()), 0);
  ticks(1);  // the cycle restarts with the first line, invisible
  EXPECT_EQ(page->tickCount(), 0);
  EXPECT_EQ(host.presented.back(), panel);
  EXPECT_EQ(differences(panel), 0);

  ticks(15);
  rig.window.showPage(kReverbPage);
  ticks(40);  // ticks reach the shown page only
  rig.window.showPage(kAboutPage);
  EXPECT_EQ(page->tickCount(), 15);
  ticks(1);
  EXPECT_EQ(page->tickCount(), 16);
}

TEST_F(AboutPageTest, LinkAreaShowsAndOpensTheDocumentFrom570) {
  const EditorRect label{570, 152, 168, 15};
  drawText(&reference, font, label.x, label.y, label.w, label.h, kTextCentre | kTextVCentre, 0, 0, "README.html",
           {255, 170, 52, 255}, 255);
  const int tw = font.textWidth("README.html");
  fillRect(&reference, label.x + (label.w - tw) / 2, 165, tw, 1, {96, 66, 28, 255});
  EXPECT_EQ(differences({570, 152, 180, 15}), 0);

  rig.mouse(kLeftPress, 569, 152);
  rig.mouse(kLeftPress, 570, 151);
  rig.mouse(kLeftRelease, 600, 160);
  EXPECT_TRUE(host.opened.empty());
  for (int event : {kLeftPress, kRightPress, kLeftDoubleClick, kRightDoubleClick}) rig.mouse(event, 570, 152);
  rig.mouse(kLeftPress, 749, 166);
  EXPECT_EQ(host.opened, std::vector<std::string>(5, "/opt/ulvetta/README.html"));
}

TEST_F(AboutPageTest, ReturnButtonPressesOnItsMaskAndReleasesToTheReverbPage) {
  const EditorRect button = AboutPage::kReturnButton;
  rig.mouse(kLeftPress, button.x + 2, button.y);  // mask grey 160 at the rounded corner
  rig.mouse(kLeftRelease, button.x + 2, button.y);
  EXPECT_EQ(rig.window.currentPage(), kAboutPage);

  SkinImage strip{178, button, SkinImage::kMasked, 179};
  strip.draw(&reference, button.x, button.y, button.w, button.h, 50, 0);
  rig.mouse(kLeftPress, button.x + 1, button.y + 1);  // grey 239
  EXPECT_EQ(differences(button), 0);
  EXPECT_EQ(host.presented.back(), button);
  rig.mouse(kLeftDrag, button.x - 5, button.y);
  picture.draw(&reference);
  strip.draw(&reference, button.x, button.y, button.w, button.h, 0, 0);
  EXPECT_EQ(differences(button), 0);
  rig.mouse(kLeftRelease, button.x - 5, button.y);
  EXPECT_EQ(rig.window.currentPage(), kAboutPage);

  rig.mouse(kLeftPress, 714, 133);
  rig.mouse(kLeftRelease, 714, 133);
  EXPECT_EQ(rig.window.currentPage(), kReverbPage);
  EXPECT_EQ(host.presented.back(), kEditorRect);
  EXPECT_EQ(rig.rgb(300, 100), test::kBackgroundRgb);
}

}  // namespace
}  // namespace ulvetta
