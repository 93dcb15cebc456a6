#include "hosts/lv2/KAudioPluginLV2Adapter.h"

#include <lv2/atom/atom.h>
#include <lv2/atom/util.h>
#include <lv2/midi/midi.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <limits>
#include <utility>

#include "core/KParameter.h"
#include "hosts/common/KHostGuard.h"
#include "hosts/common/KHostRamp.h"
#include "hosts/common/KHostTime.h"

using KLV2::KPort;

KAudioPluginLV2Adapter::KAudioPluginLV2Adapter(std::unique_ptr<KAudioPlugin> plugin, const LV2_URID_Map* map)
    : KAudioPluginInterface(*plugin, "LV2"),
      plugin_(std::move(plugin)),
      layout_(*plugin_),
      mapped_(map != nullptr),
      ports_(new void*[static_cast<size_t>(layout_.Count())]()),
      seen_(new float[static_cast<size_t>(plugin_->ParameterCount())]),
      time_(map) {
  if (map) {
    urids_.midiEvent = map->map(map->handle, LV2_MIDI__MidiEvent);
    urids_.sequence = map->map(map->handle, LV2_ATOM__Sequence);
    urids_.string = map->map(map->handle, LV2_ATOM__String);
    urids_.stateKey = map->map(map->handle, kStateKey);
  }
  std::fill_n(seen_.get(), plugin_->ParameterCount(), std::numeric_limits<float>::quiet_NaN());
  plugin_->SetInterface(this);
}

KAudioPluginLV2Adapter::~KAudioPluginLV2Adapter() { plugin_->SetInterface(nullptr); }

void KAudioPluginLV2Adapter::ConnectPort(uint32_t port, void* data) noexcept {
  if (port < static_cast<uint32_t>(layout_.Count())) ports_[port] = data;
}

void KAudioPluginLV2Adapter::Activate() noexcept {
  KHostGuarded("KAudioPluginLV2Adapter::activate", 0, [&] {
    plugin_->Reset();
    return 0;
  });
}

void KAudioPluginLV2Adapter::Run(uint32_t samples) noexcept {
  KHostGuarded("KAudioPluginLV2Adapter::run", 0, [&] {
    KAudioPlugin& plugin = *plugin_;
    const auto n = static_cast<int32_t>(samples);
    // The atom input carries the time positions too: read before the transport is taken.
    ApplyControls();
    ReadMIDI();
    KAcceptTransport(time_.Current(), IsOffline(), plugin.Transport());
    const float* inputs[KAudioPlugin::kMaxChannels] = {};
    float* outputs[KAudioPlugin::kMaxChannels] = {};
    const std::vector<KPort>& ports = layout_.Ports();
    for (size_t p = 0; p < ports.size(); ++p) {
      const KPort& port = ports[p];
      if (port.kind == KPort::Kind::kAudioIn || port.kind == KPort::Kind::kSideChainIn) inputs[port.index] = static_cast<const float*>(ports_[p]);
      else if (port.kind == KPort::Kind::kAudioOut) outputs[port.index] = static_cast<float*>(ports_[p]);
    }
    // An input left unconnected reads as silence; an output must have somewhere to go.
    for (int32_t c = 0; c < layout_.CountOf(KPort::Kind::kAudioOut); ++c)
      if (!outputs[c]) return 0;
    midiOut_.BeginBlock();
    plugin.ProcessHostBlock(inputs, outputs, n);
    midiOut_.EndBlock();
    WriteOutputs();
    WriteMIDI();
    time_.Advance(n, plugin.SampleRate());
    return 0;
  });
}

// A changed control is one host point at offset 0; NaN (never seen) differs from every value.
// A port that shows the present value as closely as a float can (a default, a restored state)
// leaves the exact value alone.
void KAudioPluginLV2Adapter::ApplyControls() noexcept {
  const int32_t first = layout_.First(KPort::Kind::kParameter);
  for (int32_t p = 0; p < plugin_->ParameterCount(); ++p) {
    const auto* value = static_cast<const float*>(ports_[first + p]);
    if (!value || *value == seen_[p] || std::isnan(*value)) continue;
    seen_[p] = *value;
    if (*value == static_cast<float>(plugin_->GetParameter(p).Working())) continue;
    KHostRamp ramp(*plugin_, p);
    ramp.Add(0, plugin_->GetParameter(p).Kind().ToNormalized(*value));
    ramp.Commit();
  }
}

