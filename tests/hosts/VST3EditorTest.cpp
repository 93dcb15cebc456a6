// The editor as a VST 3 host shows it, in a real X11 window (the tests run under Xvfb): attached
// to the host's window, served only by the host's run loop, painted as the offline snapshot
// paints it, driven by the mouse and keys through xdotool, resized to 200 %, closed and opened
// again.
#include <unistd.h>

#include <atomic>
#include <chrono>
#include <cstdlib>
#include <string>
#include <thread>

#include "hosts/vst3/KVST3Editor.h"
#include "hosts/vst3/KVST3View.h"
#include "kernel/KEntryPoints.h"
#include "plugins/KPluginEditors.h"
#include "tests/core/AllocationCounter.h"
#include "tests/hosts/VST3Host.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/controls/KLevelMeterControl.h"
#include "ui/controls/KValueControl.h"
#include "ui/platform/KEditorWindowX11.h"
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

// A host whose component handler keeps the editor's thread waiting in an edit until told to
// let go (as a slow host's user-interface thread would), at most 10 s.
struct KStallingHost final : KHostObject<IHostApplication, IComponentHandler> {
  std::atomic<bool> stall{false}, released{false}, stalled{false};
  TResult GetName(String128 name) override { return std::copy_n(u"Test host", 10, name), kResultOk; }
  TResult CreateInstance(char*, char*, void**) override { return kNotImplemented; }
  TResult BeginEdit(ParamID) override { return kResultOk; }
  TResult PerformEdit(ParamID, double) override {
    stalled = stall.load();
    for (const auto until = std::chrono::steady_clock::now() + std::chrono::seconds(10);
         stall && !released && std::chrono::steady_clock::now() < until;)
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    return kResultOk;
  }
  TResult EndEdit(ParamID) override { return kResultOk; }
  TResult RestartComponent(int32_t) override { return kResultOk; }
};

TEST_F(VST3EditorWindow, AutomationPlaysIntoTheOpenEditorWhileTheAudioAllocatesNothingAndWaitsOnNoEditor) {
  KStallingHost stalling;
  // In this process, so that every allocation of the audio path is counted.
  KInstance instance(static_cast<IComponent*>(
      new KAudioPluginVST3Adapter(std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString("KUtilityPlugin"))))));
  ASSERT_EQ(instance.component->Initialize(static_cast<IHostApplication*>(&stalling)) |
                instance.controller->SetComponentHandler(&stalling),
            kResultOk);
  std::vector<SpeakerArrangement> stereo(2, 3);
  ProcessSetup setup{kRealtime, kSample32, kBlock, 48000.0};
  ASSERT_EQ(instance.processor->SetBusArrangements(stereo.data(), 1, stereo.data() + 1, 1), kResultTrue);
  ASSERT_EQ(instance.processor->SetupProcessing(setup) | instance.component->SetActive(1) | instance.processor->SetProcessing(1),
            kResultOk);
  IPlugView* view = instance.controller->CreateView("editor");
  ASSERT_NE(view, nullptr);
  ASSERT_EQ(view->SetFrame(&frame) | view->Attached(reinterpret_cast<void*>(parent), kPlatformTypeX11EmbedWindowID), kResultOk);
  frame.Pump(2);
  auto* adapterView = static_cast<KAudioPluginVST3Adapter::KEditor*>(view);
  auto& editor = adapterView->Editor();
  // Mesa paints under Xvfb, so the window is the OpenGL drawer's unless the run hides OpenGL.
  ASSERT_NE(adapterView->Window(), nullptr);
  const char* drawer = std::getenv("TORVANE_EXPECT_DRAWER");
  EXPECT_EQ(adapterView->Window()->PaintsWithOpenGL(), !drawer || std::string(drawer) != "software");
  const Window child = Child();
  ASSERT_NE(child, 0u);

  const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
  const auto index = [&](const char* key) { return offline->FindParameter(KString::FromUtf8(key))->Index(); };
  const int32_t width = index("width"), gain = index("gain");
  const auto knobOf = [&](int32_t parameter) {
    return KFindControl<KKnob>(editor.Tree().Root(), [&](KKnob& k) { return k.Link().Index() == parameter; });
  };
  ASSERT_TRUE(knobOf(width) && knobOf(gain));
  const KRect widthKnob = knobOf(width)->Bounds();

  // The audio thread automates the width from `from` to `to` over 20 blocks, each processing
  // call counted for allocations.
  std::atomic<int64_t> allocations{0};
  std::atomic<bool> rendered{false};
  const auto render = [&](double from, double to) {
    return std::thread([&, from, to] {
      KBlock block(1, 1);
      for (int32_t b = 0; b < 20; ++b) {
        block.changes.queues.clear();
        block.Change(static_cast<ParamID>(width), {{0, from + (to - from) * b / 20}, {kBlock - 1, from + (to - from) * (b + 1) / 20}});
        KAllocationCounter counter;
        EXPECT_EQ(instance.processor->Process(block.data), kResultOk);
        allocations += counter.Count();
        std::this_thread::sleep_for(std::chrono::milliseconds(3));
      }
      rendered = true;
    });
  };
  const auto expectKnobShows = [&](double value) {
    EXPECT_DOUBLE_EQ(instance.controller->GetParamNormalized(static_cast<ParamID>(width)), value);
    offline->GetParameter(width).SetNormalized(value);
    const KBitmap expected = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, 1, false), "snapshot");
    EXPECT_EQ(Differences(Screenshot(child, expected.Width(), expected.Height()), expected, widthKnob), 0) << value;
  };

  // The editor's thread serves its run loop while the audio plays.
  std::thread audio = render(0, 0.5);
  while (!rendered) frame.Pump(1);
  audio.join();
  frame.Pump(3);
  expectKnobShows(0.5);

  // The editor's thread held inside the host by an edit of the gain knob: the audio still plays
  // every block, and the host lets go only then.
  rendered = false;
  stalling.stall = true;
  audio = render(0.5, 1.0);
  std::thread release([&] {
    while (!rendered) std::this_thread::sleep_for(std::chrono::milliseconds(1));
    stalling.released = true;
  });
  const auto stallStart = std::chrono::steady_clock::now();
  editor.Tree().Wheel({KCentreOf(*knobOf(gain)), 0, 1.0});
  const double stalledSeconds = std::chrono::duration<double>(std::chrono::steady_clock::now() - stallStart).count();
  audio.join();
  release.join();
  EXPECT_TRUE(stalling.stalled);
  EXPECT_LT(stalledSeconds, 9.0) << "the audio waited on the stalled editor";
  frame.Pump(3);
  expectKnobShows(1.0);
  EXPECT_EQ(allocations, 0);

  EXPECT_EQ(view->Removed(), kResultOk);
  view->Release();
  EXPECT_EQ(instance.processor->SetProcessing(0) | instance.component->SetActive(0) | instance.component->Terminate(), kResultOk);
}

}  // namespace
