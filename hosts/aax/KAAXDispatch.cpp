#include "hosts/aax/KAAXDispatch.h"

#include <algorithm>
#include <atomic>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "core/KAudioPlugin.h"
#include "hosts/aax/KAAXGUI.h"
#include "hosts/aax/KAudioPluginAAXAdapter.h"
#include "hosts/common/KHostEntry.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"
#include "kernel/KRegistries.h"
#include "kernel/platform/KPlatformLibrary.h"

using namespace KAAX;

namespace {
constexpr const char* kCaption = "AAX Plugin main";
constexpr uint32_t kManufacturerId = KFourCC("Torv");
constexpr std::string_view kBundleSuffix = ".aaxplugin";

std::atomic<int32_t> gStartups{0};

uint32_t CategoryOf(const char* category) noexcept {
  const std::string_view text = category ? category : "";
  if (text == "Dynamics") return kCategoryDynamics;
  if (text == "EQs & Filters") return kCategoryEQ;
  if (text == "Distortion") return kCategoryHarmonic;
  if (text == "Reverb & Delay") return kCategoryReverb | kCategoryDelay;
  if (text == "Modulation") return kCategoryModulation;
  if (text == "Stereo") return kCategorySoundField;
  return kCategoryEffect;
}

uint32_t StemOf(int32_t channels) noexcept { return channels == 1 ? kStemFormatMono : kStemFormatStereo; }

void CopyField(std::string_view text, char (&field)[64]) noexcept {
  const size_t length = std::min(text.size(), sizeof field - 1);
  std::memcpy(field, text.data(), length);
  field[length] = 0;
}

void Describe(const KPluginDescription& description, KAAXPluginInformation& information) {
  information = KAAXPluginInformation{};
  CopyField(description.key, information.key);
  CopyField(description.name, information.name);
  information.category = CategoryOf(description.moduleKey ? description.category : nullptr);
  information.manufacturerId = kManufacturerId;
  information.productId = static_cast<uint32_t>(KPluginIds::AAXProductId(description.vst2Id));
  const std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(description.key, "");
  if (!plugin) throw KException("The plug-in could not be made.");
  const KAudioPlugin::Shape& shape = plugin->GetShape();
  information.acceptsMIDI = shape.acceptsMIDI;
  information.producesMIDI = shape.producesMIDI;
  // One stem pair per channel count the plug-in runs with, in its order of preference.
  for (const int32_t channels : KAudioPlugin::kChannelCounts) {
    if (information.configurationCount == KAAXPluginInformation::kMaxConfigurations) break;
    KAAXPluginInformation::Configuration& configuration = information.configurations[information.configurationCount];
    configuration.inputStem = shape.inputBuses > 0 ? StemOf(channels) : kStemFormatNone;
    configuration.outputStem = StemOf(channels);
    configuration.sideChainStem = shape.inputBuses > 1 ? StemOf(channels) : kStemFormatNone;
    configuration.pluginId = static_cast<uint32_t>(KPluginIds::AAXPluginId(description.identity, channels));
    ++information.configurationCount;
  }
  information.createInstance = &KAAXDispatchCreateInstance;
  information.createGUI = &KAAXDispatchCreateGUI;
  information.processCallback = &KAAXProcessCallback;
}

// The bundle holding this library, from its path ".../Name.aaxplugin/Contents/<arch>/<file>";
// empty outside a bundle.
std::string OwnBundleName() {
  static const char anchor = 0;
  std::string path = KPlatform::LibraryPathOf(&anchor);
  std::replace(path.begin(), path.end(), '\\', '/');  // Windows paths have either separator
  const size_t contents = path.rfind("/Contents/");
  if (contents == std::string::npos) return {};
  const std::string_view bundle = std::string_view(path).substr(0, contents);
  if (!bundle.ends_with(kBundleSuffix)) return {};
  const std::string_view folder = bundle.substr(0, bundle.size() - kBundleSuffix.size());
  return std::string(folder.substr(folder.rfind('/') + 1));
}

class KPluginDefinition final : public IACFPluginDefinition {
public:
  explicit KPluginDefinition(const std::string& bundle) {
    for (const KPluginDescription& description : KProductCatalogue().plugins) {
      if (!bundle.empty() && KPluginIds::BundleName(description.key) != bundle) continue;
      Describe(description, plugins_.emplace_back());
    }
  }
  int32_t Count() const override { return static_cast<int32_t>(plugins_.size()); }
  const KAAXPluginInformation* At(int32_t index) const override {
    return index >= 0 && index < Count() ? &plugins_[static_cast<size_t>(index)] : nullptr;
  }
  void Release() noexcept override { delete this; }

private:
  std::vector<KAAXPluginInformation> plugins_;
  KAAXLiveObject live_;
};

}  // namespace

