// The editor as an AAX host shows it: the GUI made through registration, framed in a container
// that holds an X11 window (the tests run under Xvfb), run by the host's timer, painted as the
// offline snapshot paints it, its edits reaching the host as touch, set and release requests.
#include <unistd.h>

#include <memory>
#include <string>

#include "kernel/KEntryPoints.h"
#include "tests/hosts/AAXHost.h"
// Last: X11's macros would break the headers above.
#include "tests/hosts/X11EditorWindow.h"

using namespace KAAXTest;

namespace {

struct AAXEditorWindow : KX11Test::EditorWindowFixture {
  static void Wake(KAAXGUI& gui, int rounds = 10) {
    for (int i = 0; i < rounds; ++i) {
      usleep(15000);
      gui.TimerWakeup();
    }
  }
};

TEST_F(AAXEditorWindow, TheGUIShowsTheEditorInTheContainersWindowAndSendsItsEdits) {
  KBundle bundle("Utility");
  KController controller;
  KAutomation automation;
  KEffectParameters* effect = bundle.Create(controller, automation);
  ASSERT_NE(effect, nullptr);
  KView view;
  view.type = kViewContainerX11Window;
  view.window = reinterpret_cast<void*>(parent);
  KAAXGUI* gui = bundle.Information().createGUI(effect);
  ASSERT_NE(gui, nullptr);
  ASSERT_EQ(gui->Create(&view), kSuccess);
  ASSERT_EQ(gui->CreateViewContents(), kSuccess);
  int32_t width = 0, height = 0;
  ASSERT_EQ(gui->GetViewSize(&width, &height), kSuccess);
  EXPECT_EQ(view.sizes, (std::vector<std::pair<int32_t, int32_t>>{{width, height}}));
  Wake(*gui);
  const Window child = Child();
  ASSERT_NE(child, 0u);
  EXPECT_EQ(SizeOf(child), std::pair(width, height));

  const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
  EXPECT_EQ(DifferencesFromSnapshot(child, *offline, 1), 0);

  // A drag on the width knob: a touch, values set on the parameter's identifier, a release.
  const int32_t index = offline->FindParameter(KString("width"))->Index();
  const std::string id = std::to_string(index);
  ASSERT_TRUE(KX11Test::DragDown(child, KX11Test::KnobCentre(*offline, "width")));
  Wake(*gui);
  std::string kinds;
  for (const auto& [kind, parameter, value] : automation.posts)
    if (parameter == id) kinds += kind;
  EXPECT_TRUE(KX11Test::IsOneGesture(kinds, 't', 's', 'r')) << kinds;
  double value = 0;
  ASSERT_EQ(effect->GetParameterNormalizedValue(id.c_str(), &value), kSuccess);
  EXPECT_NEAR(value, offline->GetParameter(index).DefaultNormalized() - KX11Test::kDragTravel, 1e-9);

  // The contents go and come back; the GUI goes before its effect.
  EXPECT_EQ(gui->DeleteViewContents(), kSuccess);
  EXPECT_EQ(ChildCount(), 0);
  EXPECT_EQ(gui->CreateViewContents(), kSuccess);
  Wake(*gui, 2);
  EXPECT_EQ(ChildCount(), 1);
  gui->Release();
  EXPECT_EQ(ChildCount(), 0);
  effect->Release();
}

}  // namespace
