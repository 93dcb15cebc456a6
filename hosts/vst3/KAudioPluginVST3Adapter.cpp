#include "hosts/vst3/KAudioPluginVST3Adapter.h"

#include <cstring>
#include <string>
#include <utility>

#include "hosts/common/KHostGuard.h"
#include "hosts/vst3/KVST3ChannelContext.h"
#include "hosts/vst3/KVST3ClassId.h"
#include "hosts/vst3/KVST3Editor.h"
#include "hosts/vst3/KVST3MIDIOutput.h"
#include "hosts/vst3/KVST3ProcessInput.h"
#include "hosts/vst3/KVST3Util.h"
#include "kernel/KCatalogue.h"

using namespace KVST3;

namespace {
constexpr int32_t kRootUnit = UnitInfo::kRootUnitId;
// The preset attribute that holds a program's name.
constexpr const char* kPresetNameAttribute = "Name";
}  // namespace

KAudioPluginVST3Adapter::KAudioPluginVST3Adapter(std::unique_ptr<KAudioPlugin> plugin)
    : KAudioPluginInterface(*plugin, "VST3"), plugin_(std::move(plugin)), table_(*plugin_), buses_(*plugin_), host_(*this) {
  plugin_->SetInterface(this);
}

KAudioPluginVST3Adapter::~KAudioPluginVST3Adapter() {
  host_.Detach();
  plugin_->SetInterface(nullptr);
}

// ---- FUnknown, IPluginBase

TResult KAudioPluginVST3Adapter::QueryInterface(const char* iid, void** object) {
  if (!object) return kInvalidArgument;
  void* found = nullptr;
  if (FUnknown::kIID.Is(iid) || IPluginBase::kIID.Is(iid) || IComponent::kIID.Is(iid)) found = static_cast<IComponent*>(this);
  else if (IAudioProcessor::kIID.Is(iid)) found = static_cast<IAudioProcessor*>(this);
  else if (IProcessContextRequirements::kIID.Is(iid)) found = static_cast<IProcessContextRequirements*>(this);
  else if (IEditController::kIID.Is(iid)) found = static_cast<IEditController*>(this);
  else if (IEditController2::kIID.Is(iid)) found = static_cast<IEditController2*>(this);
  else if (IMidiMapping::kIID.Is(iid)) found = static_cast<IMidiMapping*>(this);
  else if (IUnitInfo::kIID.Is(iid)) found = static_cast<IUnitInfo*>(this);
  else if (ChannelContext::IInfoListener::kIID.Is(iid)) found = static_cast<ChannelContext::IInfoListener*>(this);
  *object = found;
  if (!found) return kNoInterface;
  AddRef();
  return kResultOk;
}

uint32_t KAudioPluginVST3Adapter::AddRef() { return references_.fetch_add(1, std::memory_order_relaxed) + 1; }

uint32_t KAudioPluginVST3Adapter::Release() {
  const uint32_t left = references_.fetch_sub(1, std::memory_order_acq_rel) - 1;
  if (left == 0) delete this;
  return left;
}

TResult KAudioPluginVST3Adapter::Initialize(FUnknown* context) {
  return KHostGuarded("KAudioPluginVST3Adapter::Initialize", kResultFalse, [&] {
    // A host that initializes the processor and the controller gets one object set up once.
    if (initializations_ == 0) {
      host_.Attach(context);
      buses_.Build();
      table_.Build();
      table_.SetPrograms(PresetNames());
    }
    ++initializations_;
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::Terminate() {
  return KHostGuarded("KAudioPluginVST3Adapter::Terminate", kResultFalse, [&] {
    if (initializations_ == 0) return kResultFalse;
    if (--initializations_ == 0) host_.Detach();
    return kResultOk;
  });
}

// ---- IComponent

TResult KAudioPluginVST3Adapter::GetControllerClassId(char* classId) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetControllerClassId", kResultFalse, [&] {
    if (!classId) return kInvalidArgument;
    // The controller is this same class: a host that insists on a controller object of its own
    // makes a second instance, which takes the component's state through SetComponentState.
    const std::string key = plugin_->Identifier().ToUtf8();
    const KPluginDescription* description = KFindDescription(KProductCatalogue(), key);
    KClassIdOf(description && description->identity ? description->identity : key).CopyTo(classId);
    return kResultTrue;
  });
}

