// The editor's X11 window under Xvfb, as every host format shows it: painted by the OpenGL
// drawer where EGL works and by the software drawer where it does not (a second run hides EGL's
// drivers), the offline snapshot's picture either way; while the meters move only they are
// repainted. Prints the idle cost and the full-repaint times of the drawer in use.
#include <gtest/gtest.h>
#include <time.h>
#include <unistd.h>

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "plugins/KPluginEditors.h"
#include "tests/ui/DrawerTestSupport.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/controls/KLevelMeterControl.h"
#include "ui/platform/KEditorWindowX11.h"
// Last: X11's macros (None, Bool, Status) would break the headers above.
#include <X11/Xlib.h>
#include <X11/Xutil.h>

namespace {
constexpr uint32_t kDrawerTolerance = 2;  // as between the drawers themselves
constexpr double kRate = 48000;

// The drawer this run must get: "software" when the run hides OpenGL, else "opengl".
bool ExpectOpenGL() {
  const char* expected = std::getenv("TORVANE_EXPECT_DRAWER");
  return !expected || std::string(expected) != "software";
}

double ThreadCpuMs() {
  timespec t{};
  clock_gettime(CLOCK_THREAD_CPUTIME_ID, &t);
  return t.tv_sec * 1e3 + t.tv_nsec / 1e6;
}

// One connection for the whole run: the server resets when its last client leaves.
Display* SharedDisplay() {
  static Display* display = XOpenDisplay(nullptr);
  return display;
}

struct EditorWindow : ::testing::Test {
  Display* display = SharedDisplay();
  Window parent = 0;
  std::unique_ptr<KAudioPlugin> plugin = KMakeCataloguePlugin("KUtilityPlugin");
  KRecordingEditorHost host;
  std::unique_ptr<KEditor> editor;
  std::unique_ptr<KEditorWindowX11> window;

  void SetUp() override {
    if (!display) GTEST_SKIP() << "no X display (the test runs under xvfb-run)";
    parent = XCreateSimpleWindow(display, DefaultRootWindow(display), 0, 0, 1800, 1200, 0, 0, 0x202020);
    XMapWindow(display, parent);
    XSync(display, False);
    editor = KMakePluginEditor(*plugin, &host);
    editor->Tree().Tick();  // as a host first shows it, and as the snapshot paints it
    window = std::make_unique<KEditorWindowX11>(parent, *editor);
  }
  void TearDown() override {
    window.reset();
    editor.reset();
    if (!display) return;
    if (parent) XDestroyWindow(display, parent);
    XSync(display, False);
  }
  KBitmap Screenshot() {
    window->ProcessEvents();
    usleep(20000);
    XSync(display, False);
    const int32_t width = editor->PixelWidth(), height = editor->PixelHeight();
    XImage* image = XGetImage(display, window->Window(), 0, 0, unsigned(width), unsigned(height), AllPlanes, ZPixmap);
    KBitmap picture(width, height);
    for (int32_t y = 0; y < height; ++y)
      for (int32_t x = 0; x < width; ++x) picture.Row(y)[x] = 0xFF000000u | uint32_t(XGetPixel(image, x, y));
    XDestroyImage(image);
    return picture;
  }
  void ExpectSnapshot(double scale, const std::string& name) {
    const std::unique_ptr<KAudioPlugin> offline = KMakeCataloguePlugin("KUtilityPlugin");
    const KBitmap expected = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, scale, false), "snapshot");
    const KBitmap shown = Screenshot();
    ASSERT_EQ(shown.Width(), expected.Width());
    ASSERT_EQ(shown.Height(), expected.Height());
    const KPictureDifference d = KCompare(expected, shown, kDrawerTolerance);
    shown.Store(KPicturePath(name + ".png"));
    d.picture.Store(KPicturePath(name + "_difference.png"));
    EXPECT_EQ(d.beyond, 0) << name << ": largest channel difference " << d.largest;
  }
  // The pixels of all meters together, widened as the window widens a repaint.
  int64_t MeterPixels() {
    KRect all{0, 0, -1, -1};
    int32_t meters = 0;
    KFindControl<KLevelMeterControl>(editor->Tree().Root(), [&](KLevelMeterControl& m) {
      const KRect& b = m.Bounds();
      all = meters++ ? KRect{std::min(all.left, b.left), std::min(all.top, b.top), std::max(all.right, b.right),
                             std::max(all.bottom, b.bottom)}
                     : b;
      return false;
    });
    EXPECT_GE(meters, 2);
    const double s = editor->Scale();
    return int64_t(std::ceil((all.right - all.left + 1) * s) + 3) * int64_t(std::ceil((all.bottom - all.top + 1) * s) + 3);
  }
  // One host block of a tone at `amplitude` through the plug-in, as its audio thread runs it.
  void Play(float amplitude, std::vector<float>& in, std::vector<float>& out) {
    for (size_t i = 0; i < in.size(); ++i) in[i] = amplitude * float(std::sin(0.06 * double(i)));
    const float* inputs[] = {in.data(), in.data()};
    float* outputs[] = {out.data(), out.data() + in.size()};
    plugin->ProcessHostBlock(inputs, outputs, int32_t(in.size()));
  }
};

