#include "hosts/vst2/KAudioPluginVSTAdapter.h"

#include <algorithm>
#include <cstring>
#include <string_view>
#include <utility>

#include "core/KParameter.h"
#include "hosts/common/KHostEcho.h"
#include "hosts/common/KHostGuard.h"
#include "hosts/vst2/KVST2Editor.h"
#include "hosts/vst2/KVST2Text.h"
#include "hosts/vst2/KVST2Transport.h"
#include "kernel/KCatalogue.h"
#include "kernel/KFormat.h"

using namespace KVST2;

namespace {
// canDo texts answered by what the plug-in does with MIDI, and those always answered yes.
constexpr std::string_view kReceives[] = {"receiveVstEvents", "receiveVstEvent", "receiveVstMidiEvents", "receiveVstMidiEvent"};
constexpr std::string_view kSends[] = {"sendVstEvents", "sendVstEvent", "sendVstMidiEvents", "sendVstMidiEvent"};
constexpr std::string_view kAlways[] = {"midiProgramNames", "plugAsChannelInsert", "canMono", "plugAsSend", "receiveVstTimeInfo"};

template <size_t N>
bool Among(const std::string_view (&texts)[N], std::string_view text) noexcept {
  return std::find(std::begin(texts), std::end(texts), text) != std::end(texts);
}
}  // namespace

KAudioPluginVSTAdapter::KAudioPluginVSTAdapter(HostCallback host, std::unique_ptr<KAudioPlugin> plugin, int32_t uniqueId)
    : KEffect(host, 1, 0), KAudioPluginInterface(*plugin, "VST"), plugin_(std::move(plugin)) {
  plugin_->SetInterface(this);
  setNumParams(plugin_->ParameterCount());
  hostVersion_ = getMasterVersion();
  char product[256] = {};
  getHostProductString(product);
  product[sizeof product - 1] = 0;
  hostProduct_ = KString::FromUtf8(product);
  channelsPerBus_ = plugin_->ChannelsPerBus();
  hostInputs_ = pluginInputs_ = plugin_->InputChannelCount();
  hostOutputs_ = pluginOutputs_ = plugin_->OutputChannelCount();
  // A VST 1 host offers stereo at least: a mono or input-less plug-in shows it two inputs.
  setNumInputs(hostVersion_ <= kLastVST1Version && pluginInputs_ < 3 ? 2 : pluginInputs_);
  setNumOutputs(pluginOutputs_);
  setUniqueID(uniqueId);
  canProcessReplacing(true);
  programsAreChunks(true);
  isSynth(plugin_->GetShape().acceptsMIDI && pluginInputs_ == 0);
  editor_ = std::make_unique<KEditor>(*this);
  setEditor(editor_.get());
  suspend();
}

// The editor goes first: its window and controls reach the plug-in.
KAudioPluginVSTAdapter::~KAudioPluginVSTAdapter() {
  setEditor(nullptr);
  editor_.reset();
  plugin_->SetInterface(nullptr);
}

// ---- what the host calls

void KAudioPluginVSTAdapter::resume() {
  KHostGuarded("KAudioPluginVSTAdapter::resume", 0, [&] {
    channels_.Prepare(BlockSize());
    plugin_->Reset();
    // A latency that changed while suspended is told before processing starts.
    Idle();
    return 0;
  });
}

void KAudioPluginVSTAdapter::setSampleRate(float rate) {
  KHostGuarded("KAudioPluginVSTAdapter::setSampleRate", 0, [&] {
    if (plugin_->SetSampleRate(rate)) KEffect::setSampleRate(rate);
    return 0;
  });
}

void KAudioPluginVSTAdapter::setBlockSize(int32_t size) {
  KHostGuarded("KAudioPluginVSTAdapter::setBlockSize", 0, [&] {
    KEffect::setBlockSize(size);
    channels_.Prepare(size);
    return 0;
  });
}

