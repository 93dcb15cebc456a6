// Off-screen OpenGL contexts through WGL: a hidden window of the requested size gives the
// context its device and default framebuffer; the drawer paints into its framebuffer object
// where the driver offers one, so the window never needs to be shown.
#include <epoxy/wgl.h>
#include <windows.h>

#include "kernel/KException.h"
#include "ui/platform/KOpenGLContext.h"
#include "ui/platform/KWGLDispatch.h"
#include "ui/platform/KWin32Module.h"

namespace {
constexpr wchar_t kClassName[] = L"TorvaneOpenGLSurface";

ATOM RegisterSurfaceClass() noexcept {
  WNDCLASSW type{};
  type.style = CS_OWNDC;
  type.lpfnWndProc = ::DefWindowProcW;
  type.hInstance = KThisModule();
  type.lpszClassName = kClassName;
  return ::RegisterClassW(&type);
}

class WGLContextOffscreen final : public KOpenGLContext {
public:
  WGLContextOffscreen(int32_t width, int32_t height) : width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    static const ATOM registered = RegisterSurfaceClass();
    if (!registered) Fail();
    window_ = ::CreateWindowExW(0, kClassName, L"", WS_POPUP, 0, 0, width, height, nullptr, nullptr, KThisModule(), nullptr);
    device_ = window_ ? ::GetDC(window_) : nullptr;
    if (!device_) Fail();
    PIXELFORMATDESCRIPTOR format{};
    format.nSize = sizeof(format);
    format.nVersion = 1;
    format.dwFlags = PFD_DRAW_TO_WINDOW | PFD_SUPPORT_OPENGL | PFD_DOUBLEBUFFER;
    format.iPixelType = PFD_TYPE_RGBA;
    format.cColorBits = 32;
    format.cAlphaBits = 8;
    format.iLayerType = PFD_MAIN_PLANE;
    const int chosen = ::ChoosePixelFormat(device_, &format);
    if (chosen == 0 || !::SetPixelFormat(device_, chosen, &format)) Fail();
    KPrepareWGLDispatch();
    context_ = wglCreateContext(device_);
    if (!context_) Fail();
  }
  ~WGLContextOffscreen() override { Close(); }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override {
    KPrepareWGLDispatch();
    return wglMakeCurrent(device_, context_) == TRUE;
  }
  void Release() noexcept override { wglMakeCurrent(nullptr, nullptr); }

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
    if (window_) ::DestroyWindow(window_);
    context_ = nullptr;
    device_ = nullptr;
    window_ = nullptr;
  }

  int32_t width_, height_;
  HWND window_ = nullptr;
  HDC device_ = nullptr;
  HGLRC context_ = nullptr;
};
}  // namespace

KOpenGLContext::~KOpenGLContext() = default;

std::unique_ptr<KOpenGLContext> KOpenGLContext::CreateOffscreen(int32_t width, int32_t height) {
  return std::make_unique<WGLContextOffscreen>(width, height);
}