TResult KAudioPluginVST3Adapter::SetIoMode(int32_t) { return kNotImplemented; }

int32_t KAudioPluginVST3Adapter::GetBusCount(int32_t type, int32_t direction) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetBusCount", 0, [&] { return buses_.Count(type, direction); });
}

TResult KAudioPluginVST3Adapter::GetBusInfo(int32_t type, int32_t direction, int32_t index, BusInfo& info) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetBusInfo", kResultFalse,
                      [&] { return buses_.Describe(type, direction, index, info) ? kResultTrue : kInvalidArgument; });
}

TResult KAudioPluginVST3Adapter::GetRoutingInfo(RoutingInfo&, RoutingInfo&) { return kNotImplemented; }

TResult KAudioPluginVST3Adapter::ActivateBus(int32_t type, int32_t direction, int32_t index, TBool state) {
  return KHostGuarded("KAudioPluginVST3Adapter::ActivateBus", kResultFalse,
                      [&] { return buses_.Activate(type, direction, index, state != 0) ? kResultTrue : kInvalidArgument; });
}

TResult KAudioPluginVST3Adapter::SetActive(TBool state) {
  return KHostGuarded("KAudioPluginVST3Adapter::SetActive", kResultFalse, [&] {
    if (state) {
      plugin_->Reset();
      // A latency that changed while inactive is told before the host asks for it.
      Idle();
    }
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::LoadComponentState(IBStream* state) {
  return KHostGuarded("KAudioPluginVST3Adapter::SetState", kResultFalse, [&] {
    if (!state) return kInvalidArgument;
    KHostState::Load(*plugin_, KReadAll(*state));
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::StoreComponentState(IBStream* state) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetState", kResultFalse, [&] {
    if (!state) return kInvalidArgument;
    return KWriteAll(*state, state_.Store(*plugin_)) ? kResultOk : kResultFalse;
  });
}

// ---- IAudioProcessor

TResult KAudioPluginVST3Adapter::SetBusArrangements(SpeakerArrangement* inputs, int32_t inputCount, SpeakerArrangement* outputs,
                                                    int32_t outputCount) {
  return KHostGuarded("KAudioPluginVST3Adapter::SetBusArrangements", kResultFalse,
                      [&] { return buses_.Arrange(inputs, inputCount, outputs, outputCount) ? kResultTrue : kResultFalse; });
}

TResult KAudioPluginVST3Adapter::GetBusArrangement(int32_t direction, int32_t index, SpeakerArrangement& arrangement) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetBusArrangement", kResultFalse,
                      [&] { return buses_.Arrangement(direction, index, arrangement) ? kResultTrue : kInvalidArgument; });
}

TResult KAudioPluginVST3Adapter::CanProcessSampleSize(int32_t symbolicSampleSize) {
  return symbolicSampleSize == kSample32 ? kResultTrue : kResultFalse;
}

uint32_t KAudioPluginVST3Adapter::GetLatencySamples() {
  return KHostGuarded("KAudioPluginVST3Adapter::GetLatencySamples", 0u,
                      [&] { return static_cast<uint32_t>(plugin_->TotalLatency() > 0 ? plugin_->TotalLatency() : 0); });
}

TResult KAudioPluginVST3Adapter::SetupProcessing(ProcessSetup& setup) {
  return KHostGuarded("KAudioPluginVST3Adapter::SetupProcessing", kResultFalse, [&] {
    if (setup.symbolicSampleSize != kSample32 || setup.maxSamplesPerBlock < 0) return kResultFalse;
    if (!plugin_->SetSampleRate(setup.sampleRate)) return kResultFalse;
    // The plug-in takes blocks of any length; the block size only sizes what stands in for
    // buses the host leaves out.
    channels_.Prepare(setup.maxSamplesPerBlock);
    SetOffline(setup.processMode == kOffline);
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::SetProcessing(TBool) { return kResultOk; }

TResult KAudioPluginVST3Adapter::Process(ProcessData& data) {
  return KHostGuarded("KAudioPluginVST3Adapter::Process", kResultFalse, [&] {
    if (data.symbolicSampleSize != kSample32) return kResultFalse;
    KAudioPlugin& plugin = *plugin_;
    const bool offline = data.processMode == kOffline;
    SetOffline(offline);
    KReadTransport(data.processContext, offline, plugin.Transport());
    // Parameter changes first: a controller and a note at the same offset arrive in that order.
    KApplyParameterChanges(data.inputParameterChanges, data.numSamples, plugin, table_);
    KDeliverEvents(data.inputEvents, plugin);

    const float* inputs[KAudioPlugin::kMaxChannels] = {};
    float* outputs[KAudioPlugin::kMaxChannels] = {};
    const bool mapped = buses_.MapBuffers(data, channels_, inputs, outputs);
    midiOut_.BeginBlock();
    plugin.ProcessHostBlock(inputs, mapped ? outputs : nullptr, data.numSamples);
    midiOut_.EndBlock();
    if (mapped) KBusLayout::MarkSilence(data);
    KFlushMIDI(midiOut_, data.outputEvents);
    return kResultOk;
  });
}

uint32_t KAudioPluginVST3Adapter::GetTailSamples() { return plugin_->TailSamples(); }

uint32_t KAudioPluginVST3Adapter::GetProcessContextRequirements() {
  return kNeedProjectTimeMusic | kNeedBarPositionMusic | kNeedCycleMusic | kNeedTempo | kNeedTimeSignature | kNeedTransportState;
}

// ---- IEditController

TResult KAudioPluginVST3Adapter::SetComponentState(IBStream* state) { return LoadComponentState(state); }

// The component state carries everything; the controller has nothing of its own to keep.
TResult KAudioPluginVST3Adapter::LoadControllerState(IBStream*) { return kResultOk; }
TResult KAudioPluginVST3Adapter::StoreControllerState(IBStream*) { return kResultOk; }

int32_t KAudioPluginVST3Adapter::GetParameterCount() {
  return KHostGuarded("KAudioPluginVST3Adapter::GetParameterCount", 0, [&] { return table_.Count(); });
}

TResult KAudioPluginVST3Adapter::GetParameterInfo(int32_t index, ParameterInfo& info) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetParameterInfo", kResultFalse,
                      [&] { return table_.Describe(index, info) ? kResultOk : kInvalidArgument; });
}

TResult KAudioPluginVST3Adapter::GetParamStringByValue(ParamID id, double normalized, String128 text) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetParamStringByValue", kResultFalse, [&] {
    KString value;
    if (!text || !table_.Text(id, normalized, value)) return kInvalidArgument;
    KCopyText(value, text, 128);
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::GetParamValueByString(ParamID id, TChar* text, double& normalized) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetParamValueByString", kResultFalse, [&] {
    return text && table_.Value(id, KTextOf(text, 128), normalized) ? kResultOk : kResultFalse;
  });
}