void KAudioPluginVSTAdapter::processReplacing(float** inputs, float** outputs, int32_t sampleFrames) {
  KHostGuarded("KAudioPluginVSTAdapter::processReplacing", 0, [&] {
    if (!outputs || sampleFrames <= 0) return 0;
    KAudioPlugin& plugin = *plugin_;
    const bool offline = getCurrentProcessLevel() == kVstProcessLevelOffline;
    SetOffline(offline);
    KReadTransport(getTimeInfo(kTimeFilter), offline, plugin.Transport());
    midiIn_.Drain([&plugin](const KHostMIDIList::Message& message) { plugin.ScheduleMIDIEvent(message.sampleOffset, message.bytes); });

    const KAudioPlugin::Shape& shape = plugin.GetShape();
    const bool sameCounts = plugin.InputChannelCount() == hostInputs_ && plugin.OutputChannelCount() == hostOutputs_;
    midiOut_.BeginBlock();
    if (direct_ && (sameCounts || (shape.inputBuses == 1 && shape.outputBuses == 1))) {
      plugin.ProcessHostBlock(inputs, outputs, sampleFrames);
    } else {
      const float* in[KAudioPlugin::kMaxChannels] = {};
      float* out[KAudioPlugin::kMaxChannels] = {};
      channels_.MapInputs(inputs, hostInputs_, plugin.InputChannelCount(), sampleFrames, in);
      const bool mapped = channels_.MapOutputs(outputs, hostOutputs_, plugin.OutputChannelCount(), sampleFrames, out);
      plugin.ProcessHostBlock(in, mapped ? out : nullptr, sampleFrames);
    }
    midiOut_.EndBlock();
    if (VstEvents* events = eventOutput_.Take(midiOut_)) sendVstEventsToHost(events);
    return 0;
  });
}

void KAudioPluginVSTAdapter::setParameter(int32_t index, float value) { KTakeHostValue(*plugin_, index, value); }

// Out of range, the default answer of the format: 0.
float KAudioPluginVSTAdapter::getParameter(int32_t index) {
  return KHostGuarded("KAudioPluginVSTAdapter::getParameter", 0.0f, [&] {
    if (index < 0 || index >= plugin_->ParameterCount()) return 0.0f;
    return static_cast<float>(plugin_->GetParameter(index).Normalized());
  });
}

void KAudioPluginVSTAdapter::getProgramName(char* name) {
  *name = 0;
  KHostGuarded("KAudioPluginVSTAdapter::getProgramName", 0, [&] {
    KCopyText(plugin_->ActivePresetName(), name, kVstMaxProgNameLen);
    return 0;
  });
}

void KAudioPluginVSTAdapter::getParameterLabel(int32_t index, char* label) {
  *label = 0;
  KHostGuarded("KAudioPluginVSTAdapter::getParameterLabel", 0, [&] {
    if (index >= 0 && index < plugin_->ParameterCount()) KCopyText(plugin_->GetParameter(index).Unit(), label, kParameterTextRoom);
    return 0;
  });
}

void KAudioPluginVSTAdapter::getParameterDisplay(int32_t index, char* text) {
  *text = 0;
  KHostGuarded("KAudioPluginVSTAdapter::getParameterDisplay", 0, [&] {
    if (index >= 0 && index < plugin_->ParameterCount()) KCopyText(plugin_->GetParameter(index).Text(), text, kParameterTextRoom);
    return 0;
  });
}

void KAudioPluginVSTAdapter::getParameterName(int32_t index, char* text) {
  *text = 0;
  KHostGuarded("KAudioPluginVSTAdapter::getParameterName", 0, [&] {
    if (index >= 0 && index < plugin_->ParameterCount()) KCopyText(plugin_->GetParameter(index).Name(), text, kParameterTextRoom);
    return 0;
  });
}

// Bank and program requests give the same chunk; it stays valid until the next request.
int32_t KAudioPluginVSTAdapter::getChunk(void** data, bool) {
  return KHostGuarded("KAudioPluginVSTAdapter::getChunk", 0, [&] {
    if (!data) return 0;
    const std::string_view text = state_.Store(*plugin_);
    *data = const_cast<char*>(text.data());
    return static_cast<int32_t>(text.size());
  });
}

