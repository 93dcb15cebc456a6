#pragma once
// What the editor tests of every host format share: a host's window on the virtual X server,
// the editor's child window found in it, screenshots, and pictures compared within the drawers'
// tolerance.
#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <string>

#include "core/KAudioPlugin.h"
#include "plugins/KPluginEditors.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/KBitmap.h"
#include "ui/KGeometry.h"
#include "ui/controls/KValueControl.h"
#include "ui/editor/KEditor.h"
// Last: X11's macros (None, Bool, Status) would break the headers above.
#include <X11/Xlib.h>
#include <X11/Xutil.h>

namespace KX11Test {

inline bool Shell(const std::string& command) { return std::system(command.c_str()) == 0; }

// Where the knob of the parameter `key` lies in the plug-in's editor at scale 1 (the generated
// layout is the same for every instance).
inline KPoint KnobCentre(KAudioPlugin& plugin, const char* key) {
  const std::unique_ptr<KEditor> layout = KMakePluginEditor(plugin, nullptr);
  const int32_t index = plugin.FindParameter(KString::FromUtf8(key))->Index();
  KKnob* knob = KFindControl<KKnob>(layout->Tree().Root(), [&](KKnob& k) { return k.Link().Index() == index; });
  EXPECT_NE(knob, nullptr) << key;
  return knob ? KCentreOf(*knob) : KPoint{};
}

// A drag of 40 pixels down from `at` in `window`, in steps of 10, as a user's mouse makes it.
inline bool DragDown(unsigned long window, KPoint at) {
  const std::string w = std::to_string(window), x = std::to_string(at.x);
  bool moved = Shell("xdotool mousemove --window " + w + " " + x + " " + std::to_string(at.y) + " mousedown 1");
  for (int dy = 10; dy <= 40; dy += 10) moved = moved && Shell("xdotool mousemove --window " + w + " " + x + " " + std::to_string(at.y + dy));
  return Shell("xdotool mouseup 1") && moved;
}
// Whether `kinds` (one letter per host call on a parameter) is one whole gesture: a begin, at
// least one value, an end.
inline bool IsOneGesture(const std::string& kinds, char begin, char value, char end) {
  return kinds.size() >= 3 && kinds.front() == begin && kinds.back() == end && kinds.substr(1, kinds.size() - 2) == std::string(kinds.size() - 2, value);
}
inline constexpr double kDragTravel = 40 / KValueControl::kDragTravel;  // the normalised change of DragDown

struct EditorWindowFixture : ::testing::Test {
  // One connection for the whole program: a virtual X server resets when its last client leaves,
  // and would refuse the next test's connection while it does.
  static Display* SharedDisplay() {
    static Display* const shared = XOpenDisplay(nullptr);
    return shared;
  }
  Display* display = SharedDisplay();
  Window parent = 0;

  void SetUp() override {
    if (!display) GTEST_SKIP() << "no X display (the test runs under xvfb-run)";
    if (!Shell("command -v xdotool > /dev/null")) GTEST_SKIP() << "xdotool is missing";
    parent = XCreateSimpleWindow(display, DefaultRootWindow(display), 0, 0, 1800, 1200, 0, 0, 0x202020);
    XMapWindow(display, parent);
    XSync(display, False);
  }
  void TearDown() override {
    if (display && parent) XDestroyWindow(display, parent);
    if (display) XSync(display, False);
  }
  // The editor's window: the one child of the host's window.
  Window Child() {
    XSync(display, False);
    Window root = 0, up = 0, *children = nullptr;
    unsigned int count = 0;
    XQueryTree(display, parent, &root, &up, &children, &count);
    const Window child = count == 1 ? children[0] : 0;
    if (children) XFree(children);
    return child;
  }
  int32_t ChildCount() {
    XSync(display, False);
    Window root = 0, up = 0, *children = nullptr;
    unsigned int count = 0;
    XQueryTree(display, parent, &root, &up, &children, &count);
    if (children) XFree(children);
    return static_cast<int32_t>(count);
  }
  std::pair<int32_t, int32_t> SizeOf(Window window) {
    XSync(display, False);
    XWindowAttributes attributes{};
    XGetWindowAttributes(display, window, &attributes);
    return {attributes.width, attributes.height};
  }
  KBitmap Screenshot(Window window, int32_t width, int32_t height) {
    XImage* image = XGetImage(display, window, 0, 0, static_cast<unsigned>(width), static_cast<unsigned>(height), AllPlanes, ZPixmap);
    KBitmap picture(width, height);
    for (int32_t y = 0; y < height; ++y)
      for (int32_t x = 0; x < width; ++x) picture.Row(y)[x] = 0xFF000000u | static_cast<uint32_t>(XGetPixel(image, x, y));
    XDestroyImage(image);
    return picture;
  }
  // How far `window` is from the plug-in's offline snapshot at `scale` (Differences below).
  int64_t DifferencesFromSnapshot(Window window, KAudioPlugin& plugin, double scale, KRect area = {}) {
    const KBitmap expected = KBitmap::Decode(KPluginEditorSnapshotPNG(plugin, scale, false), "snapshot");
    const auto [width, height] = SizeOf(window);
    return Differences(Screenshot(window, width, height), expected, area);
  }
  // Pixels further apart than the drawers' tolerance in any channel, within `area` (pixels; the
  // whole picture when empty); -1 for pictures of different sizes.
  static int64_t Differences(const KBitmap& a, const KBitmap& b, KRect area = {}) { return KEditorPictureDifferences(a, b, area); }
};

}  // namespace KX11Test
