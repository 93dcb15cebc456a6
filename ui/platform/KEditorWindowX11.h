#pragma once

#include <cstdint>
#include <memory>

#include "ui/KBitmap.h"

class KEditor;
class KWindowSurface;

// An editor in an X11 child window of a host's window. It has no thread and no loop of its
// own: the host's run loop calls ProcessEvents when the connection's descriptor is readable and
// Tick on its timer. The OpenGL drawer paints it where the system has OpenGL (EGL on the X
// connection), else the software drawer; either repaints only what changed.
class KEditorWindowX11 {
public:
  // Opens a connection of its own and a child window of `parent` the editor's pixel size.
  // Throws KException when there is no display.
  KEditorWindowX11(unsigned long parent, KEditor& editor);
  ~KEditorWindowX11();
  KEditorWindowX11(const KEditorWindowX11&) = delete;
  KEditorWindowX11& operator=(const KEditorWindowX11&) = delete;

  unsigned long Window() const noexcept { return window_; }
  // The connection's descriptor, for the host's event handler.
  int FileDescriptor() const noexcept;
  // Handles every event waiting on the connection.
  void ProcessEvents();
  // The editor's tick, then whatever it made dirty painted.
  void Tick();
  // Follows the editor's pixel size (after a scale change or a host's resize).
  void Resize();
  // Paints what is dirty and puts it on the window; answers the pixels put.
  int64_t PaintDirty();
  // For hosts that refuse a new size: climbing from the parent, each window above this one takes
  // width × height plus the frame it has around the window below it; the climb stops at the
  // root or at a window whose frame exceeds `largestFrame` in either direction.
  void GrowAncestors(int32_t width, int32_t height, int32_t largestFrame);
  // The milliseconds the last full repaint took, until its pixels were on their way to the window.
  double LastFullPaintMs() const noexcept { return lastFullPaintMs_; }
  bool PaintsWithOpenGL() const noexcept;
  // The picture last painted for the window, as its drawer reads it back.
  KBitmap Picture();

private:
  void HandleEvent(const union _XEvent& event);
  // A surface of the editor's pixel size: OpenGL's when it can paint, else software.
  void MakeSurface();

  KEditor& editor_;
  struct _XDisplay* display_ = nullptr;
  unsigned long window_ = 0;
  std::unique_ptr<KWindowSurface> surface_;
  double lastFullPaintMs_ = 0;
};
