#pragma once

#include <cstdint>

class KEditor;
class KBitmap;
class KDrawerToKBitmap;

// The pixels of an editor's back buffer that a paint changed: inclusive bounds, empty when
// right < left.
struct KPaintedPixels {
  int32_t left = 0, top = 0, right = -1, bottom = -1;
  bool IsEmpty() const noexcept { return right < left || bottom < top; }
  int64_t Count() const noexcept { return IsEmpty() ? 0 : int64_t{right - left + 1} * (bottom - top + 1); }
};

// Paints what is dirty in the editor into `backBuffer` through `drawer`; answers the pixels to put
// on the window (the logical area widened by one pixel for anti-aliased edges). A full repaint's
// duration goes to `lastFullPaintMs`. Shared by the editor windows of every system.
KPaintedPixels KPaintEditorDirty(KEditor& editor, KDrawerToKBitmap& drawer, const KBitmap& backBuffer, double& lastFullPaintMs);
