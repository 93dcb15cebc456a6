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
#include "kernel/KRegistries.h"
#include "kernel/platform/KPlatformLibrary.h"

using namespace KAAX;

namespace {
constexpr const char* kCaption = "AAX Plugin main";
constexpr uint32_t kManufacturerId = KFourCC("Torv");
constexpr std::string_view kBundleSuffix = ".aaxplugin";

std::atomic<int32_t> gStartups{0};

// The bundle name of a registry key: without its leading "K" and a trailing "Plugin"
// (KCompressorPlugin -> Compressor, KSampleWarmer -> SampleWarmer), as the build lays them out.
std::string BundleName(std::string_view key) {
  if (key.starts_with('K')) key.remove_prefix(1);
  if (key.size() > 6 && key.ends_with("Plugin")) key.remove_suffix(6);
  return std::string(key);
}

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

// Four printable characters from the bundle name ("Comp", "Equa"): the product's identifier
// until the plug-ins' descriptions carry their own.
uint32_t ProductIdOf(const std::string& name) noexcept {
  char code[5] = "____";
  for (size_t i = 0; i < 4 && i < name.size(); ++i) code[i] = name[i];
  return KFourCC(code);
}

uint32_t StemOf(int32_t channels) noexcept { return channels == 1 ? kStemFormatMono : kStemFormatStereo; }

void CopyField(std::string_view text, char (&field)[64]) noexcept {
  const size_t length = std::min(text.size(), sizeof field - 1);
  std::memcpy(field, text.data(), length);
  field[length] = 0;
}

void Describe(const KCatalogueEntry& entry, KAAXPluginInformation& information) {
  information = KAAXPluginInformation{};
  const std::string name = BundleName(entry.key);
  CopyField(entry.key, information.key);
  CopyField(name, information.name);
  information.category = CategoryOf(entry.moduleKey ? entry.category : nullptr);
  information.manufacturerId = kManufacturerId;
  information.productId = ProductIdOf(name);
  const std::unique_ptr<KAudioPlugin> plugin = KHostCreatePlugin(entry.key, "");
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
    configuration.pluginId = (information.productId & 0xFFFFFF00u) | static_cast<uint32_t>('0' + information.configurationCount);
    ++information.configurationCount;
  }
  information.createInstance = &KAAXDispatchCreateInstance;
  information.createGUI = &KAAXDispatchCreateGUI;
  information.processCallback = &KAAXProcessCallback;
}

const KCatalogueEntry* FindEntry(std::string_view key) noexcept {
  for (const KCatalogueEntry& entry : KProductCatalogue().plugins)
    if (key == entry.key) return &entry;
  return nullptr;
}

// The bundle holding this library, from its path ".../Name.aaxplugin/Contents/<arch>/<file>";
// empty outside a bundle.
std::string OwnBundleName() {
  static const char anchor = 0;
  const std::string path = KPlatform::LibraryPathOf(&anchor);
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
    for (const KCatalogueEntry& entry : KProductCatalogue().plugins) {
      if (!bundle.empty() && BundleName(entry.key) != bundle) continue;
      Describe(entry, plugins_.emplace_back());
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
    const KCatalogueEntry* entry = key ? FindEntry(key) : nullptr;
    if (!entry || !information) return kErrorNullObject;
    Describe(*entry, *information);
    return kSuccess;
  });
}

void KAAXProcessCallback(KAAXProcessContext* const instances[], const void* end) {
  if (!instances) return;
  for (KAAXProcessContext* const* at = instances; at != end; ++at)
    if (*at && (*at)->adapter) (*at)->adapter->Process(**at);
}