double KAudioPluginVST3Adapter::NormalizedParamToPlain(ParamID id, double normalized) {
  return KHostGuarded("KAudioPluginVST3Adapter::NormalizedParamToPlain", normalized, [&] { return table_.ToPlain(id, normalized); });
}

double KAudioPluginVST3Adapter::PlainParamToNormalized(ParamID id, double plain) {
  return KHostGuarded("KAudioPluginVST3Adapter::PlainParamToNormalized", 0.0, [&] { return table_.ToNormalized(id, plain); });
}

double KAudioPluginVST3Adapter::GetParamNormalized(ParamID id) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetParamNormalized", 0.0, [&] { return table_.Normalized(id); });
}

TResult KAudioPluginVST3Adapter::SetParamNormalized(ParamID id, double normalized) {
  return KHostGuarded("KAudioPluginVST3Adapter::SetParamNormalized", kResultFalse,
                      [&] { return table_.SetNormalized(id, normalized) ? kResultOk : kInvalidArgument; });
}

TResult KAudioPluginVST3Adapter::SetComponentHandler(IComponentHandler* handler) {
  host_.SetComponentHandler(handler);
  return kResultOk;
}

IPlugView* KAudioPluginVST3Adapter::CreateView(FIDString name) {
  return KHostGuarded("KAudioPluginVST3Adapter::createView", static_cast<IPlugView*>(nullptr), [&]() -> IPlugView* {
    if (!name || std::strcmp(name, "editor") != 0) return nullptr;
    return new KEditor(*this);
  });
}

