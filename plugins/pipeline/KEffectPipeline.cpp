#include "plugins/pipeline/KEffectPipeline.h"

#include <algorithm>
#include <string>

#include "core/KAudioPluginHost.h"
#include "core/KParameter.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KRegistries.h"

namespace {
constexpr KAudioPlugin::Shape kShape{1, 1, false, false, false};
const KSwitchKind kBypassKind{};
const KString kSettings = KString::Static(KPipelineFile::kRoot);

// Keys and names of the slot parameters by index, the same for every instance and kept for the
// life of the library, since tables refer to them without copying.
struct SlotTexts {
  std::vector<std::string> keys, names;
  SlotTexts() : keys(KPipelineTable::kParameterCount), names(KPipelineTable::kParameterCount) {
    for (int32_t slot = 0; slot < KPipelineTable::kSlots; ++slot) {
      const std::string number = std::to_string(slot + 1);
      keys[KPipelineTable::BypassIndex(slot)] = "slot" + number + "bypass";
      names[KPipelineTable::BypassIndex(slot)] = "Slot " + number + " bypass";
      for (int32_t p = 0; p < KPipelineTable::kModuleParameters; ++p) {
        keys[KPipelineTable::ParameterIndex(slot, p)] = "slot" + number + "param" + std::to_string(p + 1);
        names[KPipelineTable::ParameterIndex(slot, p)] = "Slot " + number + " parameter " + std::to_string(p + 1);
      }
    }
  }
};
const SlotTexts& Texts() {
  static const SlotTexts texts;
  return texts;
}

uint32_t SaturatingSum(uint32_t a, uint32_t b) noexcept {
  return a > KAudioPlugin::kInfiniteTail - b ? KAudioPlugin::kInfiniteTail : a + b;
}
}  // namespace

const KAudioPluginBase::Parameter* KSlotKind::Carried(const KModuleChain& chain) const noexcept {
  const int32_t position = chain.PositionOfSlot(slot_);
  if (position < 0) return nullptr;
  const KAudioPlugin& module = *chain.stages[position].module;
  return parameter_ < module.ParameterCount() ? &module.GetParameter(parameter_) : nullptr;
}

KString KSlotKind::ToText(double working) const {
  const std::shared_ptr<const KModuleChain> chain = view_.Load();
  const KAudioPluginBase::Parameter* carried = Carried(*chain);
  if (!carried) return KString::Static("-");
  const KString unit = carried->Unit();
  const KString text = carried->TextForNormalized(working);
  return unit.IsEmpty() ? text : text + KString::Static(" ") + unit;
}

bool KSlotKind::CurrentName(KString& name) const {
  const std::shared_ptr<const KModuleChain> chain = view_.Load();
  const KAudioPluginBase::Parameter* carried = Carried(*chain);
  name = carried ? carried->Name() : KString();
  return true;
}

bool KSlotKind::FromText(const KString& text, double& working) const {
  const std::shared_ptr<const KModuleChain> chain = view_.Load();
  const KAudioPluginBase::Parameter* carried = Carried(*chain);
  return carried && carried->NormalizedFromText(text, working);
}

KPipelineTable::KPipelineTable() {
  const SlotTexts& texts = Texts();
  kinds.resize(kParameterCount);
  rows.resize(kParameterCount);
  for (int32_t slot = 0; slot < kSlots; ++slot) {
    const int32_t bypass = BypassIndex(slot);
    rows[bypass] = {texts.keys[bypass].c_str(), texts.names[bypass].c_str(), &kBypassKind, 0.0, KParameterInfo::kAutomatable};
    for (int32_t p = 0; p < kModuleParameters; ++p) {
      const int32_t row = ParameterIndex(slot, p);
      kinds[row] = std::make_unique<KSlotKind>(view, slot, p);
      rows[row] = {texts.keys[row].c_str(), texts.names[row].c_str(), kinds[row].get(), 0.0, KParameterInfo::kAutomatable};
    }
  }
}

