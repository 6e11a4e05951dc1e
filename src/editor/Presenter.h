#pragma once
// Shows a rectangle of the back buffer: the window system's presenter copies it to the window at the same
// place, a headless one writes it out as a picture.
#include "editor/DibSurface.h"

namespace ulvetta {

class Presenter {
 public:
  virtual ~Presenter() = default;
  // Presents (x, y, w, h) of the surface, clipped to it; false when nothing could be shown.
  virtual bool present(const DibSurface& surface, int x, int y, int w, int h) = 0;
};

}  // namespace ulvetta
