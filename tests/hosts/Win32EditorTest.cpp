// The editors on Windows, in real Win32 windows (under Wine on a virtual X server): the VST 3
// view of a built bundle attached to the host's HWND, painted as the Linux build's offline
// snapshot paints it, by OpenGL through WGL or by the software drawer through GDI, and driven by
// the mouse; the VST 2 editor opened into an HWND and growing the host's windows when the host
// refuses a new size; the AAX GUI in a container holding an HWND.
#include <windows.h>

#include <cstdlib>
#include <memory>
#include <string>

#include "hosts/vst2/KAudioPluginVSTAdapter.h"
#include "hosts/vst2/KVST2Editor.h"
#include "hosts/vst3/KVST3Editor.h"
#include "hosts/vst3/KVST3View.h"
#include "kernel/KEntryPoints.h"
#include "plugins/KPluginEditors.h"
#include "tests/hosts/AAXHost.h"
#include "tests/hosts/VST2Host.h"
#include "tests/hosts/VST3Host.h"
#include "tests/hosts/Win32EditorWindow.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/controls/KValueControl.h"
#include "ui/editor/KEditor.h"
#include "ui/platform/KEditorWindow.h"

using namespace KWin32Test;

namespace {

// Which drawer the run expects the windows to paint with ("software" when OpenGL is hidden).
bool ExpectOpenGL() {
  const char* drawer = std::getenv("TORVANE_EXPECT_DRAWER");
  return !drawer || std::string(drawer) != "software";
}

// How far the editor's window is from `expected`: the picture its drawer painted, read back (the
// OpenGL drawer's from its off-screen framebuffer through WGL); with the software drawer also what
// the screen shows of the window. Under Wine on a virtual X server, what OpenGL presents into a
// child window reads back black through GDI and from the window's front buffer alike, so for
// OpenGL the painted picture is all that can be compared there.
int64_t DifferencesShown(KEditorWindow& window, const KBitmap& expected, const std::string& name, KRect area = {}) {
  int64_t differences = KWin32Test::DifferencesShown(window.Picture(), expected, name.c_str(), area);
  if (!window.PaintsWithOpenGL())
    differences += KWin32Test::DifferencesShown(Screenshot(window.Window(), expected.Width(), expected.Height()), expected,
                                                (name + "-screen").c_str(), area);
  return differences;
}

// A host frame that takes every size the view asks for at once, as most hosts do.
struct KFrame final : KVST3Test::KHostObject<KVST3::IPlugFrame> {
  std::vector<KVST3::ViewRect> resizes;
  KVST3::TResult ResizeView(KVST3::IPlugView* view, KVST3::ViewRect* size) override {
    resizes.push_back(*size);
    return view->OnSize(size);
  }
};

// A drag of 40 pixels down from `at` on `window`, as the mouse's messages bring it.
void DragDown(HWND window, KPoint at) {
  ::SendMessageW(window, WM_LBUTTONDOWN, MK_LBUTTON, MAKELPARAM(at.x, at.y));
  for (int dy = 10; dy <= 40; dy += 10) ::SendMessageW(window, WM_MOUSEMOVE, MK_LBUTTON, MAKELPARAM(at.x, at.y + dy));
  ::SendMessageW(window, WM_LBUTTONUP, 0, MAKELPARAM(at.x, at.y + 40));
}

using Win32EditorWindow = EditorWindowFixture;

TEST_F(Win32EditorWindow, TheBundlesViewLivesInTheHostsHWNDPaintsTheLinuxSnapshotAndTakesTheMouse) {
  using namespace KVST3Test;
  KHost host;
  KFrame frame;
  KBundle bundle("Utility");
  KInstance instance(bundle.Create());
  instance.Start(host);
  IPlugView* view = instance.controller->CreateView("editor");
  ASSERT_NE(view, nullptr);
  EXPECT_EQ(view->IsPlatformTypeSupported(kPlatformTypeHWND), kResultTrue);
  EXPECT_EQ(view->IsPlatformTypeSupported(kPlatformTypeX11EmbedWindowID), kResultFalse);
  EXPECT_EQ(view->Attached(parent, kPlatformTypeX11EmbedWindowID), kResultFalse);
  EXPECT_EQ(view->Attached(nullptr, kPlatformTypeHWND), kResultFalse);
  EXPECT_EQ(ChildCount(parent), 0);
  ViewRect size{};
  ASSERT_EQ(view->GetSize(&size), kResultOk);
  ASSERT_EQ(view->SetFrame(&frame) | view->Attached(parent, kPlatformTypeHWND), kResultOk);
  EXPECT_EQ(view->Attached(parent, kPlatformTypeHWND), kResultFalse);  // one window at a time
  Pump();
  HWND child = OnlyChild(parent);
  ASSERT_NE(child, nullptr);
  EXPECT_EQ(SizeOf(child), std::pair(size.right, size.bottom));

  // The picture the Linux build draws without a host, on whichever drawer this system has.
  const KBitmap expected = LinuxSnapshot("KUtilityPlugin");
  ASSERT_EQ(expected.Width(), size.right);
  // The view's window, as the adapter made it in the bundle's kernel.
  KEditorWindow& window = *static_cast<KAudioPluginVST3Adapter::KEditor*>(view)->Window();
  ASSERT_EQ(window.Window(), child);
  EXPECT_EQ(window.PaintsWithOpenGL(), ExpectOpenGL());
  EXPECT_EQ(DifferencesShown(window, expected, "vst3-view"), 0);

  // A drag on the width knob: one gesture at the host, the value down by the drag's travel.
  const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
  const int32_t width = offline->FindParameter(KString("width"))->Index();
  const std::unique_ptr<KEditor> layout = KMakePluginEditor(*offline, nullptr);
  KKnob* knob = KFindControl<KKnob>(layout->Tree().Root(), [&](KKnob& k) { return k.Link().Index() == width; });
  ASSERT_NE(knob, nullptr);
  const double start = instance.controller->GetParamNormalized(static_cast<ParamID>(width));
  DragDown(child, KCentreOf(*knob));
  Pump(3);
  EXPECT_NEAR(instance.controller->GetParamNormalized(static_cast<ParamID>(width)), start - 40 / KValueControl::kDragTravel, 1e-9);
  std::string kinds;
  for (const auto& [kind, id, value] : host.edits)
    if (id == static_cast<ParamID>(width)) kinds += kind;
  ASSERT_GE(kinds.size(), 3u);
  EXPECT_EQ(kinds.front(), 'b');
  EXPECT_EQ(kinds.back(), 'e');
  EXPECT_EQ(kinds.find_first_not_of('p', 1), kinds.size() - 1) << kinds;
  // The knob as the offline editor draws the dragged value.
  offline->GetParameter(width).SetNormalized(instance.controller->GetParamNormalized(static_cast<ParamID>(width)));
  const KBitmap dragged = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, 1, false), "snapshot");
  EXPECT_EQ(DifferencesShown(window, dragged, "vst3-view-dragged", knob->Bounds()), 0);

  // 200 %: the host is asked for twice the size and the window follows.
  auto* scaling = Query<IPlugViewContentScaleSupport>(view);
  ASSERT_NE(scaling, nullptr);
  EXPECT_EQ(scaling->SetContentScaleFactor(2.0f), kResultOk);
  scaling->Release();
  ASSERT_EQ(frame.resizes.size(), 1u);
  EXPECT_EQ(frame.resizes[0].right, 2 * size.right);
  Pump(3);
  EXPECT_EQ(SizeOf(child), std::pair(2 * size.right, 2 * size.bottom));

  // Removed, the window goes; attached again as often as the host likes.
  EXPECT_EQ(view->Removed(), kResultOk);
  view->Release();
  EXPECT_EQ(ChildCount(parent), 0);
  for (int round = 0; round < 3; ++round) {
    IPlugView* again = instance.controller->CreateView("editor");
    ASSERT_NE(again, nullptr);
    ASSERT_EQ(again->Attached(parent, kPlatformTypeHWND), kResultOk);
    Pump(2);
    EXPECT_EQ(ChildCount(parent), 1);
    EXPECT_EQ(again->Removed(), kResultOk);
    again->Release();
  }
  EXPECT_EQ(ChildCount(parent), 0);
  instance.Stop();
}

