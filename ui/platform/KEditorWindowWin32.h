#pragma once

#include <cstdint>
#include <memory>

#include "ui/KBitmap.h"

class KEditor;
class KWindowSurface;
struct HWND__;

// An editor in a Win32 child window of a host's window. Messages reach it through the host's
// message loop; its own timer drives the editor's tick. The OpenGL drawer paints it through WGL
// where the system has OpenGL, else the software drawer through GDI; either repaints only what
// changed.
class KEditorWindowWin32 {
public:
  // A child window of `parent` (an HWND) the editor's pixel size. Throws KException when the
  // system refuses the window.
  KEditorWindowWin32(uintptr_t parent, KEditor& editor);
  ~KEditorWindowWin32();
  KEditorWindowWin32(const KEditorWindowWin32&) = delete;
  KEditorWindowWin32& operator=(const KEditorWindowWin32&) = delete;

  HWND__* Window() const noexcept { return window_; }
  // Messages come through the host's loop: there is no descriptor to watch.
  int FileDescriptor() const noexcept { return -1; }
  void ProcessEvents();
  // The editor's tick, then whatever it made dirty painted.
  void Tick();
  // Follows the editor's pixel size (after a scale change or a host's resize).
  void Resize();
  // For hosts that refuse a resize: grows each window above the editor's to width × height plus
  // its own frame, climbing until an "MDIClient" window or a frame wider than `largestFrame`.
  void GrowAncestors(int32_t width, int32_t height, int32_t largestFrame);
  // Paints what is dirty and puts it on the window; answers the pixels put.
  int64_t PaintDirty();
  double LastFullPaintMs() const noexcept { return lastFullPaintMs_; }
  bool PaintsWithOpenGL() const noexcept;
  // The picture last painted for the window, as its drawer reads it back.
  KBitmap Picture();

  // The window procedure's way in; answers whether the message was handled.
  bool HandleMessage(unsigned message, uintptr_t wParam, intptr_t lParam);

private:
  // A surface of the editor's pixel size: OpenGL's when it can paint, else software.
  void MakeSurface();

  KEditor& editor_;
  HWND__* window_ = nullptr;
  std::unique_ptr<KWindowSurface> surface_;
  double lastFullPaintMs_ = 0;
};
