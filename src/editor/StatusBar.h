#pragma once
// A one-colour bar whose length follows a status figure of the core (0..1 of its width), read every tick;
// the working pages show the algorithm's processing load with it.
#include "editor/SkinControl.h"

namespace ulvetta {

class StatusBar : public SkinControl {
 public:
  StatusBar(EditorWindow* parent, ReverbCore* core, EditorPage* page, int x, int y, int w, int h, int statusCode,
            SkinColour colour);

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  // Reads the figure and redraws the bar when its length changed.
  void tick() override;
  // The bar's length in pixels as last read: round(w x figure), within 0..w.
  int length() const { return length_; }

 private:
  int statusCode_;
  SkinColour colour_;
  int length_ = 0;
  bool shown_ = false;  // the bar at length_ is in the back buffer
};

}  // namespace ulvetta
