#include "ui/platform/KEditorWindowX11.h"

#include <X11/Xlib.h>
#include <X11/Xutil.h>
#include <X11/keysym.h>

#include <cmath>

#include "kernel/KException.h"
#include "ui/editor/KEditor.h"
#include "ui/platform/KEditorPaint.h"
#include "ui/platform/KOpenGLWindowContext.h"
#include "ui/platform/KWindowSurface.h"

namespace {

uint32_t ModifiersOf(unsigned int state) noexcept {
  return ((state & ShiftMask) ? kModShift : 0) | ((state & ControlMask) ? kModControl : 0) | ((state & Mod1Mask) ? kModAlt : 0);
}

int32_t KeyOf(KeySym symbol) noexcept {
  switch (symbol) {
    case XK_F1: return kKeyF1;
    case XK_Return: case XK_KP_Enter: return kKeyReturn;
    case XK_Escape: return kKeyEscape;
    case XK_BackSpace: return kKeyBackspace;
    case XK_Tab: return kKeyTab;
    case XK_Delete: return kKeyDelete;
    case XK_Left: return kKeyLeft;
    case XK_Right: return kKeyRight;
    case XK_Up: return kKeyUp;
    case XK_Down: return kKeyDown;
    case XK_Home: return kKeyHome;
    case XK_End: return kKeyEnd;
    default: break;
  }
  // Latin-1 key symbols are their characters.
  return symbol >= 0x20 && symbol <= 0xFF ? static_cast<int32_t>(symbol) : kKeyNone;
}

}  // namespace

KEditorWindowX11::KEditorWindowX11(unsigned long parent, KEditor& editor) : editor_(editor) {
  display_ = XOpenDisplay(nullptr);
  if (!display_) throw KException("The editor cannot open its window: there is no X display.");
  window_ = XCreateSimpleWindow(display_, parent, 0, 0, static_cast<unsigned>(editor_.PixelWidth()),
                                static_cast<unsigned>(editor_.PixelHeight()), 0, 0, 0);
  XSelectInput(display_, window_,
               ExposureMask | ButtonPressMask | ButtonReleaseMask | PointerMotionMask | KeyPressMask | StructureNotifyMask |
                   EnterWindowMask);
  XMapWindow(display_, window_);
  XSync(display_, False);
  MakeSurface();
}

KEditorWindowX11::~KEditorWindowX11() {
  surface_.reset();
  XDestroyWindow(display_, window_);
  XCloseDisplay(display_);
}

bool KEditorWindowX11::PaintsWithOpenGL() const noexcept { return surface_->IsOpenGL(); }
KBitmap KEditorWindowX11::Picture() { return surface_->Picture(); }

int KEditorWindowX11::FileDescriptor() const noexcept { return ConnectionNumber(display_); }

void KEditorWindowX11::MakeSurface() {
  surface_.reset();
  const int32_t width = editor_.PixelWidth(), height = editor_.PixelHeight();
  surface_ = KMakeWindowSurface(
      editor_, [&] { return KOpenGLWindowContext::CreateForX11(display_, window_, width, height); },
      [&] { return KWindowSurface::X11Software(display_, window_, width, height, editor_.Scale()); });
}

void KEditorWindowX11::Resize() {
  XResizeWindow(display_, window_, static_cast<unsigned>(editor_.PixelWidth()), static_cast<unsigned>(editor_.PixelHeight()));
  XSync(display_, False);
  MakeSurface();
  PaintDirty();
}

void KEditorWindowX11::GrowAncestors(int32_t width, int32_t height, int32_t largestFrame) {
  ::Window below = window_;
  XWindowAttributes belowSize{};
  XGetWindowAttributes(display_, below, &belowSize);
  for (;;) {
    ::Window root = 0, parent = 0, *children = nullptr;
    unsigned int count = 0;
    if (!XQueryTree(display_, below, &root, &parent, &children, &count)) break;
    if (children) XFree(children);
    XWindowAttributes size{};
    if (parent == 0 || parent == root || !XGetWindowAttributes(display_, parent, &size)) break;
    const int32_t frameX = std::max(0, size.width - belowSize.width), frameY = std::max(0, size.height - belowSize.height);
    if (frameX > largestFrame || frameY > largestFrame) break;
    width += frameX;
    height += frameY;
    XResizeWindow(display_, parent, static_cast<unsigned>(width), static_cast<unsigned>(height));
    below = parent;
    belowSize = size;
  }
  XFlush(display_);
}

void KEditorWindowX11::ProcessEvents() {
  while (XPending(display_) > 0) {
    XEvent event;
    XNextEvent(display_, &event);
    HandleEvent(event);
  }
  PaintDirty();
}

void KEditorWindowX11::Tick() {
  editor_.Tree().Tick();
  ProcessEvents();
}

void KEditorWindowX11::HandleEvent(const XEvent& event) {
  KControlTree& tree = editor_.Tree();
  const double scale = editor_.Scale();
  const auto at = [scale](int x, int y) {
    return KPoint{static_cast<int32_t>(std::floor(x / scale)), static_cast<int32_t>(std::floor(y / scale))};
  };
  switch (event.type) {
    case Expose:
      if (event.xexpose.count == 0) tree.InvalidateAll();
      break;
    case ButtonPress: {
      const XButtonEvent& b = event.xbutton;
      const KMouseEvent mouse{at(b.x, b.y), ModifiersOf(b.state), b.button == Button4 ? 1.0 : b.button == Button5 ? -1.0 : 0.0};
      if (b.button == Button1) tree.MouseDown(mouse, b.time);
      else if (mouse.wheel != 0) tree.Wheel(mouse);
      break;
    }
    case ButtonRelease:
      if (event.xbutton.button == Button1) tree.MouseUp({at(event.xbutton.x, event.xbutton.y), ModifiersOf(event.xbutton.state)});
      break;
    case MotionNotify:
      tree.MouseMove({at(event.xmotion.x, event.xmotion.y), ModifiersOf(event.xmotion.state)});
      break;
    case EnterNotify:
      // Keys reach a child window only with the focus; the host gives it back on leaving.
      XSetInputFocus(display_, window_, RevertToParent, CurrentTime);
      break;
    case KeyPress: {
      XKeyEvent key = event.xkey;
      const KeySym symbol = XLookupKeysym(&key, (key.state & ShiftMask) ? 1 : 0);
      const int32_t code = KeyOf(symbol);
      if (code != kKeyNone) tree.Key({code, ModifiersOf(key.state)});
      break;
    }
    default:
      break;
  }
}

int64_t KEditorWindowX11::PaintDirty() { return KPaintEditorDirty(editor_, *surface_, lastFullPaintMs_); }
