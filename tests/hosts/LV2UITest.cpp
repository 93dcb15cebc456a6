// The editor as an LV2 host shows it: the UI library loaded with dlopen from the built bundle,
// instantiated with the host's window, the plug-in instance and the resize and touch features,
// run by the idle interface (the tests run under Xvfb), painted as the offline snapshot paints
// it, its edits written to the control ports. Without instance-access or a window it fails
// cleanly, so that the host shows its generic controls.
#include <lv2/instance-access/instance-access.h>
#include <lv2/ui/ui.h>
#include <unistd.h>

#include <memory>
#include <string>
#include <tuple>
#include <vector>

#include "hosts/lv2/KLV2Dispatch.h"
#include "kernel/KEntryPoints.h"
#include "kernel/platform/KPlatformLibrary.h"
#include "tests/hosts/LV2Host.h"
// Last: X11's macros would break the headers above.
#include "tests/hosts/X11EditorWindow.h"


namespace {

// What the UI told the host.
struct KUIHost {
  std::vector<std::pair<uint32_t, float>> writes;       // port, value
  std::vector<std::pair<uint32_t, bool>> touches;       // port, grabbed
  std::vector<std::pair<int, int>> sizes;
  LV2UI_Resize resize{this, [](LV2UI_Feature_Handle self, int width, int height) {
                        static_cast<KUIHost*>(self)->sizes.emplace_back(width, height);
                        return 0;
                      }};
  LV2UI_Touch touch{this, [](LV2UI_Feature_Handle self, uint32_t port, bool grabbed) {
                      static_cast<KUIHost*>(self)->touches.emplace_back(port, grabbed);
                    }};
  static void Write(LV2UI_Controller self, uint32_t port, uint32_t size, uint32_t protocol, const void* value) {
    if (size == sizeof(float) && protocol == 0) static_cast<KUIHost*>(self)->writes.emplace_back(port, *static_cast<const float*>(value));
  }
};

struct LV2UIWindow : KX11Test::EditorWindowFixture {};

TEST_F(LV2UIWindow, TheUIShowsTheEditorOnTheInstanceAndWritesItsEditsToTheControlPorts) {
  const std::string bundle = TORVANE_LV2_DIR "/Utility.lv2/";
  void* library = KPlatform::OpenLibrary(bundle + "Utility.so");
  ASSERT_TRUE(library) << KPlatform::LibraryError();
  const auto pluginEntry = reinterpret_cast<const LV2_Descriptor* (*)(uint32_t)>(KPlatform::FindSymbol(library, "lv2_descriptor"));
  const auto uiEntry = reinterpret_cast<const LV2UI_Descriptor* (*)(uint32_t)>(KPlatform::FindSymbol(library, "lv2ui_descriptor"));
  ASSERT_TRUE(pluginEntry && uiEntry && uiEntry(0));
  EXPECT_EQ(uiEntry(1), nullptr);
  const LV2UI_Descriptor& ui = *uiEntry(0);
  EXPECT_EQ(std::string(ui.URI), std::string(pluginEntry(0)->URI) + "#ui");
  const auto* idle = static_cast<const LV2UI_Idle_Interface*>(ui.extension_data(LV2_UI__idleInterface));
  ASSERT_NE(idle, nullptr);
  {
    KLV2Test::KInstance instance(pluginEntry(0), "KUtilityPlugin", nullptr);
    ASSERT_NE(instance.handle, nullptr);
    instance.Run(64);

    KUIHost host;
    const LV2_Feature parentFeature{LV2_UI__parent, reinterpret_cast<void*>(parent)};
    const LV2_Feature accessFeature{LV2_INSTANCE_ACCESS_URI, instance.handle};
    const LV2_Feature resizeFeature{LV2_UI__resize, &host.resize}, touchFeature{LV2_UI__touch, &host.touch};
    LV2UI_Widget widget = nullptr;
    // Out of process (no instance-access) or without a window: no UI, and nothing left behind.
    const LV2_Feature* remote[] = {&parentFeature, &resizeFeature, nullptr};
    EXPECT_EQ(ui.instantiate(&ui, pluginEntry(0)->URI, bundle.c_str(), &KUIHost::Write, &host, &widget, remote), nullptr);
    const LV2_Feature* windowless[] = {&accessFeature, nullptr};
    EXPECT_EQ(ui.instantiate(&ui, pluginEntry(0)->URI, bundle.c_str(), &KUIHost::Write, &host, &widget, windowless), nullptr);
    EXPECT_EQ(ChildCount(), 0);

    const LV2_Feature* features[] = {&parentFeature, &accessFeature, &resizeFeature, &touchFeature, nullptr};
    LV2UI_Handle handle = ui.instantiate(&ui, pluginEntry(0)->URI, bundle.c_str(), &KUIHost::Write, &host, &widget, features);
    ASSERT_NE(handle, nullptr);
    for (int i = 0; i < 10; ++i) {
      usleep(15000);
      EXPECT_EQ(idle->idle(handle), 0);
    }
    const Window child = Child();
    ASSERT_NE(child, 0u);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(widget), child);
    const std::unique_ptr<KAudioPlugin> offline(CreateTorvanePlugin(KString("KUtilityPlugin")));
    const KBitmap expected = KBitmap::Decode(KPluginEditorSnapshotPNG(*offline, 1, false), "snapshot");
    ASSERT_EQ(host.sizes, (std::vector<std::pair<int, int>>{{expected.Width(), expected.Height()}}));
    EXPECT_EQ(SizeOf(child), std::pair(expected.Width(), expected.Height()));
    // Meters left out: the one run lit them.
    EXPECT_EQ(DifferencesFromSnapshot(child, *offline, 1, KRect{0, 0, expected.Width() * 3 / 4, expected.Height() - 1}), 0);

    // A drag on the width knob: its port touched, written in working units, released.
    KAudioPluginBase::Parameter& width = *offline->FindParameter(KString("width"));
    ASSERT_TRUE(KX11Test::DragDown(child, KX11Test::KnobCentre(*offline, "width")));
    for (int i = 0; i < 10; ++i) {
      usleep(15000);
      idle->idle(handle);
    }
    const auto port = static_cast<uint32_t>(instance.layout.First(KLV2::KPort::Kind::kParameter) + width.Index());
    EXPECT_EQ(host.touches, (std::vector<std::pair<uint32_t, bool>>{{port, true}, {port, false}}));
    ASSERT_FALSE(host.writes.empty());
    for (const auto& [written, value] : host.writes) EXPECT_EQ(written, port);
    const double dragged = width.Kind().ToWorking(width.DefaultNormalized() - KX11Test::kDragTravel);
    EXPECT_NEAR(host.writes.back().second, dragged, 1e-4 * (1 + std::abs(dragged)));

    ui.cleanup(handle);
    EXPECT_EQ(ChildCount(), 0);
  }
  KPlatform::CloseLibrary(library);
}

}  // namespace
