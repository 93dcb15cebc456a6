#pragma once

#include <cstdint>
#include <functional>
#include <memory>

#include "ui/KGeometry.h"

class KEditor;
class KOpenGLWindowContext;
class KWindowSurface;

// Paints what is dirty in `editor` on `surface` (all of it when the surface loses its picture
// between paints), then shows the window pixels that changed (the logical area at the editor's
// scale, widened by one pixel for anti-aliased edges and kept inside the editor; nothing when
// nothing changed). A full repaint's duration, presentation included, goes to `lastFullPaintMs`.
// Answers how many pixels changed. Shared by the editor windows of every system.
int64_t KPaintEditorDirty(KEditor& editor, KWindowSurface& surface, double& lastFullPaintMs);

// The surface of an editor window at the editor's pixel size: the OpenGL drawer on the context
// `openGL` makes, or, when OpenGL cannot carry the editor there, the `software` one. Either way
// the whole editor is to be painted next.
std::unique_ptr<KWindowSurface> KMakeWindowSurface(KEditor& editor, const std::function<std::unique_ptr<KOpenGLWindowContext>()>& openGL,
                                                   const std::function<std::unique_ptr<KWindowSurface>()>& software);
