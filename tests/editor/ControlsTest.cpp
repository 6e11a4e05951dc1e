// The controls on a plain page with a real core: parameter values set through mouse and keys, pixels against
// the plain background with the renderer's own primitives drawn on it, and the rectangles copied to the window.
#include "editor/ChoiceList.h"
#include "editor/EditorRig.h"
#include "editor/Fader.h"
#include "editor/SegmentSelector.h"
#include "editor/StatusBar.h"
#include "editor/ValueDisplay.h"

namespace ulvetta {
namespace {

using test::kBackgroundRgb;
using Rects = std::vector<EditorRect>;

constexpr SkinColour kFontColour{243, 242, 242, 255};
constexpr uint32_t kWhite = 0xFFFFFF, kListRgb = 0xDEDEDE;

struct ControlsTest : ::testing::Test {
  Fader* fader(int id, int x, int y, int orientation = Fader::kVertical) {
    const bool vertical = orientation == Fader::kVertical;
    return rig.add<Fader>(id, x, y, vertical ? 22 : 110, vertical ? 110 : 22, orientation,
                          vertical ? &verticalThumb : &horizontalThumb);
  }
  template <class Control, class... Args>
  Control* withFont(Args... args) {
    auto* c = rig.add<Control>(args...);
    c->setFont(&rig.font, kFontColour);
    return c;
  }
  std::string text(int id, bool full) {
    char buffer[ReverbCore::kTextCapacity];
    return rig.core.getValueText(id, buffer, full);
  }
  // A value display's short text as drawText centres it in the box (x, y, 34, 13).
  void drawValue(DibSurface* s, int id, int x, int y) {
    drawText(s, rig.font, x, y, 34, 13, kTextCentre | kTextVCentre, 0, 0, text(id, false), kFontColour, 255);
  }

