#include "editor/ReverbPage.h"

#include "editor/EditorWindow.h"

namespace ulvetta {
namespace {

WorkingPage::Layout reverbLayout() {
  WorkingPage::Layout l;
  l.slot = kReverbPage;
  l.otherSlot = kFilterPage;
  l.columns = {
      {kInputGain, 18, 17, 34, 39, true},        {kDiffusion, 421, 17, 437, 39, true},
      {kPreDelay, 257, 17, 273, 39, true},       {kDecay, 298, 17, 314, 39, true},
      {kDamping, 339, 17, 355, 39, true},        {kRoomSize, 380, 17, 396, 39, true},
      {kEarlyReflections, 462, 17, 478, 39, true}, {kOutputLevelWet, 680, 58, 559, 60, false},
      {kOutputLevelDry, 680, 37, 559, 38, false}, {kColour, 680, 109, 559, 111, false},
  };
  l.grooveXs = {42, 322, 363, 404};
  l.frames = {{204, 15, 15},  {204, 296, 15}, {204, 337, 15}, {204, 378, 15},
              {204, 678, 35}, {204, 678, 56}, {204, 678, 107}};
  // INPUT, DECAY, DAMPING, ROOM SIZE
  l.labels = {{216, 16, 34}, {208, 297, 34}, {207, 338, 34}, {214, 379, 34}};
  // PREDELAY, DIFFUSE, REFLECTIONS
  l.optional = {{kPreDelay, 281, 255, {213, 256, 34}},
                {kDiffusion, 445, 419, {209, 420, 34}},
                {kEarlyReflections, 486, 460, {211, 461, 34}}};
  l.button1 = 219;  // lit
  l.button2 = 220;  // dim
  l.otherButton = {521, 139, 13, 12};
  return l;
}

}  // namespace

ReverbPage::ReverbPage(ReverbCore* core) : WorkingPage(core, reverbLayout()) {}

bool ReverbPage::columnShown(int32_t paramId, int32_t algorithm) const {
  // The convolution rooms (3, 4, 5) use none of the three; the diffused echo (7) has no early reflections.
  if (algorithm >= 3 && algorithm <= 5) return false;
  return !(algorithm == 7 && paramId == kEarlyReflections);
}

}  // namespace ulvetta
