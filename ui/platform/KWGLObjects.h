#pragma once

#include <epoxy/wgl.h>
#include <windows.h>

#include "kernel/KException.h"
#include "ui/platform/KWGLDispatch.h"

// The WGL objects behind one OpenGL context: the window it paints, the window's device and the
// context. Close deletes the context, gives the device back, and destroys the window when it is
// this context's own.
struct KWGLObjects {
  HWND window = nullptr;
  HDC device = nullptr;
  HGLRC context = nullptr;
  bool ownsWindow = false;

  KWGLObjects() = default;
  KWGLObjects(const KWGLObjects&) = delete;
  KWGLObjects& operator=(const KWGLObjects&) = delete;
  ~KWGLObjects() { Close(); }

  // The window's device with a double-buffered RGBA format of `colorBits` (`alphaBits` of them
  // alpha) unless the window has a format already (a window keeps one for its life), then a
  // context on it; fails as Fail does.
  void Open(BYTE colorBits, BYTE alphaBits) {
    device = window ? ::GetDC(window) : nullptr;
    if (!device) Fail();
    if (::GetPixelFormat(device) == 0) {
      PIXELFORMATDESCRIPTOR format{};
      format.nSize = sizeof(format);
      format.nVersion = 1;
      format.dwFlags = PFD_DRAW_TO_WINDOW | PFD_SUPPORT_OPENGL | PFD_DOUBLEBUFFER;
      format.iPixelType = PFD_TYPE_RGBA;
      format.cColorBits = colorBits;
      format.cAlphaBits = alphaBits;
      format.iLayerType = PFD_MAIN_PLANE;
      const int chosen = ::ChoosePixelFormat(device, &format);
      if (chosen == 0 || !::SetPixelFormat(device, chosen, &format)) Fail();
    }
    KPrepareWGLDispatch();
    context = wglCreateContext(device);
    if (!context) Fail();
  }
  bool MakeCurrent() noexcept {
    KPrepareWGLDispatch();
    return wglMakeCurrent(device, context) == TRUE;
  }
  void Release() noexcept { wglMakeCurrent(nullptr, nullptr); }
  void Close() noexcept {
    if (context) {
      if (wglGetCurrentContext() == context) Release();
      wglDeleteContext(context);
    }
    if (device) ::ReleaseDC(window, device);
    if (window && ownsWindow) ::DestroyWindow(window);
    context = nullptr;
    device = nullptr;
    window = nullptr;
  }
  // Closes what was made so far and reports that OpenGL cannot paint here.
  [[noreturn]] void Fail() {
    Close();
    throw KException("OpenGL is not available on this system.");
  }
};
