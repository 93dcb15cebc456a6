// Window contexts through WGL: the window's own device (its class keeps one per window) with a
// double-buffered pixel format; SwapBuffers shows the back buffer.
#include <epoxy/wgl.h>
#include <windows.h>

#include "kernel/KException.h"
#include "ui/platform/KOpenGLWindowContext.h"
#include "ui/platform/KWGLDispatch.h"

namespace {
class WGLWindowContext final : public KOpenGLWindowContext {
public:
  WGLWindowContext(HWND window, int32_t width, int32_t height) : window_(window), width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    device_ = ::GetDC(window_);
    if (!device_) Fail();
    // A window takes one pixel format for its life: a surface made again after a resize keeps it.
    if (::GetPixelFormat(device_) == 0) {
      PIXELFORMATDESCRIPTOR format{};
      format.nSize = sizeof(format);
      format.nVersion = 1;
      format.dwFlags = PFD_DRAW_TO_WINDOW | PFD_SUPPORT_OPENGL | PFD_DOUBLEBUFFER;
      format.iPixelType = PFD_TYPE_RGBA;
      format.cColorBits = 24;
      format.iLayerType = PFD_MAIN_PLANE;
      const int chosen = ::ChoosePixelFormat(device_, &format);
      if (chosen == 0 || !::SetPixelFormat(device_, chosen, &format)) Fail();
    }
    KPrepareWGLDispatch();
    context_ = wglCreateContext(device_);
    if (!context_ || !MakeCurrent()) Fail();
    Release();
  }
  ~WGLWindowContext() override { Close(); }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override {
    KPrepareWGLDispatch();
    return wglMakeCurrent(device_, context_) == TRUE;
  }
  void Release() noexcept override { wglMakeCurrent(nullptr, nullptr); }
  void Present() noexcept override { ::SwapBuffers(device_); }

private:
  [[noreturn]] void Fail() {
    Close();
    throw KException("OpenGL is not available on this system.");
  }
  void Close() noexcept {
    if (context_) {
      if (wglGetCurrentContext() == context_) Release();
      wglDeleteContext(context_);
    }
    if (device_) ::ReleaseDC(window_, device_);
    context_ = nullptr;
    device_ = nullptr;
  }

  HWND window_;
  int32_t width_, height_;
  HDC device_ = nullptr;
  HGLRC context_ = nullptr;
};
}  // namespace

std::unique_ptr<KOpenGLWindowContext> KOpenGLWindowContext::CreateForWin32(HWND__* window, int32_t width, int32_t height) {
  return std::make_unique<WGLWindowContext>(window, width, height);
}
