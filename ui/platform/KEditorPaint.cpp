#include "ui/platform/KEditorPaint.h"

#include <algorithm>
#include <chrono>
#include <cmath>

#include "ui/editor/KEditor.h"

int64_t KPaintEditorDirty(KEditor& editor, KDrawer& drawer, double& lastFullPaintMs, const std::function<void(const KRect&)>& present) {
  if (!editor.Tree().NeedsPaint()) return 0;
  const bool full = editor.Tree().DirtyArea() == editor.Tree().Root().Bounds();
  const auto start = std::chrono::steady_clock::now();
  const KRect area = editor.Paint(drawer);
  const double s = editor.Scale();
  const KRect pixels = area.IsEmpty() ? area
                                      : KRect{std::max(0, static_cast<int32_t>(std::floor(area.left * s)) - 1),
                                              std::max(0, static_cast<int32_t>(std::floor(area.top * s)) - 1),
                                              std::min(editor.PixelWidth() - 1, static_cast<int32_t>(std::ceil((area.right + 1) * s))),
                                              std::min(editor.PixelHeight() - 1, static_cast<int32_t>(std::ceil((area.bottom + 1) * s)))};
  present(pixels);
  if (full) lastFullPaintMs = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
  return pixels.IsEmpty() ? 0 : pixels.Width() * pixels.Height();
}
