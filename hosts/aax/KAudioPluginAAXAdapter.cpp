#include "hosts/aax/KAudioPluginAAXAdapter.h"

#include <string>
#include <string_view>
#include <utility>

#include "core/KParameter.h"
#include "hosts/aax/KAAXGUI.h"
#include "hosts/aax/KAAXPlaybackInfo.h"
#include "hosts/common/KHostEcho.h"
#include "hosts/common/KHostGuard.h"

using namespace KAAX;

namespace {
constexpr double kDefaultSampleRate = 44100.0;

// The master bypass's name for a host's label of `length` characters.
const char* MasterBypassName(int32_t length) noexcept {
  if (length >= 13) return "Master Bypass";
  if (length >= 8) return "Mast Byp";
  if (length >= 6) return "MstByp";
  return "MByp";
}

bool IsMasterBypass(ParamId id) noexcept { return id && std::string_view(id) == kMasterBypassId; }
}  // namespace

KAudioPluginAAXAdapter::KAudioPluginAAXAdapter(std::unique_ptr<KAudioPlugin> plugin)
    : KAudioPluginInterface(*plugin, "AAX"), plugin_(std::move(plugin)), hostApplication_(KString::Static("ProTools")) {
  plugin_->SetSampleRate(kDefaultSampleRate);
  plugin_->SetInterface(this);
}

KAudioPluginAAXAdapter::~KAudioPluginAAXAdapter() {
  if (gui_) gui_->DetachEffect();
  plugin_->SetInterface(nullptr);
}

int32_t KAudioPluginAAXAdapter::PluginIndex(ParamId id) const noexcept {
  if (!id || *id == 0) return -1;
  int64_t index = 0;
  for (const char* at = id; *at; ++at) {
    if (*at < '0' || *at > '9' || index > plugin_->ParameterCount()) return -1;
    index = index * 10 + (*at - '0');
  }
  return index < plugin_->ParameterCount() ? static_cast<int32_t>(index) : -1;
}

// ---- effect parameters

