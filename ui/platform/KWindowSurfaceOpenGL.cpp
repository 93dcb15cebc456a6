// The OpenGL drawer painting a window: into its off-screen framebuffer, which keeps the picture
// between paints, copied into the back buffer and swapped in when something changed.
#include "kernel/KException.h"
#include "ui/KDrawerOpenGL.h"
#include "ui/platform/KOpenGLWindowContext.h"
#include "ui/platform/KWindowSurface.h"

namespace {
class OpenGLSurface final : public KWindowSurface {
public:
  OpenGLSurface(std::unique_ptr<KOpenGLWindowContext> context, double scale)
      : context_(std::move(context)), drawer_(*context_, scale) {
    drawer_.Attach();
    if (!KDrawerOpenGL::IsCapable()) throw KException("The graphics card cannot hold the editor's pictures.");
  }

  KDrawer& Drawer() noexcept override { return drawer_; }
  bool IsOpenGL() const noexcept override { return true; }
  // Without the off-screen framebuffer the drawer paints the back buffer, which a swap loses.
  bool KeepsPicture() const noexcept override { return drawer_.HasFramebuffer(); }
  void Begin() override { drawer_.BeginPaint(); }
  void Show(const KRect& changed) override {
    if (!changed.IsEmpty()) {
      drawer_.CopyToDefaultFramebuffer();
      context_->Present();
    }
    drawer_.EndPaint();
  }
  KBitmap Picture() override { return drawer_.GetScreenShot(); }

private:
  std::unique_ptr<KOpenGLWindowContext> context_;
  KDrawerOpenGL drawer_;
};
}  // namespace

std::unique_ptr<KWindowSurface> KWindowSurface::OpenGL(std::unique_ptr<KOpenGLWindowContext> context, double scale) {
  return std::make_unique<OpenGLSurface>(std::move(context), scale);
}
