#pragma once
// The analogue level meter's needle: an anti-aliased line from the face's lower edge towards a tip on a
// circle round the pivot, swinging from the rest angle at level 0 to its mirror at level 1. Each tick reads
// the core's meter level (or lets the needle fall back while processing is stopped) and redraws only the
// rectangle the needle swept.

#include "editor/SkinControl.h"

namespace ulvetta {

class NeedleMeter : public SkinControl {
 public:
  // The working pages' geometry: pivot, the face area where the needle shows, needle length (pixels) and
  // rest angle (radians from the positive x axis, y up: 55 degrees).
  static constexpr int kPivotX = 147, kPivotY = 123;
  static constexpr EditorRect kClip{100, 50, 94, 47};
  static constexpr int kLength = 70;
  static constexpr float kRestAngle = 3.14159265358979323846f * 0.3055555522441864f;
  // Each tick while stopped keeps this share of the level; below kFloor it is 0.
  static constexpr float kFallBack = 0.93f;
  static constexpr float kFloor = 0.01f;

  // Where the needle is drawn for one level: from (baseX, baseY) to (tipX, tipY) within bounds.
  struct Needle {
    int baseX = 0, baseY = 0, tipX = 0, tipY = 0;
    EditorRect bounds;
  };

  NeedleMeter(EditorWindow* parent, ReverbCore* core, EditorPage* page, int paramId = 0);

  void setGeometry(int pivotX, int pivotY, int clipX, int clipY, int clipW, int clipH, int length, float alpha,
                   SkinColour colour);

  void paint(int clipX, int clipY, int clipW, int clipH, int callerChildId) override;
  // Reads the level and redraws the union of the old and new needle rectangles.
  void tick() override;
  EditorRect bounds() const override;

  Needle needleAt(float level) const;
  float level() const { return level_; }

 private:
  int pivotX_ = kPivotX, pivotY_ = kPivotY;
  int length_ = kLength;
  float alpha_ = kRestAngle;
  SkinColour colour_{0, 0, 0, 255};
  float level_ = 0.0f;
  Needle drawn_;
  bool shown_ = false;  // a needle at drawn_ is in the back buffer
};

}  // namespace ulvetta
