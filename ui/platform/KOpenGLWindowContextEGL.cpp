// Window contexts through EGL on an X11 connection (Mesa paints with llvmpipe where there is
// no GPU, Xvfb included).
#include <epoxy/egl.h>
#include <X11/Xlib.h>
#include <X11/Xutil.h>

#include <vector>

#include "kernel/KException.h"
#include "ui/platform/KOpenGLWindowContext.h"

namespace {
class EGLWindowContext final : public KOpenGLWindowContext {
public:
  EGLWindowContext(Display* x, Window window, int32_t width, int32_t height) : width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    // Without these the entry point below is missing, and calling it would end the process.
    if (!epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_EXT_platform_base") ||
        (!epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_KHR_platform_x11") &&
         !epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_EXT_platform_x11")))
      Fail();
    display_ = eglGetPlatformDisplayEXT(EGL_PLATFORM_X11_KHR, x, nullptr);
    EGLint major = 0, minor = 0;
    if (display_ == EGL_NO_DISPLAY || !eglInitialize(display_, &major, &minor)) Fail();
    initialised_ = true;
    if (!eglBindAPI(EGL_OPENGL_API)) Fail();
    const EGLConfig config = ConfigFor(x, window);
    surface_ = eglCreateWindowSurface(display_, config, static_cast<EGLNativeWindowType>(window), nullptr);
    context_ = eglCreateContext(display_, config, EGL_NO_CONTEXT, nullptr);
    if (surface_ == EGL_NO_SURFACE || context_ == EGL_NO_CONTEXT || !MakeCurrent()) Fail();
    Release();
  }
  ~EGLWindowContext() override { Close(); }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override { return eglMakeCurrent(display_, surface_, surface_, context_) == EGL_TRUE; }
  void Release() noexcept override { eglMakeCurrent(display_, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT); }
  void Present() noexcept override { eglSwapBuffers(display_, surface_); }

private:
  // A configuration painting windows of the window's own visual, so that the host's parent
  // window and ours agree on pixels.
  EGLConfig ConfigFor(Display* x, Window window) {
    XWindowAttributes attributes{};
    if (!XGetWindowAttributes(x, window, &attributes)) Fail();
    const EGLint wanted = static_cast<EGLint>(XVisualIDFromVisual(attributes.visual));
    const EGLint query[] = {EGL_SURFACE_TYPE, EGL_WINDOW_BIT, EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8,
                            EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT, EGL_NONE};
    EGLint count = 0;
    if (!eglChooseConfig(display_, query, nullptr, 0, &count) || count < 1) Fail();
    std::vector<EGLConfig> configs(static_cast<size_t>(count));
    eglChooseConfig(display_, query, configs.data(), count, &count);
    for (EGLConfig config : configs) {
      EGLint visual = 0;
      if (eglGetConfigAttrib(display_, config, EGL_NATIVE_VISUAL_ID, &visual) && visual == wanted) return config;
    }
    Fail();
  }
  [[noreturn]] void Fail() {
    Close();
    throw KException("OpenGL is not available on this system.");
  }
  void Close() noexcept {
    if (display_ == EGL_NO_DISPLAY) return;
    Release();
    if (context_ != EGL_NO_CONTEXT) eglDestroyContext(display_, context_);
    if (surface_ != EGL_NO_SURFACE) eglDestroySurface(display_, surface_);
    // The EGL display belongs to this window's own X connection, which closes after it.
    if (initialised_) eglTerminate(display_);
    context_ = EGL_NO_CONTEXT;
    surface_ = EGL_NO_SURFACE;
    display_ = EGL_NO_DISPLAY;
  }

  int32_t width_, height_;
  EGLDisplay display_ = EGL_NO_DISPLAY;
  EGLSurface surface_ = EGL_NO_SURFACE;
  EGLContext context_ = EGL_NO_CONTEXT;
  bool initialised_ = false;
};
}  // namespace

std::unique_ptr<KOpenGLWindowContext> KOpenGLWindowContext::CreateForX11(_XDisplay* display, unsigned long window,
                                                                         int32_t width, int32_t height) {
  return std::make_unique<EGLWindowContext>(display, window, width, height);
}
