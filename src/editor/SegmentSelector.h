#pragma once
// A selector of a few positions of one parameter (the Meter Source): a strip with one frame per choice and
// a table of zones, each a rectangle and the position a press there sets.
#include <vector>

#include "editor/SkinControl.h"

namespace ulvetta {

class SegmentSelector : public SkinControl {
 public:
  // Loads the strip (frames as wide as the control) from stripResource; room for zoneCount zones.
  SegmentSelector(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId, int x, int y, int w,
                  int h, int stripResource, int zoneCount);

  // Fills the next zone; ignored once zoneCount zones are filled.
  void addZone(int x, int y, int w, int h, float position);

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  void update() override;
  bool mouse(int x, int y, int event, int modifiers) override;

 private:
  struct Zone {
    EditorRect rect;
    float position;
  };
  int zoneCount_;
  std::vector<Zone> zones_;
};

}  // namespace ulvetta
