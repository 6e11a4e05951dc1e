#pragma once
// The design the reverb and filter pages share: the appearance background, the meter section, grooves,
// frames and labels, a row of faders with value displays, the Algorithm list, the meter source selector, the
// needle meter, the load bar, the page buttons and the logo. Each page registers with the core as a listener
// so that changes made elsewhere redraw it.
#include <map>
#include <memory>
#include <vector>

#include "editor/Appearance.h"
#include "editor/BitmapFont.h"
#include "editor/SkinImage.h"
#include "editor/SkinPanel.h"
#include "filter/ReverbCore.h"

namespace ulvetta {

class ChoiceList;
class Fader;
class NeedleMeter;
class SegmentSelector;
class ValueDisplay;

class WorkingPage : public SkinPanel, public CoreListener {
 public:
  // A value display and its fader for one parameter; the fader is vertical when its track is taller than wide.
  struct Column {
    int32_t paramId;
    int displayX, displayY;
    int faderX, faderY;
    bool vertical;
  };
  // A picture resource drawn at a place.
  struct Placed {
    int resource;
    int x, y;
  };
  // A column the page shows only for some Algorithms: its groove, frame and label.
  struct OptionalColumn {
    int32_t paramId;
    int grooveX;
    int frameX;
    Placed label;
  };
  // Everything that differs between the two pages.
  struct Layout {
    int slot;       // this page's slot in the editor window
    int otherSlot;  // the page its button and TAB show
    std::vector<Column> columns;
    std::vector<int> grooveXs;  // vertical grooves
    std::vector<Placed> frames;
    std::vector<Placed> labels;
    std::vector<OptionalColumn> optional;
    int button1, button2;  // resources of page buttons 1 and 2 (lit or dim)
    EditorRect otherButton;
  };

  // Registers with core as a listener until destroyed.
  WorkingPage(ReverbCore* core, Layout layout);
  ~WorkingPage() override;

  // Loads the pictures and the font, adds the controls in child order, gives them the font, loads the
  // appearance and registers the page in its slot. 1 when any control or picture could not be created.
  int create(EditorWindow* window);
  // Deletes the controls, pictures and font.
  void destroyControls();

  void mouse(int x, int y, int event, int modifiers) override;
  bool keyDown(int key) override;
  // 10000: reload the appearance, repaint and copy the whole page; 1001..1099: invalidate the window. Only
  // while this page is the current one.
  void refresh(int32_t code) override;

  const AppearanceSet& appearance() const { return appearance_; }

 protected:
  // Whether an optional column shows while the Algorithm is algorithm.
  virtual bool columnShown(int32_t paramId, int32_t algorithm) const;
  void paintBackground(DibSurface* target) override;

 private:
  struct ColumnControls {
    ValueDisplay* display;
    Fader* fader;
    // Enables both, or disables them (then they neither paint nor respond).
    void show(bool shown);
  };
  bool current() const;
  // Shows the other page (the button or TAB) and refreshes it whole.
  void showOther();
  void drawPicture(DibSurface* target, int resource, int x, int y) const;
  bool loadPicture(int resource, int maskResource = 0);
  void setupFonts();

  Layout layout_;
  AppearanceSet appearance_;
  BitmapFont font_;
  std::unique_ptr<SkinImage> verticalThumb_, horizontalThumb_;
  std::map<int, std::unique_ptr<SkinImage>> pictures_;
  std::map<int32_t, ColumnControls> columns_;
  ChoiceList* algorithmList_ = nullptr;
  SegmentSelector* meterSource_ = nullptr;
  NeedleMeter* meter_ = nullptr;
};

}  // namespace ulvetta
