#include "hosts/lv2/KLV2UI.h"

#include <lv2/instance-access/instance-access.h>

#include <cstdint>
#include <cstring>
#include <deque>
#include <mutex>
#include <string>

#include "core/KParameter.h"
#include "hosts/common/KHostEditor.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/common/KHostGuard.h"
#include "hosts/lv2/KAudioPluginLV2Adapter.h"
#include "hosts/lv2/KLV2Dispatch.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"
#include "ui/platform/KEditorWindowX11.h"

namespace KLV2 {
namespace {

// One open UI, on the instance the host gave through instance-access.
class KUI final : public KEditorHost {
public:
  KUI(KAudioPluginLV2Adapter& adapter, LV2UI_Write_Function write, LV2UI_Controller controller, const LV2UI_Resize* resize,
      const LV2UI_Touch* touch)
      : adapter_(adapter), write_(write), controller_(controller), resize_(resize), touch_(touch), view_(adapter.Plugin(), this) {}

  // The editor in the host's window, which is asked to take the editor's size.
  bool Open(unsigned long parent) {
    if (!view_.Open(parent)) return false;
    if (resize_) resize_->ui_resize(resize_->handle, view_.PixelWidth(), view_.PixelHeight());
    return true;
  }
  unsigned long Window() noexcept { return view_.Window() ? view_.Window()->Window() : 0; }
  void Idle() { view_.Idle(); }

  // ---- KEditorHost: edits to the control ports, in working units
  void BeginEdit(int32_t parameter) override { Touch(parameter, true); }
  void PerformEdit(int32_t parameter, double normalized) override {
    const float value = static_cast<float>(adapter_.Plugin().GetParameter(parameter).Kind().ToWorking(normalized));
    write_(controller_, Port(parameter), sizeof value, 0, &value);
  }
  void EndEdit(int32_t parameter) override { Touch(parameter, false); }
  bool ResizeView(int32_t width, int32_t height) override { return resize_ && resize_->ui_resize(resize_->handle, width, height) == 0; }

private:
  uint32_t Port(int32_t parameter) const noexcept {
    return static_cast<uint32_t>(adapter_.Layout().First(KPort::Kind::kParameter) + parameter);
  }
  void Touch(int32_t parameter, bool grabbed) {
    if (touch_) touch_->touch(touch_->handle, Port(parameter), grabbed);
  }

  KAudioPluginLV2Adapter& adapter_;
  LV2UI_Write_Function write_;
  LV2UI_Controller controller_;
  const LV2UI_Resize* resize_;
  const LV2UI_Touch* touch_;
  KHostEditor view_;
};

KUI* UI(LV2UI_Handle handle) { return static_cast<KUI*>(handle); }

const void* Feature(const LV2_Feature* const* features, const char* uri) {
  for (; features && *features; ++features)
    if (std::strcmp((*features)->URI, uri) == 0) return (*features)->data;
  return nullptr;
}

LV2UI_Handle Instantiate(const LV2UI_Descriptor*, const char*, const char*, LV2UI_Write_Function write, LV2UI_Controller controller,
                         LV2UI_Widget* widget, const LV2_Feature* const* features) {
  return KHostEntryGuarded<void>("LV2 Plugin main", "KLV2UI::instantiate", [&]() -> void* {
    auto* adapter = static_cast<KAudioPluginLV2Adapter*>(const_cast<void*>(Feature(features, LV2_INSTANCE_ACCESS_URI)));
    const void* parent = Feature(features, LV2_UI__parent);
    if (!adapter || !parent || !write || !widget) return nullptr;
    auto ui = std::make_unique<KUI>(*adapter, write, controller, static_cast<const LV2UI_Resize*>(Feature(features, LV2_UI__resize)),
                                    static_cast<const LV2UI_Touch*>(Feature(features, LV2_UI__touch)));
    if (!ui->Open(static_cast<unsigned long>(reinterpret_cast<uintptr_t>(parent)))) return nullptr;
    *widget = reinterpret_cast<LV2UI_Widget>(static_cast<uintptr_t>(ui->Window()));
    return ui.release();
  });
}

void Cleanup(LV2UI_Handle handle) {
  KHostGuarded("KLV2UI::cleanup", 0, [&] {
    delete UI(handle);
    return 0;
  });
}

// Answers 0 while the UI stays open.
int Idle(LV2UI_Handle handle) {
  return KHostGuarded("KLV2UI::idle", 0, [&] {
    UI(handle)->Idle();
    return 0;
  });
}

constexpr LV2UI_Idle_Interface kIdle = {Idle};

const void* ExtensionData(const char* uri) { return std::strcmp(uri, LV2_UI__idleInterface) == 0 ? &kIdle : nullptr; }

struct KUIEntry {
  LV2UI_Descriptor descriptor;
  std::string uri;
};
std::mutex gUIsLock;
std::deque<KUIEntry> gUIs;  // never shrinks: hosts keep descriptor pointers

const LV2UI_Descriptor* Find(const char* bundleName) {
  const KPluginDescription* plugin = BundlePlugin(bundleName);
  if (!plugin) return nullptr;
  const std::string uri = UIURI(KPluginIds::LV2URI(plugin->identity));
  std::lock_guard<std::mutex> lock(gUIsLock);
  for (const KUIEntry& entry : gUIs)
    if (entry.uri == uri) return &entry.descriptor;
  KUIEntry& entry = gUIs.emplace_back(KUIEntry{{}, uri});
  // The editor follows the plug-in itself: no port events are needed.
  entry.descriptor = {entry.uri.c_str(), Instantiate, Cleanup, nullptr, ExtensionData};
  return &entry.descriptor;
}

}  // namespace
}  // namespace KLV2

const LV2UI_Descriptor* KLV2DispatchUIDescriptor(const char* bundleName) {
  return KHostEntryGuarded<const LV2UI_Descriptor>("LV2 Plugin main", KLV2::kUIDispatchName,
                                                   [&] { return bundleName ? KLV2::Find(bundleName) : nullptr; });
}
