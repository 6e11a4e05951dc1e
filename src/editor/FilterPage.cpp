#include "editor/FilterPage.h"

#include "editor/EditorWindow.h"

namespace ulvetta {
namespace {

WorkingPage::Layout filterLayout() {
  WorkingPage::Layout l;
  l.slot = kFilterPage;
  l.otherSlot = kReverbPage;
  l.columns = {
      {kInputGain, 18, 17, 34, 39, true},       {kLowPassFreq, 298, 17, 314, 39, true},
      {kHighPassFreq, 257, 17, 273, 39, true},  {kNotchQ, 339, 17, 355, 39, true},
      {kNotchGain, 380, 17, 396, 39, true},     {kNotchFreq, 421, 17, 437, 39, true},
      {kOutputLevelWet, 680, 58, 559, 60, false}, {kOutputLevelDry, 680, 37, 559, 38, false},
      {kColour, 680, 109, 559, 111, false},
  };
  l.grooveXs = {42, 281, 322, 363, 404, 445};
  l.frames = {{204, 15, 15},  {204, 296, 15}, {204, 337, 15}, {204, 378, 15}, {204, 678, 35},
              {204, 678, 56}, {204, 678, 107}, {204, 255, 15}, {204, 419, 15}};
  // INPUT, LOW CUT, HIGH CUT, NOTCH Q, NOTCH GAIN, NOTCH FREQ
  l.labels = {{216, 16, 34}, {224, 256, 34}, {223, 297, 34}, {227, 338, 34}, {226, 379, 34}, {225, 420, 34}};
  l.button1 = 221;  // dim
  l.button2 = 218;  // lit
  l.otherButton = {506, 139, 13, 12};
  return l;
}

}  // namespace

FilterPage::FilterPage(ReverbCore* core) : WorkingPage(core, filterLayout()) {}

}  // namespace ulvetta
