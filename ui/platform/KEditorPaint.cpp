#include "ui/platform/KEditorPaint.h"

#include <algorithm>
#include <chrono>
#include <cmath>

#include "kernel/KException.h"
#include "ui/editor/KEditor.h"
#include "ui/platform/KOpenGLWindowContext.h"
#include "ui/platform/KWindowSurface.h"

int64_t KPaintEditorDirty(KEditor& editor, KWindowSurface& surface, double& lastFullPaintMs) {
  KControlTree& tree = editor.Tree();
  if (!tree.NeedsPaint()) return 0;
  if (!surface.KeepsPicture()) tree.InvalidateAll();
  const bool full = tree.DirtyArea() == tree.Root().Bounds();
  const auto start = std::chrono::steady_clock::now();
  surface.Begin();
  const KRect area = editor.Paint(surface.Drawer());
  const double s = editor.Scale();
  const KRect pixels = area.IsEmpty() ? area
                                      : KRect{std::max(0, static_cast<int32_t>(std::floor(area.left * s)) - 1),
                                              std::max(0, static_cast<int32_t>(std::floor(area.top * s)) - 1),
                                              std::min(editor.PixelWidth() - 1, static_cast<int32_t>(std::ceil((area.right + 1) * s))),
                                              std::min(editor.PixelHeight() - 1, static_cast<int32_t>(std::ceil((area.bottom + 1) * s)))};
  surface.Show(pixels);
  if (full) lastFullPaintMs = std::chrono::duration<double, std::milli>(std::chrono::steady_clock::now() - start).count();
  return pixels.IsEmpty() ? 0 : pixels.Width() * pixels.Height();
}

std::unique_ptr<KWindowSurface> KMakeWindowSurface(KEditor& editor, const std::function<std::unique_ptr<KOpenGLWindowContext>()>& openGL,
                                                   const std::function<std::unique_ptr<KWindowSurface>()>& software) {
  std::unique_ptr<KWindowSurface> surface;
  try {
    surface = KWindowSurface::OpenGL(openGL(), editor.Scale());
  } catch (const KException&) {
    // No OpenGL here (or not enough of it): the same picture in software.
    surface = software();
  }
  editor.Tree().InvalidateAll();
  return surface;
}