// A host cannot do anything with a refusal: the answer is 1 even for a chunk that did not load
// (which leaves the plug-in as it was).
int32_t KAudioPluginVSTAdapter::setChunk(void* data, int32_t byteSize, bool) {
  return KHostGuarded("KAudioPluginVSTAdapter::setChunk", 1, [&] {
    if (data && byteSize > 0) KHostState::Load(*plugin_, std::string_view(static_cast<const char*>(data), static_cast<size_t>(byteSize)));
    return 1;
  });
}

bool KAudioPluginVSTAdapter::PinProperties(int32_t index, bool input, VstPinProperties* properties) {
  const int32_t count = input ? Effect()->numInputs : Effect()->numOutputs;
  if (!properties || index < 0 || index >= count) return false;
  // Inputs are the main bus first, then the side-chain; numbers count from 1 within a bus.
  const bool sidechain = input && index >= channelsPerBus_ && plugin_->GetShape().inputBuses > 1;
  const int32_t channel = index % channelsPerBus_;
  const char* prefix = !input ? "Out " : sidechain ? "Sidechain " : "In ";
  *properties = VstPinProperties{};
  KCopyText(KFormatText("{0}{1}", KString::Static(prefix), channel + 1), properties->label, kVstMaxLabelLen);
  KCopyText(KFormatText("{0}{1}", KString::Static(!input ? "O" : sidechain ? "S" : "I"), channel + 1), properties->shortLabel,
            kVstMaxShortLabelLen);
  // A stereo pair is marked on its first channel.
  properties->flags = kVstPinIsActive | (channelsPerBus_ == 2 && channel == 0 ? kVstPinIsStereo : 0);
  properties->arrangementType = channelsPerBus_ == 2 ? kSpeakerArrStereo : kSpeakerArrMono;
  return true;
}

bool KAudioPluginVSTAdapter::getInputProperties(int32_t index, VstPinProperties* properties) {
  return KHostGuarded("KAudioPluginVSTAdapter::getInputProperties", false, [&] { return PinProperties(index, true, properties); });
}

bool KAudioPluginVSTAdapter::getOutputProperties(int32_t index, VstPinProperties* properties) {
  return KHostGuarded("KAudioPluginVSTAdapter::getOutputProperties", false, [&] { return PinProperties(index, false, properties); });
}

// Fewer channels than the plug-in has are taken and mapped at processing; more are refused.
bool KAudioPluginVSTAdapter::setSpeakerArrangement(VstSpeakerArrangement* input, VstSpeakerArrangement* output) {
  return KHostGuarded("KAudioPluginVSTAdapter::setSpeakerArrangement", false, [&] {
    const int32_t inputs = input ? std::max(input->numChannels, 0) : 0;
    const int32_t outputs = output ? std::max(output->numChannels, 0) : 0;
    if (inputs > pluginInputs_ || outputs > pluginOutputs_) return false;
    hostInputs_ = plugin_->GetShape().inputBuses == 0 ? 0 : inputs;
    hostOutputs_ = outputs;
    direct_ = hostInputs_ == pluginInputs_ && hostOutputs_ == pluginOutputs_;
    // The plug-in runs with as many channels per bus as the host's outputs give it, at least 1.
    plugin_->SetChannelsPerBus(std::clamp(outputs, 1, channelsPerBus_));
    return true;
  });
}

int32_t KAudioPluginVSTAdapter::processEvents(VstEvents* events) {
  return KHostGuarded("KAudioPluginVSTAdapter::processEvents", 1, [&] {
    if (events && events->numEvents >= 1) KQueueMIDIInput(*events, midiIn_);
    return 1;
  });
}

