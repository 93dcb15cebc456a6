#pragma once

#include "ui/platform/KOpenGLContext.h"

// An OpenGL context that paints a window: double-buffered, its pixel format the window's own
// visual. Painting goes to the back buffer; Present shows it.
class KOpenGLWindowContext : public KOpenGLContext {
public:
  // A context for an X11 window of `display` (an open connection that outlives the context),
  // `width` × `height` pixels. Throws KException when OpenGL cannot paint the window.
  static std::unique_ptr<KOpenGLWindowContext> CreateForX11(struct _XDisplay* display, unsigned long window, int32_t width,
                                                            int32_t height);
  // A context for the Win32 window `window`, `width` × `height` pixels, on the window's own
  // device (its class must keep one per window). Throws KException when OpenGL cannot paint it.
  static std::unique_ptr<KOpenGLWindowContext> CreateForWin32(struct HWND__* window, int32_t width, int32_t height);

  // Brings the back buffer to the window; the context must be current. Afterwards the back
  // buffer's content is undefined.
  virtual void Present() noexcept = 0;
};
