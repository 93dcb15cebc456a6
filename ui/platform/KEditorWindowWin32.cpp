#include "ui/platform/KEditorWindowWin32.h"

#include <windows.h>
#include <windowsx.h>

#include <algorithm>
#include <cmath>
#include <cwchar>

#include "kernel/KException.h"
#include "ui/editor/KEditor.h"
#include "ui/platform/KEditorPaint.h"
#include "ui/platform/KOpenGLWindowContext.h"
#include "ui/platform/KWin32Module.h"
#include "ui/platform/KWindowSurface.h"

namespace {
constexpr wchar_t kClassName[] = L"TorvaneEditor";
constexpr UINT_PTR kTickTimer = 1;
constexpr UINT kTickMilliseconds = 30;

uint32_t CurrentModifiers() noexcept {
  return ((::GetKeyState(VK_SHIFT) < 0) ? kModShift : 0) | ((::GetKeyState(VK_CONTROL) < 0) ? kModControl : 0) |
         ((::GetKeyState(VK_MENU) < 0) ? kModAlt : 0);
}

int32_t KeyOf(WPARAM key) noexcept {
  switch (key) {
    case VK_F1: return kKeyF1;
    case VK_RETURN: return kKeyReturn;
    case VK_ESCAPE: return kKeyEscape;
    case VK_BACK: return kKeyBackspace;
    case VK_TAB: return kKeyTab;
    case VK_DELETE: return kKeyDelete;
    case VK_LEFT: return kKeyLeft;
    case VK_RIGHT: return kKeyRight;
    case VK_UP: return kKeyUp;
    case VK_DOWN: return kKeyDown;
    case VK_HOME: return kKeyHome;
    case VK_END: return kKeyEnd;
    default: return kKeyNone;
  }
}

LRESULT CALLBACK EditorProcedure(HWND window, UINT message, WPARAM wParam, LPARAM lParam) {
  if (message == WM_NCCREATE)
    ::SetWindowLongPtrW(window, GWLP_USERDATA, reinterpret_cast<LONG_PTR>(reinterpret_cast<CREATESTRUCTW*>(lParam)->lpCreateParams));
  auto* owner = reinterpret_cast<KEditorWindowWin32*>(::GetWindowLongPtrW(window, GWLP_USERDATA));
  // Messages arrive from the host's loop: nothing may escape into it.
  try {
    if (owner && owner->HandleMessage(message, wParam, lParam)) return 0;
  } catch (...) {
    return 0;
  }
  return ::DefWindowProcW(window, message, wParam, lParam);
}

ATOM RegisterEditorClass() noexcept {
  WNDCLASSW type{};
  // A device of its own per window: the pixel format and context of OpenGL stay with it.
  type.style = CS_OWNDC;
  type.lpfnWndProc = EditorProcedure;
  type.hInstance = KThisModule();
  type.hCursor = ::LoadCursorW(nullptr, reinterpret_cast<LPCWSTR>(IDC_ARROW));
  type.lpszClassName = kClassName;
  return ::RegisterClassW(&type);
}
}  // namespace

KEditorWindowWin32::KEditorWindowWin32(uintptr_t parent, KEditor& editor) : editor_(editor) {
  static const ATOM registered = RegisterEditorClass();
  if (registered) {
    window_ = ::CreateWindowExW(0, kClassName, L"", WS_CHILD | WS_VISIBLE | WS_CLIPSIBLINGS, 0, 0, editor_.PixelWidth(),
                                editor_.PixelHeight(), reinterpret_cast<HWND>(parent), nullptr, KThisModule(), this);
  }
  if (!window_) throw KException("The editor cannot open its window.");
  MakeSurface();
  ::SetTimer(window_, kTickTimer, kTickMilliseconds, nullptr);
}

KEditorWindowWin32::~KEditorWindowWin32() {
  ::KillTimer(window_, kTickTimer);
  ::SetWindowLongPtrW(window_, GWLP_USERDATA, 0);
  // The context goes before the window it paints.
  surface_.reset();
  ::DestroyWindow(window_);
}

bool KEditorWindowWin32::PaintsWithOpenGL() const noexcept { return surface_->IsOpenGL(); }
KBitmap KEditorWindowWin32::Picture() { return surface_->Picture(); }

