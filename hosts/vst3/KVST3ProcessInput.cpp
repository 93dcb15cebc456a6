#include "hosts/vst3/KVST3ProcessInput.h"

#include <algorithm>
#include <cmath>
#include <utility>

#include "core/KAudioPlugin.h"
#include "hosts/common/KHostRamp.h"
#include "hosts/common/KHostTime.h"
#include "hosts/vst3/KVST3Parameters.h"

namespace KVST3 {
namespace {
uint8_t SevenBits(double normalized, int32_t lowest) noexcept {
  return static_cast<uint8_t>(std::clamp<long>(std::lround(normalized * 127.0), lowest, 127));
}

// The points of one queue as a ramp of plug-in parameter `index`. VST 3 offsets lie inside the
// block; a host's stray one is taken to the nearest end.
void RampThrough(IParamValueQueue& queue, int32_t first, int32_t points, int32_t blockLength, KAudioPlugin& plugin, int32_t index) noexcept {
  KHostRamp ramp(plugin, index);
  for (int32_t p = first; p < points; ++p) {
    int32_t offset = 0;
    double value = 0.0;
    if (queue.GetPoint(p, offset, value) == kResultOk) ramp.Add(std::clamp(offset, 0, std::max(blockLength, 0)), value);
  }
  ramp.Commit();
}

// Each state flag of the process context and the validity it gives.
constexpr std::pair<uint32_t, uint32_t> kValidity[] = {
    {ProcessContext::kTempoValid, KHostTime::kTempoValid},       {ProcessContext::kProjectTimeMusicValid, KHostTime::kSongPositionValid},
    {ProcessContext::kBarPositionValid, KHostTime::kBarStartValid}, {ProcessContext::kTimeSigValid, KHostTime::kSignatureValid},
    {ProcessContext::kCycleValid, KHostTime::kCycleValid},       {ProcessContext::kPlaying, KHostTime::kPlaying},
};

// What the process context reports, with the validity its state flags give.
KHostTime TimeOf(const ProcessContext& context) noexcept {
  KHostTime time;
  for (const auto& [flag, valid] : kValidity)
    if (context.state & flag) time.valid |= valid;
  time.samplePosition = static_cast<double>(context.projectTimeSamples);
  time.tempo = context.tempo;
  time.songPosition = context.projectTimeMusic;
  time.barStart = context.barPositionMusic;
  time.numerator = context.timeSigNumerator;
  time.denominator = context.timeSigDenominator;
  time.cycleStart = context.cycleStartMusic;
  time.cycleEnd = context.cycleEndMusic;
  return time;
}
}  // namespace

void KReadTransport(const ProcessContext* context, bool offline, KTransport& transport) noexcept {
  if (!context) return KAcceptTransport(nullptr, offline, transport);
  const KHostTime time = TimeOf(*context);
  KAcceptTransport(&time, offline, transport);
}

void KApplyParameterChanges(IParameterChanges* changes, int32_t blockLength, KAudioPlugin& plugin, KParameterTable& table) noexcept {
  if (!changes) return;
  const int32_t queues = changes->GetParameterCount();
  const bool lastOnly = queues > kEveryPointLimit || blockLength <= 0;
  for (int32_t q = 0; q < queues; ++q) {
    IParamValueQueue* queue = changes->GetParameterData(q);
    const int32_t points = queue ? queue->GetPointCount() : 0;
    if (points <= 0) continue;
    const KParameterTable::Decoded parameter = table.Decode(queue->GetParameterId());
    const int32_t first = lastOnly ? points - 1 : 0;
    if (parameter.kind == KParameterTable::Kind::kPlugin) {
      RampThrough(*queue, first, points, blockLength, plugin, parameter.index);
      continue;
    }
    for (int32_t p = first; p < points && parameter.kind != KParameterTable::Kind::kNone; ++p) {
      int32_t offset = 0;
      double value = 0.0;
      if (queue->GetPoint(p, offset, value) == kResultOk) table.Apply(parameter, std::max(offset, 0), value);
    }
  }
}

void KDeliverEvents(IEventList* events, KAudioPlugin& plugin) noexcept {
  if (!events) return;
  const int32_t count = events->GetEventCount();
  for (int32_t i = 0; i < count; ++i) {
    Event event{};
    if (events->GetEvent(i, event) != kResultOk || event.busIndex != 0) continue;
    // Status, channel, note and the value byte of each event kind that has a MIDI message.
    uint8_t status = 0, value = 0;
    int32_t channel = 0, pitch = -1;
    if (event.type == Event::kNoteOnEvent) {
      status = 0x90;
      channel = event.noteOn.channel;
      pitch = event.noteOn.pitch;
      value = SevenBits(event.noteOn.velocity, 1);  // a note on never reads as a note off
    } else if (event.type == Event::kNoteOffEvent) {
      status = 0x80;
      channel = event.noteOff.channel;
      pitch = event.noteOff.pitch;
      value = SevenBits(event.noteOff.velocity, 0);
    } else if (event.type == Event::kPolyPressureEvent) {
      status = 0xA0;
      channel = event.polyPressure.channel;
      pitch = event.polyPressure.pitch;
      value = SevenBits(event.polyPressure.pressure, 0);
    }
    if (pitch < 0 || pitch > 127 || channel < 0 || channel > 15) continue;
    const KMIDIBytes bytes = {static_cast<uint8_t>(status | channel), static_cast<uint8_t>(pitch), value, 0};
    plugin.ScheduleMIDIEvent(std::max(event.sampleOffset, 0), bytes);
  }
}

}  // namespace KVST3
