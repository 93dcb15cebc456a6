// Off-screen OpenGL contexts through EGL: Mesa's surfaceless platform, so that no display
// server is needed; a pixel buffer of the requested size is the default framebuffer.
#include "ui/platform/KEGLObjects.h"
#include "ui/platform/KOpenGLContext.h"

namespace {
class EGLContextOffscreen final : public KOpenGLContext {
public:
  EGLContextOffscreen(int32_t width, int32_t height) : width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    // The display stays initialised when the context closes: other contexts of the process
    // may share it.
    if (epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_MESA_platform_surfaceless"))
      egl_.display = eglGetPlatformDisplayEXT(EGL_PLATFORM_SURFACELESS_MESA, EGL_DEFAULT_DISPLAY, nullptr);
    if (egl_.display == EGL_NO_DISPLAY) egl_.display = eglGetDisplay(EGL_DEFAULT_DISPLAY);
    EGLint major = 0, minor = 0;
    if (egl_.display == EGL_NO_DISPLAY || !eglInitialize(egl_.display, &major, &minor) || !eglBindAPI(EGL_OPENGL_API))
      egl_.Fail();
    const EGLint attributes[] = {EGL_SURFACE_TYPE, EGL_PBUFFER_BIT, EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8,
                                 EGL_ALPHA_SIZE, 8, EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT, EGL_NONE};
    EGLConfig config = nullptr;
    EGLint count = 0;
    if (!eglChooseConfig(egl_.display, attributes, &config, 1, &count) || count < 1) egl_.Fail();
    const EGLint size[] = {EGL_WIDTH, width, EGL_HEIGHT, height, EGL_NONE};
    egl_.surface = eglCreatePbufferSurface(egl_.display, config, size);
    egl_.context = eglCreateContext(egl_.display, config, EGL_NO_CONTEXT, nullptr);
    if (egl_.surface == EGL_NO_SURFACE || egl_.context == EGL_NO_CONTEXT) egl_.Fail();
  }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override { return egl_.MakeCurrent(); }
  void Release() noexcept override { egl_.Release(); }

private:
  int32_t width_, height_;
  KEGLObjects egl_;
};
}  // namespace

KOpenGLContext::~KOpenGLContext() = default;

std::unique_ptr<KOpenGLContext> KOpenGLContext::CreateOffscreen(int32_t width, int32_t height) {
  return std::make_unique<EGLContextOffscreen>(width, height);
}
