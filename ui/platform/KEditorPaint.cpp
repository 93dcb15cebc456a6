#include "ui/platform/KEditorPaint.h"

#include <algorithm>
#include <chrono>
#include <cmath>

#include "ui/KBitmap.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/editor/KEditor.h"

KPaintedPixels KPaintEditorDirty(KEditor& editor, KDrawerToKBitmap& drawer, const KBitmap& backBuffer, double& lastFullPaintMs) {
  if (!editor.Tree().NeedsPaint()) return {};
  const bool full = editor.Tree().DirtyArea() == editor.Tree().Root().Bounds();
  const auto start = std::chrono::steady_clock::now();
  const KRect area = editor.Paint(drawer);
  if (full) lastFullPaintMs = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
  if (area.IsEmpty()) return {};
  const double s = editor.Scale();
  return {std::max(0, static_cast<int32_t>(std::floor(area.left * s)) - 1), std::max(0, static_cast<int32_t>(std::floor(area.top * s)) - 1),
          std::min(backBuffer.Width() - 1, static_cast<int32_t>(std::ceil((area.right + 1) * s))),
          std::min(backBuffer.Height() - 1, static_cast<int32_t>(std::ceil((area.bottom + 1) * s)))};
}