// The plug-in's description in the catalogue; KException for an instance the catalogue does not
// describe (a name the registry resolved by a prefix).
const KPluginDescription& KAudioPluginVSTAdapter::Description() const {
  const KPluginDescription* found = KFindDescription(KProductCatalogue(), plugin_->Identifier().ToUtf8());
  if (!found || !found->name || !found->vendor) throw KException("No description of the plug-in.", "KAudioPluginVSTAdapter::Description");
  return *found;
}

bool KAudioPluginVSTAdapter::getEffectName(char* name) {
  return KHostGuarded("KAudioPluginVSTAdapter::getEffectName", false,
                      [&] { return KCopyText(KString::FromUtf8(Description().name), name, kVstMaxEffectNameLen), true; });
}

bool KAudioPluginVSTAdapter::getVendorString(char* text) {
  return KHostGuarded("KAudioPluginVSTAdapter::getVendorString", false,
                      [&] { return KCopyText(KString::FromUtf8(Description().vendor), text, kVstMaxVendorStrLen), true; });
}

bool KAudioPluginVSTAdapter::getProductString(char* text) {
  return KHostGuarded("KAudioPluginVSTAdapter::getProductString", false,
                      [&] { return KCopyText(KString::FromUtf8(Description().name), text, kVstMaxProductStrLen), true; });
}

// A host bypass is refused on purpose: the plug-in keeps its own.
int32_t KAudioPluginVSTAdapter::canDo(char* text) {
  return KHostGuarded("KAudioPluginVSTAdapter::canDo", 0, [&] {
    const std::string_view asked(text);
    const KAudioPlugin::Shape& shape = plugin_->GetShape();
    if (Among(kReceives, asked)) return shape.acceptsMIDI ? 1 : -1;
    if (Among(kSends, asked)) return shape.producesMIDI ? 1 : -1;
    if (Among(kAlways, asked)) return 1;
    if (asked == "bypass") return -1;
    return 0;
  });
}

// Gestures that went quiet end, and a changed latency is told, on the host's idle calls.
int32_t KAudioPluginVSTAdapter::idle() {
  return KHostGuarded("KAudioPluginVSTAdapter::idle", 0, [&] {
    Idle();
    return 1;
  });
}

// ---- KAudioPluginInterface

void KAudioPluginVSTAdapter::BeginGesture(int32_t index) {
  KHostGuarded("KAudioPluginVSTAdapter::BeginGesture", false, [&] { return beginEdit(index); });
}

// Counted as a send, so that the host's echo of the value through setParameter changes nothing.
void KAudioPluginVSTAdapter::SendAutomationValue(int32_t index, double normalized) {
  KHostGuarded("KAudioPluginVSTAdapter::SendAutomationValue", 0, [&] {
    RaiseSendingCounter();
    setParameterAutomated(index, static_cast<float>(normalized));
    LowerSendingCounter();
    return 0;
  });
}

void KAudioPluginVSTAdapter::EndGesture(int32_t index) {
  KHostGuarded("KAudioPluginVSTAdapter::EndGesture", false, [&] { return endEdit(index); });
}

void KAudioPluginVSTAdapter::SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) { midiOut_.Append(sampleOffset, bytes); }

void KAudioPluginVSTAdapter::ReportLatency(int32_t samples) {
  KHostGuarded("KAudioPluginVSTAdapter::ReportLatency", false, [&] {
    setInitialDelay(samples);
    return ioChanged();
  });
}

void KAudioPluginVSTAdapter::UpdateParameterNames() {
  KHostGuarded("KAudioPluginVSTAdapter::UpdateParameterNames", false, [&] { return updateDisplay(); });
}

void KAudioPluginVSTAdapter::NotifyPresetChanged() {
  KHostGuarded("KAudioPluginVSTAdapter::NotifyPresetChanged", false, [&] { return updateDisplay(); });
}

bool KAudioPluginVSTAdapter::ResizeEditor(int32_t width, int32_t height) {
  return KHostGuarded("KAudioPluginVSTAdapter::ResizeEditor", false, [&] { return editor_->Resize(width, height); });
}
