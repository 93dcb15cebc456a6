#pragma once

#include <memory>

#include "ui/KBitmap.h"
#include "ui/KGeometry.h"

class KDrawer;
class KOpenGLWindowContext;

// What an editor window paints on: a drawer, and the way its pixels reach the screen. Every
// paint runs Begin, the drawing through Drawer(), then Show with the pixels that changed.
class KWindowSurface {
public:
  KWindowSurface() = default;
  KWindowSurface(const KWindowSurface&) = delete;
  KWindowSurface& operator=(const KWindowSurface&) = delete;
  virtual ~KWindowSurface() = default;

  // The OpenGL drawer on a window's context, `scale` device pixels per logical one. Throws
  // KException when the context cannot carry an editor (then the caller paints in software).
  static std::unique_ptr<KWindowSurface> OpenGL(std::unique_ptr<KOpenGLWindowContext> context, double scale);

  // The software drawer into a back buffer of width × height pixels, put on an X11 window of
  // `display` with XPutImage.
  static std::unique_ptr<KWindowSurface> X11Software(struct _XDisplay* display, unsigned long window, int32_t width,
                                                     int32_t height, double scale);
  // The software drawer into a back buffer of width × height pixels, put on a Win32 window
  // through GDI.
  static std::unique_ptr<KWindowSurface> Win32Software(struct HWND__* window, int32_t width, int32_t height, double scale);

  virtual KDrawer& Drawer() noexcept = 0;
  virtual bool IsOpenGL() const noexcept = 0;
  // Whether what was painted before survives a Show; when not, every paint must be whole.
  virtual bool KeepsPicture() const noexcept = 0;
  virtual void Begin() = 0;
  // Puts the pixels in `changed` (inclusive; empty for none) on the window and ends the paint.
  virtual void Show(const KRect& changed) = 0;
  // Outside a paint: the picture the drawer last painted, read back from where it keeps it (the
  // software back buffer; OpenGL's off-screen framebuffer, or without one the window's back
  // buffer, which a Show leaves undefined).
  virtual KBitmap Picture() = 0;
};
