// Off-screen OpenGL contexts through WGL: a hidden window of the requested size gives the
// context its device and default framebuffer; the drawer paints into its framebuffer object
// where the driver offers one, so the window never needs to be shown.
#include "ui/platform/KOpenGLContext.h"
#include "ui/platform/KWGLObjects.h"
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
    if (!registered) wgl_.Fail();
    wgl_.window = ::CreateWindowExW(0, kClassName, L"", WS_POPUP, 0, 0, width, height, nullptr, nullptr, KThisModule(), nullptr);
    wgl_.ownsWindow = true;
    wgl_.Open(32, 8);
  }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override { return wgl_.MakeCurrent(); }
  void Release() noexcept override { wgl_.Release(); }

private:
  int32_t width_, height_;
  KWGLObjects wgl_;
};
}  // namespace

KOpenGLContext::~KOpenGLContext() = default;

std::unique_ptr<KOpenGLContext> KOpenGLContext::CreateOffscreen(int32_t width, int32_t height) {
  return std::make_unique<WGLContextOffscreen>(width, height);
}
