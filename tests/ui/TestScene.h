#pragma once

#include "ui/KDrawer.h"

// Images of the tests, made from formulas so that no image file is needed.
namespace KTestImages {
// A colourful picture with a transparent corner and a soft alpha edge.
KBitmap Picture(int32_t width, int32_t height);
// A small two-colour tile for patterns.
KBitmap Tile();
// A white disc on transparency, for masks and turned knobs.
KBitmap Disc(int32_t size);
}  // namespace KTestImages

// A picture of an editor that calls every operation of the drawer once or more: a panel with
// a pattern and a picture, knobs, text in every font, shapes and the three graphs. 400 × 300
// logical units. `texture` holds the whole of `images.picture`.
struct KTestSceneImages {
  KBitmap picture = KTestImages::Picture(96, 64);
  KBitmap tile = KTestImages::Tile();
  KBitmap disc = KTestImages::Disc(40);
};
void KPaintTestScene(KDrawer& drawer, const KTestSceneImages& images, const class KOpenGLTexture& texture);