// The VST 2 editor in this process, so that its window and drawer can be looked at.
struct VST2Editor {
  KVST2Test::KHost host;
  KAudioPluginVSTAdapter* adapter = new KAudioPluginVSTAdapter(
      &KVST2Test::KHost::Callback, std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString("KUtilityPlugin"))), KVST2::FourCharacters("TsEd"));
  KVST2Test::KInstance instance{adapter->Effect()};
  KEditor& editor = adapter->Editor().View().Editor();
  const int32_t width = editor.PixelWidth(), height = editor.PixelHeight();
  VST2Editor() { instance.Start(); }
  HWND Window() { return adapter->Editor().View().Window()->Window(); }
};

TEST_F(Win32EditorWindow, TheVST2EditorOpensIntoAnHWNDOnTheExpectedDrawerAndPaintsTheLinuxSnapshot) {
  VST2Editor vst2;
  EXPECT_EQ(vst2.instance.Call(KVST2::effEditOpen, 0, 0, nullptr), 0);
  ASSERT_EQ(vst2.instance.Call(KVST2::effEditOpen, 0, 0, parent), 1);
  EXPECT_EQ(vst2.instance.Call(KVST2::effEditOpen, 0, 0, parent), 0);
  EXPECT_EQ(OnlyChild(parent), vst2.Window());
  EXPECT_EQ(vst2.adapter->Editor().View().Window()->PaintsWithOpenGL(), ExpectOpenGL());
  for (int i = 0; i < 5; ++i) {
    Pump(1);
    vst2.instance.Call(KVST2::effEditIdle);
  }
  KEditorWindow& window = *vst2.adapter->Editor().View().Window();
  EXPECT_EQ(DifferencesShown(window, LinuxSnapshot("KUtilityPlugin"), "vst2-editor"), 0);
  // A window the system covered and gave back is painted whole again.
  ::InvalidateRect(vst2.Window(), nullptr, TRUE);
  ::UpdateWindow(vst2.Window());
  Pump(2);
  EXPECT_EQ(DifferencesShown(window, LinuxSnapshot("KUtilityPlugin"), "vst2-editor-exposed"), 0);
  vst2.instance.Call(KVST2::effEditClose);
  EXPECT_EQ(ChildCount(parent), 0);
}

