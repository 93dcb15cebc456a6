// Window contexts through WGL: the window's own device (its class keeps one per window) with a
// double-buffered pixel format; SwapBuffers shows the back buffer.
#include "ui/platform/KOpenGLWindowContext.h"
#include "ui/platform/KWGLObjects.h"

namespace {
class WGLWindowContext final : public KOpenGLWindowContext {
public:
  WGLWindowContext(HWND window, int32_t width, int32_t height) : width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    wgl_.window = window;
    wgl_.Open(24, 0);
    if (!wgl_.MakeCurrent()) wgl_.Fail();
    wgl_.Release();
  }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override { return wgl_.MakeCurrent(); }
  void Release() noexcept override { wgl_.Release(); }
  void Present() noexcept override { ::SwapBuffers(wgl_.device); }

private:
  int32_t width_, height_;
  KWGLObjects wgl_;
};
}  // namespace

std::unique_ptr<KOpenGLWindowContext> KOpenGLWindowContext::CreateForWin32(HWND__* window, int32_t width, int32_t height) {
  return std::make_unique<WGLWindowContext>(window, width, height);
}