  test::EditorRig rig;
  SkinImage verticalThumb{186, {0, 0, 22, 15}, SkinImage::kMasked, 188};
  SkinImage horizontalThumb{187, {0, 0, 15, 22}, SkinImage::kMasked, 189};
};

TEST_F(ControlsTest, FaderJumpsUnderThePointerDragsToTheTopAndMovesAHundredthFinely) {
  fader(kDecay, 314, 39);
  rig.show();
  // Decay 47 puts the thumb at 39 + trunc(95 x 0.53 + 0.5) = 89. The pointer at y 60 is 14 pixels below the
  // topmost thumb centre (46) on a 95-pixel travel; the thumb moves so that its centre (53 + 7) is under it.
  rig.mouse(kLeftPress, 325, 60);
  EXPECT_EQ(rig.core.notified, std::vector<float>{1.0f - 14.0f / 95.0f});
  EXPECT_EQ(rig.host.presented, (Rects{{314, 53, 22, 89 + 15 - 53}}));
  DibSurface reference = test::EditorRig::background();
  verticalThumb.draw(&reference, 314, 53, 22, 15, 0, 0);
  EXPECT_EQ(rig.differences(reference), 0);
  rig.mouse(kLeftDrag, 325, 0);
  rig.mouse(kLeftRelease, 325, 0);
  rig.mouse(kLeftDrag, 325, 120);  // no longer captured
  EXPECT_EQ(rig.core.getValue(kDecay), 100);
  // With Ctrl or Shift a press does not jump and a drag across the whole track moves one hundredth.
  for (int modifier : {kModifierCtrl, kModifierShift}) {
    rig.core.setValue(kDecay, 47);
    rig.core.notified.clear();
    rig.mouse(kLeftPress, 325, 140, modifier);  // no jump
    rig.mouse(kLeftDrag, 325, 30, modifier);    // above the track: 1
    rig.mouse(kLeftDrag, 325, 160, modifier);   // below it: 0
    ASSERT_EQ(rig.core.notified.size(), 2u);
    EXPECT_NEAR(rig.core.notified[0], 0.01f + 0.99f * 0.47f, 1e-6);
    EXPECT_NEAR(rig.core.notified[0] - rig.core.notified[1], 0.01f, 1e-6);
  }
}

TEST_F(ControlsTest, FaderKeysWhileFocusedAndNothingWhileDisabled) {
  Fader* f = fader(kInputGain, 34, 39);
  rig.show();
  EXPECT_FALSE(rig.window.keyDown(kKeyHome));  // no focus yet
  rig.mouse(kLeftPress, 40, 100, kModifierCtrl);
  rig.core.notifyHost(kInputGain, 0.995f);  // -30.0 .. 15.0 dB in tenths: 148, position 448 / 450
  rig.keys({kKeyUp});
  EXPECT_EQ(rig.core.notified.back(), 1.0f);
  rig.keys({kKeyEnd, kKeyPageUp});
  EXPECT_EQ(rig.core.getValue(kInputGain), -255);
  rig.keys({kKeyHome, kKeyDown});
  EXPECT_FLOAT_EQ(rig.core.notified.back(), 0.99f);
  EXPECT_FALSE(rig.window.keyDown(kKeyLeft) || rig.window.keyDown(kKeyRight));
  rig.mouse(kLeftPress, 200, 100);  // elsewhere: the focus goes
  EXPECT_FALSE(rig.window.keyDown(kKeyHome));
  // Disabled: not painted, and neither clicks nor keys reach it.
  rig.mouse(kLeftPress, 40, 100, kModifierCtrl);
  f->disable();
  rig.show();
  rig.core.notified.clear();
  rig.mouse(kLeftPress, 45, 60);
  EXPECT_FALSE(rig.window.keyDown(kKeyHome));
  EXPECT_TRUE(rig.core.notified.empty() && rig.host.presented.empty());
  EXPECT_EQ(rig.differences(test::EditorRig::background()), 0);
}

TEST_F(ControlsTest, TypedEntryStoresOnEnterAndNothingOnEscape) {
  auto* d = withFont<ValueDisplay>(int(kInputGain), 18, 17, 34, 13);
  rig.show();
  const std::string full = text(kInputGain, true);
  rig.mouse(kLeftPress, 30, 22);
  EXPECT_TRUE(d->editing() && d->allSelected() && d->text() == full);
  // The box enlarged by 8 and 2 pixels turns white.
  EXPECT_TRUE(rig.rgb(10, 15) == kWhite && rig.rgb(59, 31) == kWhite && rig.rgb(9, 15) == kBackgroundRgb);
  rig.keys({'1', '2', 190, '5', kKeyEnter});
  EXPECT_EQ(rig.core.getValue(kInputGain), 125);
  rig.mouse(kLeftPress, 30, 22);
  rig.keys({'9', 65, kKeyEscape});
  EXPECT_EQ(rig.core.getValue(kInputGain), 125);
  DibSurface reference = test::EditorRig::background();
  drawValue(&reference, kInputGain, 18, 17);
  EXPECT_EQ(rig.differences(reference), 0);
  // A press elsewhere ends editing without storing and is used up; outside editing nothing is.
  rig.mouse(kLeftPress, 30, 22);
  EXPECT_TRUE(d->keyDown('7') && d->mouse(200, 100, kLeftPress, 0));
  EXPECT_FALSE(d->editing() || d->mouse(200, 100, kLeftPress, 0) || d->keyDown('1'));
  EXPECT_EQ(rig.core.getValue(kInputGain), 125);
  // The first key after a click replaces the whole text; after Left or Home keys insert.
  const std::string now = text(kInputGain, true);
  struct Case {
    std::initializer_list<int> keys;
    std::string text;
  };
  for (const Case& c : {Case{{'3'}, "3"}, Case{{kKeyLeft, '7'}, now.substr(0, now.size() - 1) + "7" + now.back()},
                        Case{{kKeyHome, 109}, "-" + now}, Case{{kKeyBackspace, 96}, "0"},
                        Case{{kKeyHome, kKeyDelete}, now.substr(1)}}) {
    rig.mouse(kLeftPress, 30, 22);
    rig.keys(c.keys);
    EXPECT_EQ(d->text(), c.text);
    rig.keys({kKeyEscape});
  }
}

TEST_F(ControlsTest, CaretBlinksAndTheTextScrollsToKeepIt) {
  auto* d = withFont<ValueDisplay>(int(kInputGain), 18, 17, 34, 13);
  rig.show();
  rig.mouse(kLeftPress, 30, 22);
  rig.keys({kKeyEnd});
  const int caretX = d->textStart() + rig.font.textWidth(d->text()), textTop = 17 + (13 - 9) / 2;
  EXPECT_EQ(rig.rgb(caretX, textTop), 0xF3F2F2u);
  rig.host.presented.clear();
  for (int i = 0; i < 9; ++i) rig.window.tick();  // 500 ms blink: every tenth tick
  EXPECT_TRUE(d->caretShown() && rig.host.presented.empty());
  rig.window.tick();
  EXPECT_EQ(rig.rgb(caretX, textTop), kWhite);
  EXPECT_EQ(rig.host.presented, Rects{d->bounds()});
  rig.keys({'1', '1', '1', '1', '1', '1', '1', '1', '1', '1'});
  EXPECT_EQ(d->textStart() + rig.font.textWidth(d->text()), 18 + 34 - 2);
  rig.keys({kKeyHome});
  EXPECT_EQ(d->textStart(), 18 + 1);
}

TEST_F(ControlsTest, AlgorithmListOpensSelectsAndClosesUnchanged) {
  auto* list = withFont<ChoiceList>(int(kAlgorithm), 557, 140, 119, 14, 88);
  for (const char* name : {"A", "B", "C", "D", "E", "F", "G", "H"}) list->addItem(name);
  rig.core.setValue(kAlgorithm, 0);
  rig.show();
  rig.mouse(kLeftPress, 600, 145);
  EXPECT_TRUE(list->isOpen() && rig.page.fullRefreshes == 1);
  EXPECT_EQ(rig.rgb(674, 52), kListRgb);  // the list covers 557..675 x 51..138
  // Lines of 9 + 2 pixels from 51: the third one starts at 73.
  rig.host.presented.clear();
  rig.mouse(kLeftDrag, 600, 78);
  EXPECT_EQ(rig.host.presented, (Rects{{557, 73, 119, 11}}));
  EXPECT_TRUE(rig.rgb(674, 73) == 0x187176u && rig.rgb(674, 84) == kListRgb);
  rig.mouse(kLeftRelease, 600, 78);
  EXPECT_EQ(rig.core.getValue(kAlgorithm), 2);
  EXPECT_TRUE(!list->isOpen() && rig.rgb(674, 52) == kBackgroundRgb);
  // Press and release on the box leave it open; the pointer alone hovers; presses elsewhere are used up.
  rig.mouse(kLeftPress, 600, 145);
  rig.mouse(kLeftRelease, 600, 145);
  rig.mouse(kMove, 600, 107);
  EXPECT_TRUE(list->isOpen() && list->hovered() == 5 && list->mouse(10, 10, kLeftPress, 0));
  rig.mouse(kLeftRelease, 557 + 119 + 1, 107);  // right of the column
  EXPECT_FALSE(list->isOpen());
  EXPECT_EQ(rig.core.getValue(kAlgorithm), 2);
}

TEST_F(ControlsTest, RedrawsKeepTheStackingOrder) {
  // A fader linked both ways with its display, under an open list: moving the thumb redraws the display and
  // repaints the list over the thumb's rectangle.
  Fader* f = fader(kOutputLevelWet, 559, 60, Fader::kHorizontal);
  auto* display = withFont<ValueDisplay>(int(kOutputLevelWet), 680, 58, 34, 13);
  f->link(display);
  display->link(f);
  withFont<ChoiceList>(int(kAlgorithm), 557, 140, 119, 14, 88);
  rig.show();
  rig.mouse(kLeftPress, 600, 70, kModifierCtrl);
  rig.mouse(kLeftPress, 600, 145);
  rig.host.presented.clear();
  rig.keys({kKeyHome});  // the thumb goes to 654..668
  EXPECT_EQ(rig.rgb(667, 62), kListRgb);
  EXPECT_EQ(rig.host.presented, (Rects{f->rect(), display->bounds()}));
  rig.mouse(kLeftPress, 600, 145);
  rig.mouse(kLeftPress, 690, 64);
  rig.keys({'0', kKeyEnter});
  EXPECT_EQ(rig.core.getValue(kOutputLevelWet), 0);
  DibSurface reference = test::EditorRig::background();
  horizontalThumb.draw(&reference, 559 + int(95 * rig.core.getNormalized(kOutputLevelWet) + 0.5f), 60, 15, 22, 0, 0);
  drawValue(&reference, kOutputLevelWet, 680, 58);
  EXPECT_EQ(rig.differences(reference), 0);
}

TEST_F(ControlsTest, SelectorZonesAndTheLoadBar) {
  auto* selector = rig.add<SegmentSelector>(int(kMeterSource), 91, 142, 108, 15, 228, 3);
  for (int k = 0; k < 3; ++k) selector->addZone(91 + 36 * k, 142, 36, 15, 0.5f * k);
  rig.add<StatusBar>(558, 153, 117, 1, int(kStatusLoad), SkinColour{20, 0, 177, 255});
  rig.core.setValue(kAlgorithm, 2);
  rig.show();
  rig.mouse(kLeftPress, 170, 150);
  EXPECT_EQ(rig.core.getValue(kMeterSource), 2);
  EXPECT_FALSE(selector->mouse(90, 150, kLeftPress, 0) || selector->mouse(10, 10, kLeftPress, 0));
  rig.window.tick();
  rig.window.tick();  // the same length: nothing to redraw
  // The third frame of the strip; Algorithm 2's load figure 0.092 of 117 pixels is 10.764: 11 pixels.
  SkinBitmap strip;
  ASSERT_TRUE(strip.loadResource(228));
  DibSurface reference = test::EditorRig::background();
  strip.copy(&reference, 91, 142, 108, 15, 216, 0);
  fillRect(&reference, 558, 153, 11, 1, {20, 0, 177, 255});
  EXPECT_EQ(rig.differences(reference), 0);
  EXPECT_EQ(rig.host.presented, (Rects{{91, 142, 108, 15}, {558, 153, 117, 1}}));
}

}  // namespace
}  // namespace ulvetta