// The editor's own size change (its size menu) to a host that refuses it: the windows above the
// editor's grow by the new size plus their frames, up to the first that is no frame.
TEST_F(Win32EditorWindow, ARefusedResizeGrowsTheHostsWindowsUpToAnMDIClientOrAWideFrame) {
  VST2Editor vst2;
  const int32_t w = vst2.width, h = vst2.height;
  // A host's document window (a top-level window with a caption and borders, a frame of a few
  // dozen pixels), holding a panel 10 pixels larger than the editor's window, holding the
  // window the editor opens into.
  HWND document = MakeWindow(WS_OVERLAPPEDWINDOW, 40, 40, w + 200, h + 200, nullptr);
  RECT client{0, 0, w + 10, h + 10};
  ::AdjustWindowRect(&client, WS_OVERLAPPEDWINDOW, FALSE);
  ::SetWindowPos(document, nullptr, 0, 0, client.right - client.left, client.bottom - client.top, SWP_NOMOVE | SWP_NOZORDER);
  HWND panel = MakeWindow(WS_CHILD, 0, 0, w + 10, h + 10, document);
  HWND inner = MakeWindow(WS_CHILD, 5, 5, w, h, panel);
  const auto [documentWidth, documentHeight] = SizeOf(document);
  const int32_t frameX = documentWidth - (w + 10), frameY = documentHeight - (h + 10);
  ASSERT_GT(frameY, 0);
  ASSERT_LE(frameY, 80);
  ASSERT_EQ(vst2.instance.Call(KVST2::effEditOpen, 0, 0, inner), 1);
  Pump(2);

  vst2.host.acceptWindowSize = false;
  ASSERT_TRUE(vst2.editor.SetScale(2.0));
  ASSERT_EQ(vst2.host.windowSizes.size(), 1u);  // asked first
  EXPECT_EQ(SizeOf(inner), std::pair(2 * w, 2 * h));
  EXPECT_EQ(SizeOf(panel), std::pair(2 * w + 10, 2 * h + 10));
  EXPECT_EQ(SizeOf(document), std::pair(2 * w + 10 + frameX, 2 * h + 10 + frameY));
  // Neither moved nor raised: each keeps its corner.
  EXPECT_EQ(WindowBox(document).left, 40);
  EXPECT_EQ(WindowBox(inner).left - WindowBox(panel).left, 5);
  for (int i = 0; i < 5; ++i) {
    Pump(1);
    vst2.instance.Call(KVST2::effEditIdle);
  }
  EXPECT_EQ(SizeOf(vst2.Window()), std::pair(2 * w, 2 * h));
  vst2.instance.Call(KVST2::effEditClose);
  ::DestroyWindow(document);

  // Inside an MDI frame: the climb stops at the "MDIClient", which stays as it is.
  HWND mdiFrame = MakeWindow(WS_OVERLAPPEDWINDOW, 0, 0, 1600, 1100, nullptr);
  CLIENTCREATESTRUCT mdi{nullptr, 1};
  HWND mdiClient = MakeWindow(WS_CHILD, 0, 0, w + 30, h + 30, mdiFrame, L"MDIClient", &mdi);
  wchar_t type[16] = {};
  ::GetClassNameW(mdiClient, type, 16);
  ASSERT_EQ(std::wstring(type), L"MDIClient");
  HWND slot = MakeWindow(WS_CHILD, 0, 0, 2 * w + 4, 2 * h + 4, mdiClient);
  HWND holder = MakeWindow(WS_CHILD, 2, 2, 2 * w, 2 * h, slot);
  const std::pair<int32_t, int32_t> mdiFrameSize = SizeOf(mdiFrame), mdiClientSize = SizeOf(mdiClient);
  ASSERT_EQ(vst2.instance.Call(KVST2::effEditOpen, 0, 0, holder), 1);
  Pump(2);
  ASSERT_TRUE(vst2.editor.SetScale(1.0));
  EXPECT_EQ(SizeOf(holder), std::pair(w, h));
  EXPECT_EQ(SizeOf(slot), std::pair(w + 4, h + 4));
  EXPECT_EQ(SizeOf(mdiClient), mdiClientSize);
  EXPECT_EQ(SizeOf(mdiFrame), mdiFrameSize);
  vst2.instance.Call(KVST2::effEditClose);
  ::DestroyWindow(mdiFrame);

  // A window more than 80 pixels larger than the one below is the host's own, not a frame.
  HWND wide = MakeWindow(WS_CHILD, 0, 0, w + 81, h, parent);
  HWND tight = MakeWindow(WS_CHILD, 0, 0, w, h, wide);
  ASSERT_EQ(vst2.instance.Call(KVST2::effEditOpen, 0, 0, tight), 1);
  ASSERT_TRUE(vst2.editor.SetScale(1.5));
  EXPECT_EQ(SizeOf(tight), std::pair(vst2.editor.PixelWidth(), vst2.editor.PixelHeight()));
  EXPECT_EQ(SizeOf(wide), std::pair(w + 81, h));
  EXPECT_EQ(SizeOf(parent), std::pair(1800, 1200));
  vst2.instance.Call(KVST2::effEditClose);
  EXPECT_EQ(vst2.host.windowSizes.size(), 3u);
}

