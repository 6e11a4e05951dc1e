#pragma once
// The back buffer's own drawing primitives: solid and translucent fills and the anti-aliased line.
#include "editor/DibSurface.h"
#include "editor/SkinColour.h"

namespace ulvetta {

// Fills (x, y, w, h), clipped to the surface: A = 255 writes the colour, A = 0 draws nothing, any other A
// mixes with weight A + 1 of 256.
void fillRect(DibSurface* surface, int x, int y, int w, int h, SkinColour colour);

// A one-pixel anti-aliased line (the colour's A is not used): each step along the major axis shares the
// colour between the two pixels that straddle the minor position. Pixels outside the surface are skipped.
void drawLine(DibSurface* surface, int x1, int y1, int x2, int y2, SkinColour colour);

}  // namespace ulvetta