void KAudioPluginLV2Adapter::ReadMIDI() noexcept {
  const int32_t port = layout_.First(KPort::Kind::kMIDIIn);
  const auto* sequence = port < 0 ? nullptr : static_cast<const LV2_Atom_Sequence*>(ports_[port]);
  if (!sequence || !mapped_) return;
  for (const LV2_Atom_Event* event = lv2_atom_sequence_begin(&sequence->body); !lv2_atom_sequence_is_end(&sequence->body, sequence->atom.size, event);
       event = lv2_atom_sequence_next(event)) {
    // A position applies from the block's start, wherever the host put it.
    if (time_.Read(event->body)) continue;
    if (event->body.type != urids_.midiEvent || event->body.size == 0 || event->body.size > 3) continue;
    KMIDIBytes bytes = {0, 0, 0, 0};
    std::memcpy(bytes.data(), &event->body + 1, event->body.size);
    plugin_->ScheduleMIDIEvent(static_cast<int32_t>(event->time.frames), bytes);
  }
}

// The host gives the output sequence's capacity as its size; messages that do not fit are
// dropped.
void KAudioPluginLV2Adapter::WriteMIDI() noexcept {
  const int32_t port = layout_.First(KPort::Kind::kMIDIOut);
  auto* sequence = port < 0 ? nullptr : static_cast<LV2_Atom_Sequence*>(ports_[port]);
  if (!sequence || !mapped_) {
    midiOut_.Drain([](const KHostMIDIList::Message&) {});
    return;
  }
  const uint32_t capacity = sequence->atom.size;
  sequence->atom = {static_cast<uint32_t>(sizeof(LV2_Atom_Sequence_Body)), urids_.sequence};
  sequence->body = {0, 0};
  midiOut_.Drain([&](const KHostMIDIList::Message& message) {
    struct {
      LV2_Atom_Event header;
      uint8_t bytes[4];
    } event{};
    event.header.time.frames = message.sampleOffset;
    event.header.body.type = urids_.midiEvent;
    event.header.body.size = (message.bytes[0] & 0xF0) == 0xC0 || (message.bytes[0] & 0xF0) == 0xD0 ? 2 : 3;
    std::memcpy(event.bytes, message.bytes.data(), 3);
    lv2_atom_sequence_append_event(sequence, capacity, &event.header);
  });
}

void KAudioPluginLV2Adapter::WriteOutputs() noexcept {
  const int32_t meters = layout_.First(KPort::Kind::kMeter);
  for (int32_t m = 0; m < KAudioPlugin::kMeterCount; ++m) {
    KLevelMeter& meter = plugin_->GetMeter(static_cast<KAudioPlugin::Meter>(m));
    if (auto* level = static_cast<float*>(ports_[meters + m])) *level = meter.Level();
    meter.Reset();
  }
  if (auto* latency = static_cast<float*>(ports_[layout_.First(KPort::Kind::kLatency)]))
    *latency = static_cast<float>(std::max(plugin_->TotalLatency(), 0));
}

LV2_State_Status KAudioPluginLV2Adapter::Save(LV2_State_Store_Function store, LV2_State_Handle handle) noexcept {
  return KHostGuarded("KAudioPluginLV2Adapter::save", LV2_STATE_ERR_UNKNOWN, [&] {
    if (!mapped_) return LV2_STATE_ERR_NO_FEATURE;
    const std::string_view text = state_.Store(*plugin_);
    // An atom:String counts its terminating zero, which the stored text has.
    return store(handle, urids_.stateKey, text.data(), text.size() + 1, urids_.string, LV2_STATE_IS_POD | LV2_STATE_IS_PORTABLE);
  });
}

LV2_State_Status KAudioPluginLV2Adapter::Restore(LV2_State_Retrieve_Function retrieve, LV2_State_Handle handle) noexcept {
  return KHostGuarded("KAudioPluginLV2Adapter::restore", LV2_STATE_ERR_UNKNOWN, [&] {
    if (!mapped_) return LV2_STATE_ERR_NO_FEATURE;
    size_t size = 0;
    uint32_t type = 0, flags = 0;
    const auto* stored = static_cast<const char*>(retrieve(handle, urids_.stateKey, &size, &type, &flags));
    if (!stored) return LV2_STATE_ERR_NO_PROPERTY;
    if (type != urids_.string) return LV2_STATE_ERR_BAD_TYPE;
    std::string_view text(stored, size);
    while (!text.empty() && text.back() == '\0') text.remove_suffix(1);
    // A text that does not parse throws before anything is loaded: the plug-in stays as it was.
    KHostState::Load(*plugin_, text);
    // The restored values stand until the host moves a control away from what it shows now.
    const int32_t first = layout_.First(KPort::Kind::kParameter);
    for (int32_t p = 0; p < plugin_->ParameterCount(); ++p) {
      const auto* value = static_cast<const float*>(ports_[first + p]);
      seen_[p] = value ? *value : static_cast<float>(plugin_->GetParameter(p).Working());
    }
    return LV2_STATE_SUCCESS;
  });
}
