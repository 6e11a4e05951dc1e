#pragma once
// The working pages' look per Algorithm group (plates, rooms, the special algorithms): two background colours
// with a horizontal or vertical gradient between them, or a picture of the user's own, and the meter section's
// colour. Kept in the profile file the host names, section "Colours", one key per setting and group; changed
// by five items of the preset menu.
#include <cstdint>
#include <memory>
#include <string>

#include "editor/SkinColour.h"
#include "editor/SkinImage.h"

namespace ulvetta {

class DibSurface;
class EditorWindow;
class ReverbCore;
class WindowHost;

inline constexpr char kAppearanceSection[] = "Colours";
inline constexpr SkinColour kDefaultBack1{19, 23, 35};
inline constexpr SkinColour kDefaultBack2{15, 33, 36};
inline constexpr SkinColour kDefaultMeter{26, 26, 26};

// Menu command ids of the appearance actions.
enum AppearanceCommand : int {
  kSetBackgroundColour1 = 20010,
  kSetBackgroundColour2 = 20011,
  kLeftToRightGradient = 20012,
  kSetMeterColour = 20013,
  kSetBackgroundBitmap = 20020,
};

// What a working page shows behind its controls; rebuilt from the file at every full refresh.
struct AppearanceSet {
  SkinColour back1 = kDefaultBack1;
  SkinColour back2 = kDefaultBack2;
  SkinColour meter = kDefaultMeter;
  bool leftToRight = true;  // false: the gradient runs from top to bottom
  std::unique_ptr<SkinImage> background;  // the user's 750 x 167 picture, drawn instead of the gradient
};

// The key suffix of an Algorithm value: "a" for 0..2, "b" for 3..5, "c" for 6 and 7, "" for anything else.
const char* appearanceSuffix(int32_t algorithm);
// A stored colour: a signed 32-bit decimal (leading blanks and a sign accepted, digits up to the first other
// character, none giving 0, saturating) whose low three bytes are R, G and B.
SkinColour parseColour(const std::string& text);
// The stored text of a colour: decimal R + 256 G + 65536 B.
std::string colourText(SkinColour colour);

// Fills set for the core's current Algorithm from host's profile file, pictures named without a folder being
// looked up in host's module folder. Without a core the bare keys are read; without a host or a profile
// file every setting has its default. A picture that cannot be loaded at 750 x 167 is left out silently.
void loadAppearance(AppearanceSet& set, ReverbCore* core, WindowHost* host);
// Draws the whole 750 x 167 background into target: the picture, or the gradient where column x (row y)
// gets trunc(back1 x (1 - t) + back2 x t) per channel with t = x / 750 (y / 167) in double precision.
void drawAppearanceBackground(const AppearanceSet& set, DibSurface* target);

// Whether the menu shows "Left To Right Gradient" checked: the stored value for the current group is not "0".
bool leftToRightChecked(ReverbCore* core, WindowHost* host);

// The menu actions, for the group of the Algorithm current at the time. Each asks through the window's host,
// writes the profile file and ends with refresh(10000) on the window's current page; without a profile
// file nothing is asked or written.
void setGradientDirection(EditorWindow& window, ReverbCore* core);
void chooseBackground1(EditorWindow& window, ReverbCore* core);
void chooseBackground2(EditorWindow& window, ReverbCore* core);
void chooseMeterColour(EditorWindow& window, ReverbCore* core);
void chooseBackgroundBitmap(EditorWindow& window, ReverbCore* core);
// Runs the action of an AppearanceCommand id; false (and nothing done) for any other id.
bool runAppearanceCommand(int id, EditorWindow& window, ReverbCore* core);

}  // namespace ulvetta
