// The software drawer painting an X11 window: a back buffer that keeps the picture, of which
// only the changed pixels travel to the server.
#include <X11/Xlib.h>
#include <X11/Xutil.h>

#include "ui/platform/KSoftwareSurface.h"

namespace {
class X11SoftwareSurface final : public KSoftwareSurface {
public:
  X11SoftwareSurface(Display* display, Window window, int32_t width, int32_t height, double scale)
      : KSoftwareSurface(width, height, scale), display_(display), window_(window), gc_(XCreateGC(display, window, 0, nullptr)) {}
  ~X11SoftwareSurface() override { XFreeGC(display_, gc_); }

  void Show(const KRect& changed) override {
    if (changed.IsEmpty()) return;
    // The back buffer's pixels are 0xAARRGGBB words: the layout of a 24-bit TrueColor visual.
    XImage* image = XCreateImage(display_, DefaultVisual(display_, DefaultScreen(display_)), 24, ZPixmap, 0,
                                 reinterpret_cast<char*>(backBuffer_.Pixels()), static_cast<unsigned>(backBuffer_.Width()),
                                 static_cast<unsigned>(backBuffer_.Height()), 32, backBuffer_.Width() * 4);
    if (!image) return;
    XPutImage(display_, window_, gc_, image, changed.left, changed.top, changed.left, changed.top,
              static_cast<unsigned>(changed.right - changed.left + 1), static_cast<unsigned>(changed.bottom - changed.top + 1));
    image->data = nullptr;  // the back buffer's, not the image's to free
    XDestroyImage(image);
    XFlush(display_);
  }

private:
  Display* display_;
  Window window_;
  GC gc_;
};
}  // namespace

std::unique_ptr<KWindowSurface> KWindowSurface::X11Software(_XDisplay* display, unsigned long window, int32_t width,
                                                            int32_t height, double scale) {
  return std::make_unique<X11SoftwareSurface>(display, window, width, height, scale);
}