// ---- IEditController2

TResult KAudioPluginVST3Adapter::SetKnobMode(int32_t mode) {
  if (mode < kCircularMode || mode > kLinearMode) return kResultFalse;
  knobMode_ = mode;
  return kResultTrue;
}

// No editor yet, so neither help nor an about box to open.
TResult KAudioPluginVST3Adapter::OpenHelp(TBool) { return kResultFalse; }
TResult KAudioPluginVST3Adapter::OpenAboutBox(TBool) { return kResultFalse; }

// ---- IMidiMapping

TResult KAudioPluginVST3Adapter::GetMidiControllerAssignment(int32_t busIndex, int16_t channel, int16_t controller, ParamID& id) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetMidiControllerAssignment", kResultFalse, [&] {
    if (busIndex != 0 || buses_.Count(kEvent, kInput) == 0) return kResultFalse;
    return table_.ControllerId(channel, controller, id) ? kResultTrue : kResultFalse;
  });
}

// ---- IUnitInfo

KStringList KAudioPluginVST3Adapter::PresetNames() const {
  try {
    return plugin_->ListPresets();
  } catch (const KException&) {
    return plugin_->FactoryPresetNames();  // the user's presets cannot be read: the factory's stay
  }
}

int32_t KAudioPluginVST3Adapter::GetUnitCount() { return 1; }

TResult KAudioPluginVST3Adapter::GetUnitInfo(int32_t unitIndex, UnitInfo& info) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetUnitInfo", kResultFalse, [&] {
    if (unitIndex != 0) return kInvalidArgument;
    info = UnitInfo{kRootUnit, UnitInfo::kNoParentUnitId, {}, KParameterTable::kPresetList};
    KCopyText("Root", info.name, 128);
    return kResultOk;
  });
}

int32_t KAudioPluginVST3Adapter::GetProgramListCount() { return 1; }

TResult KAudioPluginVST3Adapter::GetProgramListInfo(int32_t listIndex, ProgramListInfo& info) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetProgramListInfo", kResultFalse, [&] {
    if (listIndex != 0) return kInvalidArgument;
    info = ProgramListInfo{KParameterTable::kPresetList, {}, table_.Programs().Count()};
    KCopyText("Presets", info.name, 128);
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::GetProgramName(int32_t listId, int32_t programIndex, String128 name) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetProgramName", kResultFalse, [&] {
    const KStringList& names = table_.Programs();
    if (!name || listId != KParameterTable::kPresetList || programIndex < 0 || programIndex >= names.Count()) return kInvalidArgument;
    KCopyText(names[programIndex], name, 128);
    return kResultOk;
  });
}

