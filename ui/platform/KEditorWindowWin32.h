#pragma once

#include <cstdint>
#include <memory>

#include "ui/KBitmap.h"
#include "ui/KGeometry.h"

class KEditor;
class KDrawerToKBitmap;
struct HWND__;

// An editor in a Win32 child window of a host's window. Messages reach it through the host's
// message loop; its own timer drives the editor's tick. Painting goes through the software
// drawer into a back buffer, of which only the repainted area is put on the window through GDI.
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

  // The window procedure's way in; answers whether the message was handled.
  bool HandleMessage(unsigned message, uintptr_t wParam, intptr_t lParam);

private:
  void Present(const KRect& pixels);
  void MakeBackBuffer();

  KEditor& editor_;
  HWND__* window_ = nullptr;
  KBitmap backBuffer_;
  std::unique_ptr<KDrawerToKBitmap> drawer_;
  double lastFullPaintMs_ = 0;
};
