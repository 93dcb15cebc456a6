// The editor as a VST 2 host shows it, in a real X11 window (the tests run under Xvfb): opened
// through effEditOpen into the host's window, run by effEditIdle alone, painted as the VST 3 view
// and the offline snapshot paint it, keys passed on by the host, resized by the host or, when the
// host refuses, by growing the host's windows; closed and opened again.
#include <unistd.h>

#include <memory>
#include <string>

#include "hosts/vst2/KAudioPluginVSTAdapter.h"
#include "hosts/vst2/KVST2Editor.h"
#include "kernel/KEntryPoints.h"
#include "tests/hosts/VST2Host.h"
// Last: X11's macros would break the headers above.
#include "tests/hosts/X11EditorWindow.h"

using namespace KVST2Test;

namespace {

struct VST2EditorWindow : KX11Test::EditorWindowFixture {
  // The host's idle calls, as a host makes them while the editor is open.
  static void Idle(KInstance& instance, int rounds = 10) {
    for (int i = 0; i < rounds; ++i) {
      usleep(15000);
      instance.Call(effEditIdle);
    }
  }
};

TEST_F(VST2EditorWindow, TheModulesEditorOpensInTheHostsWindowPaintsTheSnapshotAndTakesKeys) {
  KHost host;
  KModuleFile module("Utility");
  KInstance instance(module.Create());
  instance.Start();
  EXPECT_EQ(instance.effect->flags & effFlagsHasEditor, effFlagsHasEditor);
  ERect* rect = nullptr;
  ASSERT_EQ(instance.Call(effEditGetRect, 0, 0, &rect), 1);
  ASSERT_NE(rect, nullptr);
  const int32_t width = rect->right - rect->left, height = rect->bottom - rect->top;
  EXPECT_EQ(instance.Call(effEditOpen, 0, 0, nullptr), 0);  // no window to embed into
  EXPECT_EQ(ChildCount(), 0);
  ASSERT_EQ(instance.Call(effEditOpen, 0, 0, reinterpret_cast<void*>(parent)), 1);
  EXPECT_EQ(instance.Call(effEditOpen, 0, 0, reinterpret_cast<void*>(parent)), 0);  // one window at a time
  Idle(instance);
  const Window child = Child();
  ASSERT_NE(child, 0u);
  EXPECT_EQ(SizeOf(child), std::pair(width, height));

  // The same picture as the snapshot made without a host (and so as the VST 3 view's).
  const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
  EXPECT_EQ(DifferencesFromSnapshot(child, *offline, 1), 0);

  // A drag on the width knob reaches the host as begin, automated values, end.
  const int32_t knobParameter = offline->FindParameter(KString("width"))->Index();
  const float start = instance.effect->getParameter(instance.effect, knobParameter);
  ASSERT_TRUE(KX11Test::DragDown(child, KX11Test::KnobCentre(*offline, "width")));
  Idle(instance);
  EXPECT_NEAR(instance.effect->getParameter(instance.effect, knobParameter), start - KX11Test::kDragTravel, 1e-6);
  std::string kinds;
  for (const auto& [kind, index, value] : host.edits)
    if (index == knobParameter) kinds += kind;
  EXPECT_TRUE(KX11Test::IsOneGesture(kinds, 'b', 'a', 'e')) << kinds;

  // Keys the host passes on: Ctrl+Z takes the drag back and the host hears of it; a key the
  // editor has no use for is left to the host, down and up.
  host.edits.clear();
  EXPECT_EQ(instance.Call(effEditKeyDown, 'z', 0, nullptr, MODIFIER_COMMAND), 1);
  EXPECT_EQ(instance.Call(effEditKeyUp, 'z', 0, nullptr, MODIFIER_COMMAND), 1);
  Idle(instance, 2);
  EXPECT_FLOAT_EQ(instance.effect->getParameter(instance.effect, knobParameter), start);
  ASSERT_FALSE(host.edits.empty());
  EXPECT_EQ(std::get<0>(host.edits.front()), 'b');
  EXPECT_EQ(instance.Call(effEditKeyDown, 0, 17 /* VKEY_SELECT */), 0);
  EXPECT_EQ(instance.Call(effEditKeyUp, 0, 17), 0);

  // Closed, the window goes; opened again as often as the host likes.
  instance.Call(effEditClose);
  EXPECT_EQ(ChildCount(), 0);
  EXPECT_EQ(instance.Call(effEditKeyDown, 'z', 0, nullptr, MODIFIER_COMMAND), 0);  // no window, no keys
  for (int round = 0; round < 3; ++round) {
    ASSERT_EQ(instance.Call(effEditOpen, 0, 0, reinterpret_cast<void*>(parent)), 1);
    Idle(instance, 2);
    EXPECT_EQ(ChildCount(), 1);
    instance.Call(effEditClose);
  }
  EXPECT_EQ(ChildCount(), 0);
}

// The editor's own size change (its size menu) through the adapter's resize slot.
TEST_F(VST2EditorWindow, AResizeAsksTheHostFirstGrowsTheHostsWindowsWhenRefusedAndNeverNests) {
  KHost host;
  auto* adapter = new KAudioPluginVSTAdapter(&KHost::Callback, std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString("KUtilityPlugin"))),
                                             FourCharacters("TsEd"));
  KInstance instance(adapter->Effect());
  instance.Start();
  KEditor& editor = adapter->Editor().View().Editor();
  const int32_t width = editor.PixelWidth(), height = editor.PixelHeight();
  EXPECT_FALSE(adapter->ResizeEditor(width * 2, height * 2));  // no window open
  EXPECT_TRUE(host.windowSizes.empty());

  // The host's window inside a frame of 16 × 40 pixels, inside a desktop far larger.
  const Window frame = XCreateSimpleWindow(display, parent, 10, 10, static_cast<unsigned>(width + 16), static_cast<unsigned>(height + 40), 0, 0, 0);
  const Window inner = XCreateSimpleWindow(display, frame, 8, 32, static_cast<unsigned>(width), static_cast<unsigned>(height), 0, 0, 0);
  XMapWindow(display, frame);
  XMapWindow(display, inner);
  XSync(display, False);
  ASSERT_EQ(instance.Call(effEditOpen, 0, 0, reinterpret_cast<void*>(inner)), 1);
  Idle(instance, 2);

  // A host that takes the size: asked once, its windows left to it, nested requests refused.
  host.acceptWindowSize = true;
  bool nested = true;
  host.whileSizing = [&] { nested = adapter->ResizeEditor(1, 1); };
  ASSERT_TRUE(editor.SetScale(1.5));
  EXPECT_FALSE(nested);
  ASSERT_EQ(host.windowSizes.size(), 1u);
  EXPECT_EQ(host.windowSizes[0], std::pair(editor.PixelWidth(), editor.PixelHeight()));
  EXPECT_EQ(SizeOf(inner), std::pair(width, height));
  Idle(instance, 2);
  Window editorWindow = 0;
  {
    Window root = 0, up = 0, *children = nullptr;
    unsigned int count = 0;
    XQueryTree(display, inner, &root, &up, &children, &count);
    ASSERT_EQ(count, 1u);
    editorWindow = children[0];
    XFree(children);
  }
  EXPECT_EQ(SizeOf(editorWindow), std::pair(editor.PixelWidth(), editor.PixelHeight()));

  // A host that refuses: the editor grows the host's window and its frame, not the desktop.
  host.acceptWindowSize = false;
  host.whileSizing = nullptr;
  ASSERT_TRUE(editor.SetScale(2.0));
  EXPECT_EQ(host.windowSizes.size(), 2u);
  EXPECT_EQ(SizeOf(inner), std::pair(2 * width, 2 * height));
  EXPECT_EQ(SizeOf(frame), std::pair(2 * width + 16, 2 * height + 40));
  EXPECT_EQ(SizeOf(parent), std::pair(1800, 1200));
  Idle(instance);
  EXPECT_EQ(SizeOf(editorWindow), std::pair(2 * width, 2 * height));
  const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
  EXPECT_EQ(DifferencesFromSnapshot(editorWindow, *offline, 2), 0);

  instance.Call(effEditClose);
  EXPECT_FALSE(adapter->ResizeEditor(width, height));
  EXPECT_EQ(host.windowSizes.size(), 2u);
}

}  // namespace