// The one attribute a preset of the list has to tell: its name, as the list gives it.
TResult KAudioPluginVST3Adapter::GetProgramInfo(int32_t listId, int32_t programIndex, const char* attribute, String128 value) {
  return KHostGuarded("KAudioPluginVST3Adapter::GetProgramInfo", kResultFalse, [&] {
    if (!attribute || std::strcmp(attribute, kPresetNameAttribute) != 0) return kResultFalse;
    return GetProgramName(listId, programIndex, value);
  });
}
TResult KAudioPluginVST3Adapter::HasProgramPitchNames(int32_t, int32_t) { return kResultFalse; }
TResult KAudioPluginVST3Adapter::GetProgramPitchName(int32_t, int32_t, int16_t, String128) { return kResultFalse; }
int32_t KAudioPluginVST3Adapter::GetSelectedUnit() { return kRootUnit; }
TResult KAudioPluginVST3Adapter::SelectUnit(int32_t unitId) { return unitId == kRootUnit ? kResultTrue : kInvalidArgument; }

TResult KAudioPluginVST3Adapter::GetUnitByBus(int32_t type, int32_t direction, int32_t busIndex, int32_t, int32_t& unitId) {
  if (busIndex < 0 || busIndex >= GetBusCount(type, direction)) return kInvalidArgument;
  unitId = kRootUnit;
  return kResultTrue;
}

TResult KAudioPluginVST3Adapter::SetUnitProgramData(int32_t, int32_t, IBStream*) { return kNotImplemented; }

// ---- ChannelContext::IInfoListener

TResult KAudioPluginVST3Adapter::SetChannelContextInfos(IAttributeList* list) {
  return KHostGuarded("KAudioPluginVST3Adapter::SetChannelContextInfos", kResultFalse, [&] {
    if (!list) return kInvalidArgument;
    KChannelContext context = plugin_->ChannelContext();
    KReadChannelContext(*list, context);
    plugin_->SetChannelContext(context);
    return kResultTrue;
  });
}

// ---- KAudioPluginInterface

void KAudioPluginVST3Adapter::BeginGesture(int32_t index) { host_.BeginEdit(static_cast<ParamID>(index)); }

void KAudioPluginVST3Adapter::SendAutomationValue(int32_t index, double normalized) {
  host_.PerformEdit(static_cast<ParamID>(index), normalized);
}

void KAudioPluginVST3Adapter::EndGesture(int32_t index) { host_.EndEdit(static_cast<ParamID>(index)); }

void KAudioPluginVST3Adapter::SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) { midiOut_.Append(sampleOffset, bytes); }

void KAudioPluginVST3Adapter::ReportLatency(int32_t) { host_.Restart(kLatencyChanged); }

void KAudioPluginVST3Adapter::UpdateParameterNames() { host_.Restart(kParamTitlesChanged); }

// A preset loaded, or the list changed: the program follows, and a changed list is announced to
// the host's unit handler. A new count changes the program's step count, which hosts read with
// the parameters' titles.
void KAudioPluginVST3Adapter::NotifyPresetChanged() {
  using Change = KParameterTable::ProgramChange;
  const Change change = table_.SetPrograms(PresetNames());
  host_.Restart(kParamValuesChanged | (change == Change::kCount ? kParamTitlesChanged : 0));
  if (change != Change::kNone) host_.ProgramListChanged(KParameterTable::kPresetList);
}

void KAudioPluginVST3Adapter::Idle() {
  KAudioPluginInterface::Idle();
  table_.SelectPendingProgram();
}

// No editor yet, so nothing to resize.
bool KAudioPluginVST3Adapter::ResizeEditor(int32_t, int32_t) { return false; }

// One whole gesture on the bypass parameter; the interface counts it as a send.
void KAudioPluginVST3Adapter::SendBypassValue(bool bypass) {
  host_.BeginEdit(KParameterTable::kBypass);
  host_.PerformEdit(KParameterTable::kBypass, bypass ? 1.0 : 0.0);
  host_.EndEdit(KParameterTable::kBypass);
}
