// The software drawer painting a Win32 window: a back buffer that keeps the picture, of which
// only the changed pixels go to the window through GDI.
#include <windows.h>

#include "ui/platform/KSoftwareSurface.h"

namespace {
class GDISoftwareSurface final : public KSoftwareSurface {
public:
  GDISoftwareSurface(HWND window, int32_t width, int32_t height, double scale) : KSoftwareSurface(width, height, scale), window_(window) {}

  void Show(const KRect& changed) override {
    if (changed.IsEmpty()) return;
    // The back buffer's 0xAARRGGBB words are a top-down 32-bit device-independent bitmap.
    BITMAPINFO info{};
    info.bmiHeader.biSize = sizeof(info.bmiHeader);
    info.bmiHeader.biWidth = backBuffer_.Width();
    info.bmiHeader.biHeight = -backBuffer_.Height();
    info.bmiHeader.biPlanes = 1;
    info.bmiHeader.biBitCount = 32;
    info.bmiHeader.biCompression = BI_RGB;
    HDC device = ::GetDC(window_);
    if (!device) return;
    // Only the repainted area reaches the window: the rest is clipped away.
    ::IntersectClipRect(device, changed.left, changed.top, changed.right + 1, changed.bottom + 1);
    ::SetDIBitsToDevice(device, 0, 0, static_cast<DWORD>(backBuffer_.Width()), static_cast<DWORD>(backBuffer_.Height()), 0, 0, 0,
                        static_cast<UINT>(backBuffer_.Height()), backBuffer_.Pixels(), &info, DIB_RGB_COLORS);
    // The window's device is its own (one per window): the clip must not outlive this paint.
    ::SelectClipRgn(device, nullptr);
    ::ReleaseDC(window_, device);
  }

private:
  HWND window_;
};
}  // namespace

std::unique_ptr<KWindowSurface> KWindowSurface::Win32Software(HWND__* window, int32_t width, int32_t height, double scale) {
  return std::make_unique<GDISoftwareSurface>(window, width, height, scale);
}