KEffectPipeline::KEffectPipeline() : KAudioPlugin(rows, kShape) {}

KEffectPipeline::~KEffectPipeline() = default;

KAudioPlugin* KEffectPipeline::Create(KModule*, const KPluginRecord*) { return new KEffectPipeline; }

namespace {
// Chains to start from: each module at its own defaults, in the order a signal meets them.
constexpr KFactoryPreset kPresets[] = {
    {"Vocal chain", {},
     "<PluginSettings><EffectPipeline><Module Key=\"Gate\"/><Module Key=\"Compressor\"/>"
     "<Module Key=\"Equalizer\"/></EffectPipeline></PluginSettings>"},
    {"Master bus", {},
     "<PluginSettings><EffectPipeline><Module Key=\"Equalizer\"/><Module Key=\"MultibandCompressor\"/>"
     "<Module Key=\"Limiter\"/></EffectPipeline></PluginSettings>"},
    {"Lo-fi", {},
     "<PluginSettings><EffectPipeline><Module Key=\"BitCrusher\"/><Module Key=\"SampleWarmer\"/>"
     "</EffectPipeline></PluginSettings>"},
};
}  // namespace

constinit const KPluginDescription kEffectPipelineDescription{
    .key = "KEffectPipeline",
    .factory = &KEffectPipeline::Create,
    .moduleKey = nullptr,
    .category = nullptr,
    .name = "EffectPipeline",
    .vst3SubCategories = "Fx|Tools",
    .vst2Id = "TvEP",
    .identity = "KEffectPipeline",
    .help = &KEffectPipelineHelp,
    .editor = &KEffectPipelineEditor,
    .presets = kPresets,
};

std::shared_ptr<KAudioPlugin> KEffectPipeline::MakeModule(const KString& key) const {
  KRegistries& registries = KRegistries::Instance();
  registries.EnsureBuilt();
  if (!registries.Modules().FindExact(key))
    throw KException(KFormatText("There is no effect module named {0}.", key));
  std::shared_ptr<KAudioPlugin> module(registries.Modules().Create(key, nullptr));
  const KAudioPlugin::Shape& shape = module->GetShape();
  if (shape.inputBuses < 1 || shape.outputBuses != 1 || !module->SetChannelsPerBus(ChannelsPerBus()))
    throw KException(KFormatText("The module {0} cannot run in an effect pipeline on {1} channels.", key, ChannelsPerBus()));
  module->SetSampleRate(SampleRate());
  return module;
}

int32_t KEffectPipeline::CheckedPosition(int32_t slot) const {
  const int32_t position = slot >= 0 && slot < kSlots ? Chain().PositionOfSlot(slot) : -1;
  if (position < 0) throw KException(KFormatText("Slot {0} of the effect pipeline holds no module.", slot + 1));
  return position;
}

KAudioPlugin* KEffectPipeline::ModuleInSlot(int32_t slot) const noexcept {
  const int32_t position = slot >= 0 && slot < kSlots ? Chain().PositionOfSlot(slot) : -1;
  return position < 0 ? nullptr : Chain().stages[position].module.get();
}

void KEffectPipeline::ShowInSlot(int32_t slot, const KAudioPlugin* module, bool bypass) {
  GetParameter(BypassIndex(slot)).SetNormalized(bypass ? 1.0 : 0.0);
  const int32_t carried = module ? std::min(module->ParameterCount(), kModuleParameters) : 0;
  for (int32_t p = 0; p < kModuleParameters; ++p)
    GetParameter(ParameterIndex(slot, p)).SetNormalized(p < carried ? module->GetParameter(p).Normalized() : 0.0);
}

