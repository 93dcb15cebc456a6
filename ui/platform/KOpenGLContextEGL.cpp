// Off-screen OpenGL contexts through EGL: Mesa's surfaceless platform, so that no display
// server is needed; a pixel buffer of the requested size is the default framebuffer.
#include <epoxy/egl.h>

#include "kernel/KException.h"
#include "ui/platform/KOpenGLContext.h"

namespace {
class EGLContextOffscreen final : public KOpenGLContext {
public:
  EGLContextOffscreen(int32_t width, int32_t height) : width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    if (epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_MESA_platform_surfaceless"))
      display_ = eglGetPlatformDisplayEXT(EGL_PLATFORM_SURFACELESS_MESA, EGL_DEFAULT_DISPLAY, nullptr);
    if (display_ == EGL_NO_DISPLAY) display_ = eglGetDisplay(EGL_DEFAULT_DISPLAY);
    EGLint major = 0, minor = 0;
    if (display_ == EGL_NO_DISPLAY || !eglInitialize(display_, &major, &minor) || !eglBindAPI(EGL_OPENGL_API))
      Fail();
    const EGLint attributes[] = {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8,
                                 EGL_ALPHA_SIZE, 8, EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT, EGL_NONE};
    EGLConfig config = nullptr;
    EGLint count = 0;
    if (!eglChooseConfig(display_, attributes, &config, 1, &count) || count < 1) Fail();
    const EGLint size[] = {EGL_WIDTH, width, EGL_HEIGHT, height, EGL_NONE};
    surface_ = eglCreatePbufferSurface(display_, config, size);
    context_ = eglCreateContext(display_, config, EGL_NO_CONTEXT, nullptr);
    if (surface_ == EGL_NO_SURFACE || context_ == EGL_NO_CONTEXT) Fail();
  }
  ~EGLContextOffscreen() override { Close(); }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override { return eglMakeCurrent(display_, surface_, surface_, context_) == EGL_TRUE; }
  void Release() noexcept override { eglMakeCurrent(display_, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT); }

private:
  [[noreturn]] void Fail() {
    Close();
    throw KException("OpenGL is not available on this system.");
  }
  void Close() noexcept {
    if (display_ == EGL_NO_DISPLAY) return;
    Release();
    if (context_ != EGL_NO_CONTEXT) eglDestroyContext(display_, context_);
    if (surface_ != EGL_NO_SURFACE) eglDestroySurface(display_, surface_);
    context_ = EGL_NO_CONTEXT;
    surface_ = EGL_NO_SURFACE;
    // The display stays initialised: other contexts of the process may share it.
    display_ = EGL_NO_DISPLAY;
  }

  int32_t width_, height_;
  EGLDisplay display_ = EGL_NO_DISPLAY;
  EGLSurface surface_ = EGL_NO_SURFACE;
  EGLContext context_ = EGL_NO_CONTEXT;
};
}  // namespace

KOpenGLContext::~KOpenGLContext() = default;

std::unique_ptr<KOpenGLContext> KOpenGLContext::CreateOffscreen(int32_t width, int32_t height) {
  return std::make_unique<EGLContextOffscreen>(width, height);
}