TEST_F(EditorWindow, PaintsTheOfflineSnapshotWithTheDrawerTheSystemAllows) {
  EXPECT_EQ(window->PaintsWithOpenGL(), ExpectOpenGL());
  const std::string drawer = window->PaintsWithOpenGL() ? "opengl" : "software";
  EXPECT_GT(window->PaintDirty(), 0);
  EXPECT_EQ(window->PaintDirty(), 0) << "nothing changed, nothing to paint";
  ExpectSnapshot(1, "window_" + drawer + "_scale1");
  // A new size makes a new surface of the same kind, sharp at twice the pixels.
  ASSERT_TRUE(editor->SetScale(2));
  window->Resize();
  editor->Tree().Tick();  // the host's timer: the scale button shows the new scale
  EXPECT_EQ(window->PaintsWithOpenGL(), ExpectOpenGL());
  ExpectSnapshot(2, "window_" + drawer + "_scale2");
  // Uncovered again after something hid it: the window paints itself whole.
  XUnmapWindow(display, window->Window());
  XMapWindow(display, window->Window());
  XSync(display, False);
  usleep(20000);
  window->ProcessEvents();
  ExpectSnapshot(2, "window_" + drawer + "_exposed");
}

TEST_F(EditorWindow, MovingMetersRepaintOnlyThemselvesAndASteadyPictureNothing) {
  ASSERT_TRUE(plugin->SetSampleRate(kRate));
  window->PaintDirty();
  const int64_t meterPixels = MeterPixels();
  const int64_t windowPixels = int64_t(editor->PixelWidth()) * editor->PixelHeight();
  ASSERT_LT(meterPixels, windowPixels / 4);

  // The audio thread plays a tone whose level moves; the editor thread ticks as a host's timer
  // would and paints what changed. Neither waits on the other.
  std::atomic<bool> playing{true};
  std::thread audio([&] {
    std::vector<float> in(480), out(960);
    for (int32_t block = 0; playing; ++block) {
      Play(0.05f + 0.9f * float(std::abs(std::sin(block * 0.07))), in, out);
      usleep(10000);
    }
  });
  constexpr int32_t kTicks = 30;  // one second of a 33 ms timer
  int64_t painted = 0, largest = 0;
  const double cpuStart = ThreadCpuMs();
  const auto wallStart = std::chrono::steady_clock::now();
  for (int32_t tick = 0; tick < kTicks; ++tick) {
    usleep(33000);
    editor->Tree().Tick();
    const int64_t pixels = window->PaintDirty();
    painted += pixels;
    largest = std::max(largest, pixels);
  }
  const double cpuMs = ThreadCpuMs() - cpuStart;
  const double wallS = std::chrono::duration<double>(std::chrono::steady_clock::now() - wallStart).count();
  playing = false;
  audio.join();
  EXPECT_GT(painted, 0) << "the meters moved";
  EXPECT_LE(largest, meterPixels) << "a tick repainted more than the meters";

  // A steady tone: once the meters have caught it and their peak marks have fallen, a tick
  // paints nothing.
  std::vector<float> in(480), out(960);
  int64_t lastPainted = -1;
  for (int32_t tick = 0; tick < 3 * KLevelMeterControl::kHoldTicks && lastPainted != 0; ++tick) {
    for (int block = 0; block < 3; ++block) Play(0.5f, in, out);
    editor->Tree().Tick();
    lastPainted = window->PaintDirty();
  }
  EXPECT_EQ(lastPainted, 0);

  // Full repaints at 100 % and 200 %, the median of a few.
  double fullMs[2] = {};
  for (int32_t i = 0; i < 2; ++i) {
    ASSERT_TRUE(editor->SetScale(i == 0 ? 1.0 : 2.0));
    window->Resize();
    std::vector<double> times;
    for (int32_t round = 0; round < 5; ++round) {
      editor->Tree().InvalidateAll();
      EXPECT_EQ(window->PaintDirty(), int64_t(editor->PixelWidth()) * editor->PixelHeight());
      times.push_back(window->LastFullPaintMs());
    }
    std::sort(times.begin(), times.end());
    fullMs[i] = times[times.size() / 2];
  }
  std::printf("[%s drawer] editor thread with the meters moving: %.1f ms CPU per second, %.0f pixels repainted per tick "
              "(of %lld); full repaint %.2f ms at 100 %%, %.2f ms at 200 %%\n",
              window->PaintsWithOpenGL() ? "OpenGL" : "software", cpuMs / wallS, double(painted) / kTicks,
              static_cast<long long>(windowPixels), fullMs[0], fullMs[1]);
}

}  // namespace