int32_t KEffectPipeline::AddModule(const KString& key, int32_t position) {
  auto chain = std::make_unique<KModuleChain>(Chain());
  const int32_t slot = chain->FirstFreeSlot();
  if (slot < 0) throw KException(KFormatText("An effect pipeline holds at most {0} modules.", kSlots));
  std::shared_ptr<KAudioPlugin> module = MakeModule(key);
  const int32_t count = static_cast<int32_t>(chain->stages.size());
  const int32_t at = position < 0 || position > count ? count : position;
  chain->stages.insert(chain->stages.begin() + at, KModuleChain::Stage{module, key, slot});
  ShowInSlot(slot, module.get(), false);
  Publish(std::move(chain));
  return slot;
}

void KEffectPipeline::RemoveModule(int32_t slot) {
  const int32_t position = CheckedPosition(slot);
  auto chain = std::make_unique<KModuleChain>(Chain());
  chain->stages.erase(chain->stages.begin() + position);
  Publish(std::move(chain));
  ShowInSlot(slot, nullptr, false);  // after the swap, so that the leaving module keeps its values to the end
}

void KEffectPipeline::MoveModule(int32_t slot, int32_t position) {
  const int32_t from = CheckedPosition(slot);
  auto chain = std::make_unique<KModuleChain>(Chain());
  KModuleChain::Stage stage = chain->stages[from];
  chain->stages.erase(chain->stages.begin() + from);
  const int32_t count = static_cast<int32_t>(chain->stages.size());
  chain->stages.insert(chain->stages.begin() + std::clamp(position, 0, count), stage);
  Publish(std::move(chain));
}

void KEffectPipeline::SetModuleBypass(int32_t slot, bool bypass) {
  CheckedPosition(slot);
  GetParameter(BypassIndex(slot)).SetNormalized(bypass ? 1.0 : 0.0);
}

void KEffectPipeline::Publish(std::unique_ptr<KModuleChain> chain) {
  // Readers on other threads get a copy of their own, whatever the hand-over frees.
  view.Store(std::make_shared<const KModuleChain>(*chain));
  chains.Publish(std::move(chain));
  MarkUpdatePending();
  ReportLatency(LatencyOf(Chain()));
  if (KAudioPluginHost* host = Interface()) host->UpdateParameterNames();
}

Element KEffectPipeline::WritePipeline() const {
  std::vector<KPipelineModule> modules;
  for (const KModuleChain::Stage& stage : Chain().stages) {
    KPipelineModule module{stage.key, stage.slot, GetParameter(BypassIndex(stage.slot)).Normalized() >= 0.5, Element()};
    // The slot's values are the module's: the audio thread may not have passed the newest on.
    PassValues(stage);
    stage.module->StoreState(module.state);
    // Bypass belongs to the slot and is kept beside the state, not inside it.
    module.state.RemoveAttribute(KString::Static("Bypass"));
    modules.push_back(std::move(module));
  }
  return KPipelineFile::Write(modules);
}

void KEffectPipeline::LoadPipeline(const Element& document) {
  std::vector<KPipelineModule> modules = KPipelineFile::Read(document);
  if (static_cast<int32_t>(modules.size()) > kSlots)
    throw KException(KFormatText("An effect pipeline holds at most {0} modules.", kSlots));
  auto chain = std::make_unique<KModuleChain>();
  // Modules keep the slots the document gives them; the others, and any that ask for a slot
  // taken already or out of range, get the first free one, in order.
  bool taken[kSlots] = {};
  for (KPipelineModule& module : modules) {
    if (module.slot >= kSlots || (module.slot >= 0 && taken[module.slot])) module.slot = -1;
    if (module.slot >= 0) taken[module.slot] = true;
  }
  for (KPipelineModule& module : modules) {
    if (module.slot < 0) module.slot = static_cast<int32_t>(std::find(std::begin(taken), std::end(taken), false) - std::begin(taken));
    taken[module.slot] = true;
    std::shared_ptr<KAudioPlugin> made = MakeModule(module.key);
    made->LoadState(module.state);
    chain->stages.push_back({std::move(made), module.key, module.slot});
  }
  // An empty slot keeps the values its parameters were given: they are the host's, and a state
  // must load back exactly as it was stored.
  for (int32_t slot = 0; slot < kSlots; ++slot)
    if (const int32_t position = chain->PositionOfSlot(slot); position >= 0)
      ShowInSlot(slot, chain->stages[position].module.get(), modules[position].bypass);
  Publish(std::move(chain));
}

