// Window contexts through EGL on an X11 connection (Mesa paints with llvmpipe where there is
// no GPU, Xvfb included).
#include "ui/platform/KEGLObjects.h"
#include "ui/platform/KOpenGLWindowContext.h"

#include <X11/Xlib.h>
#include <X11/Xutil.h>

#include <vector>

namespace {
class EGLWindowContext final : public KOpenGLWindowContext {
public:
  EGLWindowContext(Display* x, Window window, int32_t width, int32_t height) : width_(width), height_(height) {
    if (width <= 0 || height <= 0) throw KException("The drawing area is empty.");
    // Without these the entry point below is missing, and calling it would end the process.
    if (!epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_EXT_platform_base") ||
        (!epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_KHR_platform_x11") &&
         !epoxy_has_egl_extension(EGL_NO_DISPLAY, "EGL_EXT_platform_x11")))
      egl_.Fail();
    // The EGL display belongs to this window's own X connection, which closes after it.
    egl_.display = eglGetPlatformDisplayEXT(EGL_PLATFORM_X11_KHR, x, nullptr);
    EGLint major = 0, minor = 0;
    if (egl_.display == EGL_NO_DISPLAY || !eglInitialize(egl_.display, &major, &minor)) egl_.Fail();
    egl_.ownsDisplay = true;
    if (!eglBindAPI(EGL_OPENGL_API)) egl_.Fail();
    const EGLConfig config = ConfigFor(x, window);
    egl_.surface = eglCreateWindowSurface(egl_.display, config, static_cast<EGLNativeWindowType>(window), nullptr);
    egl_.context = eglCreateContext(egl_.display, config, EGL_NO_CONTEXT, nullptr);
    if (egl_.surface == EGL_NO_SURFACE || egl_.context == EGL_NO_CONTEXT || !egl_.MakeCurrent()) egl_.Fail();
    egl_.Release();
  }

  int32_t Width() const noexcept override { return width_; }
  int32_t Height() const noexcept override { return height_; }
  bool MakeCurrent() noexcept override { return egl_.MakeCurrent(); }
  void Release() noexcept override { egl_.Release(); }
  void Present() noexcept override { eglSwapBuffers(egl_.display, egl_.surface); }

private:
  // A configuration painting windows of the window's own visual, so that the host's parent
  // window and ours agree on pixels.
  EGLConfig ConfigFor(Display* x, Window window) {
    XWindowAttributes attributes{};
    if (!XGetWindowAttributes(x, window, &attributes)) egl_.Fail();
    const EGLint wanted = static_cast<EGLint>(XVisualIDFromVisual(attributes.visual));
    const EGLint query[] = {EGL_SURFACE_TYPE, EGL_WINDOW_BIT, EGL_RED_SIZE, 8, EGL_GREEN_SIZE, 8, EGL_BLUE_SIZE, 8,
                            EGL_RENDERABLE_TYPE, EGL_OPENGL_BIT, EGL_NONE};
    EGLint count = 0;
    if (!eglChooseConfig(egl_.display, query, nullptr, 0, &count) || count < 1) egl_.Fail();
    std::vector<EGLConfig> configs(static_cast<size_t>(count));
    eglChooseConfig(egl_.display, query, configs.data(), count, &count);
    for (EGLConfig config : configs) {
      EGLint visual = 0;
      if (eglGetConfigAttrib(egl_.display, config, EGL_NATIVE_VISUAL_ID, &visual) && visual == wanted) return config;
    }
    egl_.Fail();
  }

  int32_t width_, height_;
  KEGLObjects egl_;
};
}  // namespace

std::unique_ptr<KOpenGLWindowContext> KOpenGLWindowContext::CreateForX11(_XDisplay* display, unsigned long window,
                                                                         int32_t width, int32_t height) {
  return std::make_unique<EGLWindowContext>(display, window, width, height);
}