ACFResult ACFStartup(IACFUnknown*) {
  return KHostEntryGuarded(kCaption, "ACFStartup", kACFFail, [] {
    KRegistries::Instance().EnsureBuilt();
    gStartups.fetch_add(1, std::memory_order_relaxed);
    return kACFOk;
  });
}

ACFResult ACFShutdown(IACFUnknown*) {
  return gStartups.fetch_sub(1, std::memory_order_relaxed) > 0 ? kACFOk : (gStartups.store(0), kACFUnexpected);
}

ACFResult ACFGetSDKVersion(uint64_t* version) {
  if (!version) return kACFPointer;
  *version = kSDKVersion;
  return kACFOk;
}

ACFResult ACFRegisterPlugin(IACFUnknown*, IACFPluginDefinition** definition) {
  return KHostEntryGuarded(kCaption, "ACFRegisterPlugin", kACFFail, [&] {
    if (!definition) return kACFPointer;
    *definition = nullptr;
    auto made = std::make_unique<KPluginDefinition>(OwnBundleName());
    if (made->Count() == 0) return kACFFail;
    *definition = made.release();
    return kACFOk;
  });
}

ACFResult ACFRegisterComponent(IACFUnknown*, uint32_t, void** component) {
  if (component) *component = nullptr;
  return kACFOk;
}

ACFResult ACFGetClassFactory(IACFUnknown*, const void*, const void*, void** factory) {
  if (factory) *factory = nullptr;
  return kACFNotImplemented;
}

ACFResult ACFCanUnloadNow(IACFUnknown*) { return KAAXLiveObject::Count() == 0 ? kACFOk : kACFFalse; }

KEffectParameters* KAAXDispatchCreateInstance(const char* pluginName, const char* subName) {
  return KHostEntryGuarded<KEffectParameters>(kCaption, "KAAXDispatchCreateInstance", [&]() -> KEffectParameters* {
    std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(pluginName, subName);
    return plugin ? new KAudioPluginAAXAdapter(std::move(plugin)) : nullptr;
  });
}

KAAXGUI* KAAXDispatchCreateGUI(KEffectParameters* effect) {
  return KHostEntryGuarded<KAAXGUI>(kCaption, "KAAXDispatchCreateGUI", [&]() -> KAAXGUI* {
    auto* adapter = dynamic_cast<KAudioPluginAAXAdapter*>(effect);
    return adapter ? new KAAXGUI(*adapter) : nullptr;
  });
}

Result KAAXDispatchGetPluginInformation(const char* key, KAAXPluginInformation* information) {
  return KHostEntryGuarded(kCaption, "KAAXDispatchGetPluginInformation", kErrorNullObject, [&] {
    const KPluginDescription* description = key ? KFindDescription(KProductCatalogue(), key) : nullptr;
    if (!description || !information) return kErrorNullObject;
    Describe(*description, *information);
    return kSuccess;
  });
}

void KAAXProcessCallback(KAAXProcessContext* const instances[], const void* end) {
  if (!instances) return;
  for (KAAXProcessContext* const* at = instances; at != end; ++at)
    if (*at && (*at)->adapter) (*at)->adapter->Process(**at);
}
