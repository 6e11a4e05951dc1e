// The needle against lines drawn by hand-worked end points on the plain background, its fall while processing
// is stopped, and the rectangles each tick copies to the window.
#include "editor/EditorRig.h"
#include "editor/NeedleMeter.h"

namespace ulvetta {
namespace {

using test::kBackgroundRgb;

struct NeedleMeterTest : ::testing::Test {
  NeedleMeterTest() {
    meter->setGeometry(147, 123, 100, 50, 94, 47, 70, NeedleMeter::kRestAngle, {0, 0, 0, 255});
    rig.show();
  }
  // The background with a black line from (baseX, 97) to (tipX, tipY).
  static DibSurface withNeedle(int baseX, int tipX, int tipY) {
    DibSurface s = test::EditorRig::background();
    drawLine(&s, baseX, 97, tipX, tipY, {0, 0, 0, 255});
    return s;
  }

  test::EditorRig rig;
  NeedleMeter* meter = rig.add<NeedleMeter>(0);
};

TEST_F(NeedleMeterTest, RestCentreAndFullScaleEachTickCopyingOnlyTheSweptRectangle) {
  // Tips 70 pixels from (147, 123) at 125, 90 and 55 degrees, truncated: 147 -+ 40.15, 123 - 57.34. The base
  // is where the line to the pivot crosses y 97, 26 pixels above it: 26 x 41 / 58 = 18.4 to the side.
  struct Case {
    float level;
    int baseX, tipX, tipY;
  };
  for (const Case& c : {Case{0.0f, 129, 106, 65}, Case{1.0f, 165, 187, 65}, Case{0.5f, 147, 147, 53}}) {
    rig.core.level = c.level;
    rig.window.tick();
    EXPECT_EQ(rig.differences(withNeedle(c.baseX, c.tipX, c.tipY)), 0) << c.level;
  }
  EXPECT_TRUE(rig.rgb(147, 53) == 0 && rig.rgb(147, 97) == 0);
  EXPECT_TRUE(rig.rgb(147, 52) == kBackgroundRgb && rig.rgb(148, 70) == kBackgroundRgb);
  rig.core.level = 0.0f;
  rig.window.tick();
  rig.host.presented.clear();
  // At rest the needle spans 106..129 x 65..97, upright 147 x 53..97, each with the column and row after it
  // that the anti-aliased pairs reach.
  rig.core.level = 0.5f;
  rig.window.tick();
  EXPECT_EQ(rig.host.presented, (std::vector<EditorRect>{{106, 53, 148 - 106 + 1, 98 - 53 + 1}}));
  rig.window.tick();  // the same needle
  EXPECT_EQ(rig.host.presented.size(), 1u);
  // A repaint of part of the needle's rectangle draws only there, leaving the rest of the line as it was.
  rig.core.level = 0.0f;
  rig.window.tick();
  rig.page.repaintRect(110, 70, 6, 6, 99);
  EXPECT_EQ(rig.differences(withNeedle(129, 106, 65)), 0);
}

TEST_F(NeedleMeterTest, FallsToRestInSixtyFourTicksAfterProcessingStops) {
  rig.core.level = 1.0f;
  rig.window.tick();
  rig.core.stopped = true;
  rig.core.level = 0.7f;  // not read while stopped
  rig.window.tick();
  EXPECT_EQ(meter->level(), 0.93f);
  // 0.93^63 = 0.0103 is still above the 0.01 floor; 0.93^64 = 0.0096 is not.
  for (int i = 2; i < 64; ++i) rig.window.tick();
  EXPECT_GT(meter->level(), 0.01f);
  rig.window.tick();
  EXPECT_EQ(meter->level(), 0.0f);
  rig.window.tick();
  EXPECT_EQ(meter->level(), 0.0f);
  EXPECT_EQ(rig.differences(withNeedle(129, 106, 65)), 0);
  rig.core.stopped = false;
  rig.window.tick();
  EXPECT_EQ(meter->level(), 0.7f);
}

}  // namespace
}  // namespace ulvetta