Result KAudioPluginAAXAdapter::EffectInit() {
  return KHostGuarded("KAudioPluginAAXAdapter::EffectInit", kErrorNotInitialized, [&] {
    double rate = 0.0;
    if (Controller() && Controller()->GetSampleRate(&rate) == kSuccess && rate > 0.0) plugin_->SetSampleRate(rate);
    if (Parameters().Count() > 0) return kSuccess;  // a second init keeps the parameters the host knows
    Parameters().Add(std::make_unique<KParameter>(kMasterBypassId, KString("Master Bypass"), KParameter::Type::kTwoState, 0.0, true,
                                                  KParameter::ToText()));
    for (int32_t i = 0; i < plugin_->ParameterCount(); ++i) {
      const KAudioPluginBase::Parameter& parameter = plugin_->GetParameter(i);
      Parameters().Add(std::make_unique<KParameter>(std::to_string(i), parameter.Name(), KParameter::Type::kContinuous,
                                                    parameter.DefaultNormalized(), true,
                                                    [&parameter](double normalized) { return parameter.TextForNormalized(normalized); }));
    }
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::GetChunkSize(ChunkId id, uint32_t* size) const {
  return KHostGuarded("KAudioPluginAAXAdapter::GetChunkSize", kErrorNullObject, [&] {
    if (id != kStateChunk) return KEffectParameters::GetChunkSize(id, size);
    if (!size) return kErrorNullObject;
    *size = static_cast<uint32_t>(state_.Store(*plugin_).size());
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::GetChunk(ChunkId id, PluginChunk* chunk) const {
  return KHostGuarded("KAudioPluginAAXAdapter::GetChunk", kErrorNullObject, [&] {
    if (id != kStateChunk) return KEffectParameters::GetChunk(id, chunk);
    return FillChunk(std::string(state_.Store(*plugin_)), chunk);
  });
}

Result KAudioPluginAAXAdapter::SetChunk(ChunkId id, const PluginChunk* chunk) {
  return KHostGuarded("KAudioPluginAAXAdapter::SetChunk", kErrorNullObject, [&] {
    if (id != kStateChunk) return KEffectParameters::SetChunk(id, chunk);
    if (!chunk || chunk->fSize < 0) return kErrorNullObject;
    KHostState::Load(*plugin_, std::string_view(chunk->fData, static_cast<size_t>(chunk->fSize)));
    NotifyPresetChanged();
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::UpdateParameterNormalizedValue(ParamId id, double normalized) {
  return KHostGuarded("KAudioPluginAAXAdapter::UpdateParameterNormalizedValue", kErrorInvalidParameterId, [&] {
    const Result result = KEffectParameters::UpdateParameterNormalizedValue(id, normalized);
    if (result != kSuccess) return result;
    if (IsMasterBypass(id)) plugin_->SetBypass(Parameters().Find(id)->Normalized() >= 0.5);
    else if (const int32_t index = PluginIndex(id); index >= 0) KTakeHostValue(*plugin_, index, normalized);
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::GetParameterStringFromValue(ParamId id, double normalized, char* text, int32_t capacity) const {
  return KHostGuarded("KAudioPluginAAXAdapter::GetParameterStringFromValue", kErrorInvalidStringConversion,
                      [&] { return KEffectParameters::GetParameterStringFromValue(id, normalized, text, capacity); });
}

Result KAudioPluginAAXAdapter::GetParameterNormalizedValue(ParamId id, double* normalized) const {
  return KHostGuarded("KAudioPluginAAXAdapter::GetParameterNormalizedValue", kErrorInvalidParameterId, [&] {
    const int32_t index = PluginIndex(id);
    if (index < 0 || !normalized) return KEffectParameters::GetParameterNormalizedValue(id, normalized);
    std::unique_lock lock(plugin_->ParameterLock(), std::try_to_lock);
    // Busy: the value the host last saw stands in.
    if (!lock.owns_lock()) return KEffectParameters::GetParameterNormalizedValue(id, normalized);
    *normalized = plugin_->GetParameter(index).Normalized();
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::SetParameterNormalizedValue(ParamId id, double normalized) {
  return KHostGuarded("KAudioPluginAAXAdapter::SetParameterNormalizedValue", kErrorInvalidParameterId,
                      [&] { return KEffectParameters::SetParameterNormalizedValue(id, normalized); });
}

Result KAudioPluginAAXAdapter::SetParameterNormalizedRelative(ParamId id, double delta) {
  return KHostGuarded("KAudioPluginAAXAdapter::SetParameterNormalizedRelative", kErrorInvalidParameterId,
                      [&] { return KEffectParameters::SetParameterNormalizedRelative(id, delta); });
}

Result KAudioPluginAAXAdapter::GetParameterNameOfLength(ParamId id, char* name, int32_t length) const {
  return KHostGuarded("KAudioPluginAAXAdapter::GetParameterNameOfLength", kErrorInvalidParameterId, [&] {
    if (!name || length < 0) return kErrorNullObject;
    if (IsMasterBypass(id)) {
      CopyText(KString::Static(MasterBypassName(length)), name, length + 1);
      return kSuccess;
    }
    const int32_t index = PluginIndex(id);
    if (index < 0) return kErrorInvalidParameterId;
    std::unique_lock lock(plugin_->ParameterLock(), std::try_to_lock);
    if (!lock.owns_lock()) return KEffectParameters::GetParameterNameOfLength(id, name, length);
    CopyText(plugin_->GetParameter(index).Name(), name, length + 1);
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::GetParameterName(ParamId id, char* name, int32_t capacity) const {
  return KHostGuarded("KAudioPluginAAXAdapter::GetParameterName", kErrorInvalidParameterId, [&] {
    const int32_t index = PluginIndex(id);
    if (index < 0) return KEffectParameters::GetParameterName(id, name, capacity);
    std::unique_lock lock(plugin_->ParameterLock(), std::try_to_lock);
    if (!lock.owns_lock()) return KEffectParameters::GetParameterName(id, name, capacity);
    CopyText(plugin_->GetParameter(index).Name(), name, capacity);
    return kSuccess;
  });
}

Result KAudioPluginAAXAdapter::TimerWakeup() {
  return KHostGuarded("KAudioPluginAAXAdapter::TimerWakeup", kSuccess, [&] {
    Idle();
    return kSuccess;
  });
}

// ---- processing

void KAudioPluginAAXAdapter::Process(const KAAXProcessContext& context) noexcept {
  KHostGuarded("KAudioPluginAAXAdapter::Process", 0, [&] {
    const int32_t samples = context.bufferSize ? *context.bufferSize : 0;
    if (!context.outputs || samples <= 0) return 0;
    KAudioPlugin& plugin = *plugin_;
    bool offline = false;
    if (context.transport && context.transport->IsOffline(&offline) != kSuccess) offline = false;
    SetOffline(offline);
    GetPlaybackInfo(context.transport, offline, plugin.Transport());
    if (const MidiStream* input = context.midiInput) {
      for (uint32_t i = 0; i < input->mBufferSize; ++i) {
        const MidiPacket& packet = input->mBuffer[i];
        if (packet.mLength == 0 || packet.mLength > 4) continue;
        KMIDIBytes bytes{};
        for (uint32_t b = 0; b < packet.mLength; ++b) bytes[b] = packet.mData[b];
        plugin.ScheduleMIDIEvent(static_cast<int32_t>(packet.mTimestamp), bytes);
      }
    }
    midiOut_.BeginBlock();
    plugin.ProcessHostBlock(context.inputs, context.outputs, samples);
    midiOut_.EndBlock();
    MidiStream* output = context.midiOutput;
    if (output) output->mBufferSize = 0;
    midiOut_.Drain([output](const KHostMIDIList::Message& message) {
      if (!output || output->mBufferSize >= output->mCapacity) return;
      MidiPacket& packet = output->mBuffer[output->mBufferSize++];
      packet = MidiPacket{static_cast<uint32_t>(message.sampleOffset), 3, {}, false};
      for (int b = 0; b < 4; ++b) packet.mData[b] = message.bytes[static_cast<size_t>(b)];
    });
    return 0;
  });
}

// ---- KAudioPluginInterface: parameter `index` of the plug-in is the host's parameter index + 1

void KAudioPluginAAXAdapter::BeginGesture(int32_t index) {
  if (Automation() && index >= 0 && index + 1 < Parameters().Count()) Automation()->PostTouchRequest(Parameters().At(index + 1).Id().c_str());
}

void KAudioPluginAAXAdapter::SendAutomationValue(int32_t index, double normalized) {
  if (index < 0 || index + 1 >= Parameters().Count()) return;
  KParameter& parameter = Parameters().At(index + 1);
  parameter.SetNormalized(normalized);
  if (Automation()) Automation()->PostSetValueRequest(parameter.Id().c_str(), normalized);
}

void KAudioPluginAAXAdapter::EndGesture(int32_t index) {
  if (Automation() && index >= 0 && index + 1 < Parameters().Count()) Automation()->PostReleaseRequest(Parameters().At(index + 1).Id().c_str());
}

void KAudioPluginAAXAdapter::SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) { midiOut_.Append(sampleOffset, bytes); }

void KAudioPluginAAXAdapter::ReportLatency(int32_t samples) {
  if (Controller()) Controller()->SetSignalLatency(samples);
}

// The host asks names again whenever it shows them; there is nothing to tell it.
void KAudioPluginAAXAdapter::UpdateParameterNames() {}

// The values the host sees follow the plug-in's after a state or preset load.
void KAudioPluginAAXAdapter::NotifyPresetChanged() {
  for (int32_t i = 0; i + 1 < Parameters().Count() && i < plugin_->ParameterCount(); ++i)
    Parameters().At(i + 1).SetNormalized(plugin_->GetParameter(i).Normalized());
}

bool KAudioPluginAAXAdapter::ResizeEditor(int32_t width, int32_t height) { return gui_ && gui_->Resize(width, height); }

// One whole gesture on the master bypass.
void KAudioPluginAAXAdapter::SendBypassValue(bool bypass) {
  KParameter* parameter = Parameters().Find(kMasterBypassId);
  if (!parameter) return;
  parameter->SetNormalized(bypass ? 1.0 : 0.0);
  if (!Automation()) return;
  Automation()->PostTouchRequest(kMasterBypassId);
  Automation()->PostSetValueRequest(kMasterBypassId, bypass ? 1.0 : 0.0);
  Automation()->PostReleaseRequest(kMasterBypassId);
}