TEST_F(Win32EditorWindow, TheAAXGUIShowsTheEditorInAContainersHWND) {
  using namespace KAAXTest;
  KBundle bundle("Utility");
  KController controller;
  KAutomation automation;
  KEffectParameters* effect = bundle.Create(controller, automation);
  ASSERT_NE(effect, nullptr);
  KAAXGUI* gui = bundle.Information().createGUI(effect);
  ASSERT_NE(gui, nullptr);
  // A container of another kind gets the size but no window.
  KView other;
  other.type = kViewContainerX11Window;
  other.window = parent;
  ASSERT_EQ(gui->Create(&other), kSuccess);
  ASSERT_EQ(gui->CreateViewContents(), kSuccess);
  EXPECT_EQ(ChildCount(parent), 0);
  ASSERT_EQ(gui->DeleteViewContents(), kSuccess);

  KView view;
  view.type = kViewContainerHWND;
  view.window = parent;
  ASSERT_EQ(gui->Create(&view), kSuccess);
  ASSERT_EQ(gui->CreateViewContents(), kSuccess);
  int32_t width = 0, height = 0;
  ASSERT_EQ(gui->GetViewSize(&width, &height), kSuccess);
  EXPECT_EQ(view.sizes, (std::vector<std::pair<int32_t, int32_t>>{{width, height}}));
  for (int i = 0; i < 5; ++i) {
    Pump(1);
    gui->TimerWakeup();
  }
  HWND child = OnlyChild(parent);
  ASSERT_NE(child, nullptr);
  EXPECT_EQ(SizeOf(child), std::pair(width, height));
  KEditorWindow& window = *gui->View()->Window();
  ASSERT_EQ(window.Window(), child);
  EXPECT_EQ(DifferencesShown(window, LinuxSnapshot("KUtilityPlugin"), "aax-gui"), 0);
  gui->Release();
  EXPECT_EQ(ChildCount(parent), 0);
  effect->Release();
}

}  // namespace
