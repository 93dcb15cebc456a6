// The editor as a VST 3 host shows it, in a real X11 window (the tests run under Xvfb): attached
// to the host's window, served only by the host's run loop, painted as the offline snapshot
// paints it, driven by the mouse and keys through xdotool, resized to 200 %, closed and opened
// again.
#include <unistd.h>

#include <cstdlib>
#include <string>

#include "hosts/vst3/KVST3View.h"
#include "kernel/KEntryPoints.h"
#include "plugins/KPluginEditors.h"
#include "tests/hosts/VST3Host.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/controls/KLevelMeterControl.h"
#include "ui/controls/KValueControl.h"
// Last: X11's macros (None, Bool, Status) would break the headers above.
#include "tests/hosts/X11EditorWindow.h"

using namespace KVST3Test;

namespace {

// The host's frame and run loop in one: it keeps the handlers the view registers and runs them
// when the test pumps, as a host's loop would.
struct KFrame final : KHostObject<IPlugFrame, IRunLoop> {
  IEventHandler* handler = nullptr;
  ITimerHandler* timer = nullptr;
  int descriptor = -1;
  std::vector<ViewRect> resizes;
  TResult ResizeView(IPlugView* view, ViewRect* size) override {
    resizes.push_back(*size);
    return view->OnSize(size);  // a host that agrees sets the new size at once
  }
  TResult RegisterEventHandler(IEventHandler* h, int fd) override { return handler = h, descriptor = fd, kResultOk; }
  TResult UnregisterEventHandler(IEventHandler* h) override { return handler = handler == h ? nullptr : handler, kResultOk; }
  TResult RegisterTimer(ITimerHandler* h, uint64_t) override { return timer = h, kResultOk; }
  TResult UnregisterTimer(ITimerHandler* h) override { return timer = timer == h ? nullptr : timer, kResultOk; }
  void Pump(int rounds = 10) {
    for (int i = 0; i < rounds; ++i) {
      usleep(15000);
      if (handler) handler->OnFDIsSet(descriptor);
      if (timer) timer->OnTimer();
    }
  }
};

struct VST3EditorWindow : KX11Test::EditorWindowFixture {
  KHost host;
  KFrame frame;
};
using KX11Test::Shell;

TEST_F(VST3EditorWindow, TheViewLivesInTheHostsWindowAndAnswersMouseKeysAndScale) {
  KBundle bundle("Utility");
  KInstance instance(bundle.Create());
  instance.Start(host);
  IPlugView* view = instance.controller->CreateView("editor");
  ASSERT_NE(view, nullptr);
  EXPECT_EQ(view->IsPlatformTypeSupported(kPlatformTypeX11EmbedWindowID), kResultTrue);
  EXPECT_EQ(view->IsPlatformTypeSupported(kPlatformTypeHWND), kResultFalse);
  EXPECT_EQ(view->Attached(reinterpret_cast<void*>(parent), kPlatformTypeHWND), kResultFalse);
  ViewRect size{};
  ASSERT_EQ(view->GetSize(&size), kResultOk);
  ASSERT_EQ(view->SetFrame(&frame) | view->Attached(reinterpret_cast<void*>(parent), kPlatformTypeX11EmbedWindowID), kResultOk);
  ASSERT_NE(frame.handler, nullptr);
  ASSERT_NE(frame.timer, nullptr);
  frame.Pump();
  const Window child = Child();
  ASSERT_NE(child, 0u);

  // The same picture as the snapshot made without a host.
  const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
  const KBitmap expected = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, 1, false), "snapshot");
  ASSERT_EQ(expected.Width(), size.right - size.left);
  EXPECT_EQ(Differences(Screenshot(child, size.right, size.bottom), expected), 0);

  // Where the width knob lies, from the same generated layout.
  const std::unique_ptr<KEditor> layout = KMakePluginEditor(*offline, nullptr);
  const int32_t width = offline->FindParameter(KString("width"))->Index();
  KKnob* knob = KFindControl<KKnob>(layout->Tree().Root(), [&](KKnob& k) { return k.Link().Index() == width; });
  ASSERT_NE(knob, nullptr);
  const KPoint at = KCentreOf(*knob);
  const double start = instance.controller->GetParamNormalized(static_cast<ParamID>(width));
  ASSERT_TRUE(KX11Test::DragDown(child, at));
  frame.Pump();
  const double dragged = instance.controller->GetParamNormalized(static_cast<ParamID>(width));
  EXPECT_NEAR(dragged, start - KX11Test::kDragTravel, 1e-9);
  std::string kinds;
  for (const auto& [kind, id, value] : host.edits)
    if (id == static_cast<ParamID>(width)) kinds += kind;
  EXPECT_TRUE(KX11Test::IsOneGesture(kinds, 'b', 'p', 'e')) << kinds;

  // F1 over the knob: the help card in the middle of the window (white paper).
  ASSERT_TRUE(Shell("xdotool key F1"));
  frame.Pump();
  const KBitmap help = Screenshot(child, size.right, size.bottom);
  EXPECT_EQ(help.Pixel(size.right / 2, size.bottom / 2 + 30) & 0xFFFFFF, 0xFFFFFFu);
  ASSERT_TRUE(Shell("xdotool key Escape"));
  frame.Pump();

  // Ctrl+Z takes the drag back, and the host hears of it.
  host.edits.clear();
  ASSERT_TRUE(Shell("xdotool key ctrl+z"));
  frame.Pump();
  EXPECT_DOUBLE_EQ(instance.controller->GetParamNormalized(static_cast<ParamID>(width)), start);
  ASSERT_FALSE(host.edits.empty());
  EXPECT_EQ(std::get<0>(host.edits.front()), 'b');

  // Host automation while the editor is open: the knob follows the processed value and looks
  // as the offline editor draws that value (the meters, lit by the audio, are left out).
  KBlock block(1, 1);
  block.Change(static_cast<ParamID>(width), {{0, 0.25}});
  ASSERT_EQ(instance.processor->Process(block.data), kResultOk);
  frame.Pump();
  EXPECT_DOUBLE_EQ(instance.controller->GetParamNormalized(static_cast<ParamID>(width)), 0.25);
  offline->GetParameter(width).SetNormalized(0.25);
  const KBitmap automated = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, 1, false), "snapshot");
  EXPECT_EQ(Differences(Screenshot(child, size.right, size.bottom), automated, knob->Bounds()), 0);

  // 200 %: the host is asked for twice the size and the window shows the sharp picture.
  auto* scaling = Query<IPlugViewContentScaleSupport>(view);
  ASSERT_NE(scaling, nullptr);
  EXPECT_EQ(scaling->SetContentScaleFactor(2.0f), kResultOk);
  scaling->Release();
  ASSERT_EQ(frame.resizes.size(), 1u);
  EXPECT_EQ(frame.resizes[0].right, 2 * size.right);
  EXPECT_EQ(frame.resizes[0].bottom, 2 * size.bottom);
  frame.Pump();
  ViewRect large{};
  view->GetSize(&large);
  EXPECT_EQ(large.right, 2 * size.right);
  const KBitmap expectedLarge = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, 2, false), "snapshot");
  // Below the title bar (its redo button is lit by this session's history) and left of the meters
  // (lit by the audio).
  const KLevelMeterControl* meter = KFindControl<KLevelMeterControl>(layout->Tree().Root(), [](auto&) { return true; });
  ASSERT_NE(meter, nullptr);
  EXPECT_EQ(Differences(Screenshot(child, large.right, large.bottom), expectedLarge,
                        KRect{0, 2 * KEditor::kHeaderHeight, 2 * meter->Bounds().left - 1, large.bottom - 1}),
            0);

  // Closed and opened again: the window goes with the view, the handlers are given back.
  EXPECT_EQ(view->Removed(), kResultOk);
  EXPECT_EQ(frame.handler, nullptr);
  EXPECT_EQ(frame.timer, nullptr);
  view->Release();
  XSync(display, False);
  EXPECT_EQ(ChildCount(), 0);
  for (int round = 0; round < 3; ++round) {
    IPlugView* again = instance.controller->CreateView("editor");
    ASSERT_NE(again, nullptr);
    ASSERT_EQ(again->SetFrame(&frame) | again->Attached(reinterpret_cast<void*>(parent), kPlatformTypeX11EmbedWindowID), kResultOk);
    frame.Pump(2);
    EXPECT_EQ(ChildCount(), 1);
    EXPECT_EQ(again->Removed(), kResultOk);
    again->Release();
  }
  instance.Stop();
}

}  // namespace
