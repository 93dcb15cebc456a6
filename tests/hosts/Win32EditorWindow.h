#pragma once
// What the Windows editor tests share: a host's top-level window on the desktop (under Wine on a
// virtual X server), its message loop pumped as a host's would be, the editor's child window
// found in it, screenshots from the screen, and pictures compared within the drawers' tolerance
// with the snapshots the Linux build draws offline.
#include <gtest/gtest.h>
#include <windows.h>

#include <cstdio>
#include <cstdlib>
#include <string>

#include "tests/ui/EditorTestSupport.h"
#include "ui/KBitmap.h"
#include "ui/KGeometry.h"

namespace KWin32Test {

// The Linux build's offline snapshot of a plug-in's editor at scale 1 (class name, "KUtilityPlugin").
inline KBitmap LinuxSnapshot(const std::string& plugin) {
  std::string png;
  if (FILE* file = std::fopen((std::string(TORVANE_LINUX_SNAPSHOTS) + "/" + plugin + ".png").c_str(), "rb")) {
    char block[4096];
    for (size_t got; (got = std::fread(block, 1, sizeof block, file)) > 0;) png.append(block, got);
    std::fclose(file);
  }
  EXPECT_FALSE(png.empty()) << plugin;
  return png.empty() ? KBitmap() : KBitmap::Decode(png, "snapshot");
}

inline int64_t DifferencesShown(const KBitmap& shown, const KBitmap& expected, const char* name, KRect area = {});

inline RECT WindowBox(HWND window) {
  RECT box{};
  ::GetWindowRect(window, &box);
  return box;
}
inline std::pair<int32_t, int32_t> SizeOf(HWND window) {
  const RECT box = WindowBox(window);
  return {box.right - box.left, box.bottom - box.top};
}

// The only child of `parent` (null when it has none or several).
inline HWND OnlyChild(HWND parent) {
  HWND first = ::GetWindow(parent, GW_CHILD);
  return first && !::GetWindow(first, GW_HWNDNEXT) ? first : nullptr;
}
inline int32_t ChildCount(HWND parent) {
  int32_t count = 0;
  for (HWND child = ::GetWindow(parent, GW_CHILD); child; child = ::GetWindow(child, GW_HWNDNEXT)) ++count;
  return count;
}

// The thread's messages handled for `rounds` rounds of 15 ms: the editor's timer and paints run.
inline void Pump(int rounds = 10) {
  for (int i = 0; i < rounds; ++i) {
    ::Sleep(15);
    MSG message;
    while (::PeekMessageW(&message, nullptr, 0, 0, PM_REMOVE)) {
      ::TranslateMessage(&message);
      ::DispatchMessageW(&message);
    }
  }
}

// What the screen shows of `window`'s client area, width × height pixels from its corner, as GDI
// reads the screen. Under Wine that is what GDI painted: the pictures OpenGL presents into child
// windows go to X drawables of their own, which this does not see.
inline KBitmap Screenshot(HWND window, int32_t width, int32_t height) {
  POINT corner{0, 0};
  ::ClientToScreen(window, &corner);
  HDC screen = ::GetDC(nullptr);
  HDC memory = ::CreateCompatibleDC(screen);
  BITMAPINFO info{};
  info.bmiHeader.biSize = sizeof(info.bmiHeader);
  info.bmiHeader.biWidth = width;
  info.bmiHeader.biHeight = -height;
  info.bmiHeader.biPlanes = 1;
  info.bmiHeader.biBitCount = 32;
  info.bmiHeader.biCompression = BI_RGB;
  void* bits = nullptr;
  HBITMAP target = ::CreateDIBSection(memory, &info, DIB_RGB_COLORS, &bits, nullptr, 0);
  HGDIOBJ previous = ::SelectObject(memory, target);
  ::BitBlt(memory, 0, 0, width, height, screen, corner.x, corner.y, SRCCOPY);
  ::GdiFlush();
  KBitmap picture(width, height);
  const auto* pixels = static_cast<const uint32_t*>(bits);
  for (int32_t y = 0; y < height; ++y)
    for (int32_t x = 0; x < width; ++x) picture.Row(y)[x] = 0xFF000000u | pixels[y * width + x];
  ::SelectObject(memory, previous);
  ::DeleteObject(target);
  ::DeleteDC(memory);
  ::ReleaseDC(nullptr, screen);
  return picture;
}

inline int64_t DifferencesShown(const KBitmap& shown, const KBitmap& expected, const char* name, KRect area) {
  const int64_t differences = KEditorPictureDifferences(shown, expected, area);
  if (differences != 0 && shown.Width() > 0) {
    ::CreateDirectoryA(TORVANE_UI_PICTURES, nullptr);
    shown.Store(std::string(TORVANE_UI_PICTURES) + name + ".png");
  }
  return differences;
}

// A window class of the test host's own, its windows doing what DefWindowProc does.
inline const wchar_t* HostClass() {
  static const ATOM registered = [] {
    WNDCLASSW type{};
    type.lpfnWndProc = ::DefWindowProcW;
    type.hInstance = ::GetModuleHandleW(nullptr);
    type.hbrBackground = static_cast<HBRUSH>(::GetStockObject(BLACK_BRUSH));
    type.lpszClassName = L"TorvaneTestHost";
    return ::RegisterClassW(&type);
  }();
  return registered ? L"TorvaneTestHost" : nullptr;
}
inline HWND MakeWindow(DWORD style, int32_t x, int32_t y, int32_t width, int32_t height, HWND parent, const wchar_t* type = HostClass(),
                       void* create = nullptr) {
  HWND window = ::CreateWindowExW(0, type, L"Torvane test host", style | WS_VISIBLE | WS_CLIPCHILDREN, x, y, width, height, parent, nullptr,
                                  ::GetModuleHandleW(nullptr), create);
  EXPECT_NE(window, nullptr);
  return window;
}

struct EditorWindowFixture : ::testing::Test {
  HWND parent = nullptr;  // the host's window, at the desktop's corner

  void SetUp() override {
    // Without a display the desktop is Wine's null one: nothing is drawn.
    if (!std::getenv("DISPLAY") || !*std::getenv("DISPLAY")) GTEST_SKIP() << "no display (the test runs under xvfb-run)";
    parent = MakeWindow(WS_POPUP, 0, 0, 1800, 1200, nullptr);
    Pump(2);
  }
  void TearDown() override {
    if (parent) ::DestroyWindow(parent);
    Pump(1);
  }
};

}  // namespace KWin32Test