void KEffectPipeline::StorePluginSettings(Element& section, uint32_t flags) {
  Element* found = section.FindChild(kSettings);
  if (flags & kStore) {
    // An empty chain stores nothing, but clears what an earlier store left.
    if (ModuleCount() > 0) (found ? *found : section.AddChild(kSettings)) = WritePipeline();
    else if (found) *found = Element(kSettings);
    return;
  }
  LoadPipeline(found ? *found : Element(kSettings));
}

bool KEffectPipeline::SetSampleRate(double sampleRate) {
  if (!KAudioPlugin::SetSampleRate(sampleRate)) return false;
  for (const KModuleChain::Stage& stage : Chain().stages) stage.module->SetSampleRate(sampleRate);
  ReportLatency(LatencyOf(Chain()));
  return true;
}

uint32_t KEffectPipeline::TailSamples() const noexcept {
  // Each module's tail counts from when its input falls silent, which is when the tail of the
  // module before it has passed.
  uint32_t tail = 0;
  for (const KModuleChain::Stage& stage : Chain().stages) tail = SaturatingSum(tail, stage.module->TailSamples());
  return tail;
}

int32_t KEffectPipeline::LatencyOf(const KModuleChain& chain) const noexcept {
  int32_t latency = 0;
  for (const KModuleChain::Stage& stage : chain.stages)
    if (GetParameter(BypassIndex(stage.slot)).Normalized() < 0.5) latency += stage.module->TotalLatency();
  return latency;
}

void KEffectPipeline::ResetState() {
  for (const KModuleChain::Stage& stage : Chain().stages) stage.module->Reset();
}

void KEffectPipeline::Forward(const KModuleChain& chain) noexcept {
  for (const KModuleChain::Stage& stage : chain.stages) {
    KAudioPlugin& module = *stage.module;
    if (module.ChannelsPerBus() != ChannelsPerBus()) module.SetChannelsPerBus(ChannelsPerBus());
    module.SetBypass(GetParameter(BypassIndex(stage.slot)).Normalized() >= 0.5);
    PassValues(stage);
  }
}

void KEffectPipeline::PassValues(const KModuleChain::Stage& stage) const noexcept {
  KAudioPlugin& module = *stage.module;
  const int32_t carried = std::min(module.ParameterCount(), kModuleParameters);
  for (int32_t p = 0; p < carried; ++p) module.GetParameter(p).SetNormalized(GetParameter(ParameterIndex(stage.slot, p)).Normalized());
}

void KEffectPipeline::Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) {
  bool changed;
  const KModuleChain& chain = *chains.Acquire(changed);
  // Values are forwarded whenever something changed: a new chain, or a slot parameter (which is
  // what set the update pending that brought ProcessUpdate before this call).
  if (changed || forward_) Forward(chain);
  forward_ = false;
  const int32_t channels = ChannelsPerBus();
  for (int32_t c = 0; c < channels; ++c)
    if (inputs[c] != outputs[c]) std::copy_n(inputs[c], sampleCount, outputs[c]);
  // Every module works in place on the outputs; a side-chain input hears silence.
  const float* moduleInputs[kMaxChannels] = {};
  std::copy_n(outputs, channels, moduleInputs);
  for (const KModuleChain::Stage& stage : chain.stages) stage.module->ProcessHostBlock(moduleInputs, outputs, sampleCount);
  const int32_t latency = LatencyOf(chain);
  if (latency != Latency()) ReportLatency(latency);
}