void KEditorWindowWin32::MakeSurface() {
  surface_.reset();
  const int32_t width = editor_.PixelWidth(), height = editor_.PixelHeight();
  surface_ = KMakeWindowSurface(
      editor_, [&] { return KOpenGLWindowContext::CreateForWin32(window_, width, height); },
      [&] { return KWindowSurface::Win32Software(window_, width, height, editor_.Scale()); });
}

void KEditorWindowWin32::Resize() {
  ::SetWindowPos(window_, nullptr, 0, 0, editor_.PixelWidth(), editor_.PixelHeight(), SWP_NOMOVE | SWP_NOZORDER | SWP_NOACTIVATE);
  MakeSurface();
  PaintDirty();
}

void KEditorWindowWin32::GrowAncestors(int32_t width, int32_t height, int32_t largestFrame) {
  RECT below{};
  ::GetWindowRect(window_, &below);
  for (HWND parent = ::GetParent(window_); parent; parent = ::GetParent(parent)) {
    wchar_t type[16] = {};
    if (::GetClassNameW(parent, type, 16) && std::wcscmp(type, L"MDIClient") == 0) break;
    RECT size{};
    if (!::GetWindowRect(parent, &size)) break;
    const int32_t frameX = std::max<int32_t>(0, (size.right - size.left) - (below.right - below.left));
    const int32_t frameY = std::max<int32_t>(0, (size.bottom - size.top) - (below.bottom - below.top));
    if (frameX > largestFrame || frameY > largestFrame) break;
    width += frameX;
    height += frameY;
    ::SetWindowPos(parent, nullptr, 0, 0, width, height, SWP_NOMOVE | SWP_NOZORDER | SWP_NOACTIVATE);
    below = size;
  }
}

void KEditorWindowWin32::ProcessEvents() { PaintDirty(); }

void KEditorWindowWin32::Tick() {
  editor_.Tree().Tick();
  PaintDirty();
}

bool KEditorWindowWin32::HandleMessage(unsigned message, uintptr_t wParam, intptr_t lParam) {
  KControlTree& tree = editor_.Tree();
  const double scale = editor_.Scale();
  const KPoint at{static_cast<int32_t>(std::floor(GET_X_LPARAM(lParam) / scale)), static_cast<int32_t>(std::floor(GET_Y_LPARAM(lParam) / scale))};
  switch (message) {
    case WM_PAINT: {
      PAINTSTRUCT paint;
      ::BeginPaint(window_, &paint);
      ::EndPaint(window_, &paint);
      tree.InvalidateAll();
      PaintDirty();
      return true;
    }
    case WM_ERASEBKGND: return true;
    case WM_TIMER: Tick(); return true;
    case WM_LBUTTONDOWN:
      ::SetCapture(window_);
      ::SetFocus(window_);
      tree.MouseDown({at, CurrentModifiers()}, ::GetMessageTime());
      break;
    case WM_LBUTTONUP:
      ::ReleaseCapture();
      tree.MouseUp({at, CurrentModifiers()});
      break;
    case WM_MOUSEMOVE: tree.MouseMove({at, CurrentModifiers()}); break;
    case WM_MOUSEWHEEL: {
      // Wheel positions are in screen coordinates.
      POINT screen{GET_X_LPARAM(lParam), GET_Y_LPARAM(lParam)};
      ::ScreenToClient(window_, &screen);
      const KPoint point{static_cast<int32_t>(std::floor(screen.x / scale)), static_cast<int32_t>(std::floor(screen.y / scale))};
      tree.Wheel({point, CurrentModifiers(), GET_WHEEL_DELTA_WPARAM(wParam) / double(WHEEL_DELTA)});
      break;
    }
    case WM_KEYDOWN:
      if (const int32_t code = KeyOf(wParam); code != kKeyNone) tree.Key({code, CurrentModifiers()});
      else return false;
      break;
    case WM_CHAR:
      if (wParam >= 0x20 && wParam <= 0xFF) tree.Key({static_cast<int32_t>(wParam), CurrentModifiers()});
      break;
    default: return false;
  }
  PaintDirty();
  return true;
}

int64_t KEditorWindowWin32::PaintDirty() { return KPaintEditorDirty(editor_, *surface_, lastFullPaintMs_); }
