#include "hosts/vst3/KVST3ProcessInput.h"

#include <algorithm>
#include <cmath>
#include <span>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/vst3/KVST3Parameters.h"

namespace KVST3 {
namespace {
constexpr double kEpsilon = 1e-10;

uint8_t SevenBits(double normalized, int32_t lowest) noexcept {
  return static_cast<uint8_t>(std::clamp<long>(std::lround(normalized * 127.0), lowest, 127));
}

// The points of one queue as a ramp of plug-in parameter `index`, starting from its present
// value when the first point lies after the block start. Offsets keep inside the block and
// never run backwards; beyond the ramp's room the last point still wins.
void RampThrough(IParamValueQueue& queue, int32_t first, int32_t points, int32_t blockLength, KAudioPlugin& plugin, int32_t index) noexcept {
  KAudioPluginBase::RampPoint ramp[ParameterRamp::kMaxPoints];
  int32_t count = 0;
  for (int32_t p = first; p < points; ++p) {
    int32_t offset = 0;
    double value = 0.0;
    if (queue.GetPoint(p, offset, value) != kResultOk) continue;
    offset = std::clamp(offset, count > 0 ? ramp[count - 1].time : 0, std::max(blockLength, 0));
    if (count == 0 && offset > 0) ramp[count++] = {0, plugin.GetParameter(index).Normalized()};
    ramp[count < ParameterRamp::kMaxPoints ? count++ : count - 1] = {offset, value};
  }
  // A lone point lands at once. Ramps run in fine sub-blocks, so that automation sounds the
  // same whatever block size the host happens to use.
  if (count > 0) plugin.AddRamp(index, std::span(ramp, static_cast<size_t>(count)), true);
}
}  // namespace

void KReadTransport(const ProcessContext* context, bool offline, KTransport& transport) noexcept {
  transport.Reset();
  if (!context) return;
  const uint32_t state = context->state;
  // An offline pass that reports position 0 has no position at all.
  if (!offline || context->projectTimeSamples > 0) transport.samplePosition = context->projectTimeSamples;
  if ((state & ProcessContext::kTempoValid) && context->tempo > 1.0) transport.tempo = context->tempo;
  if ((state & ProcessContext::kProjectTimeMusicValid) && (!offline || context->projectTimeMusic > kEpsilon))
    transport.songPosition = context->projectTimeMusic;
  if ((state & ProcessContext::kTimeSigValid) && context->timeSigNumerator != 0) {
    transport.numerator = context->timeSigNumerator;
    transport.denominator = context->timeSigDenominator;
  }
  if (state & ProcessContext::kBarPositionValid) {
    const double beat = std::max(1, transport.denominator / 4);
    transport.barStart = std::round(beat * context->barPositionMusic) / beat;
  }
  if ((state & ProcessContext::kCycleValid) && context->cycleEndMusic - context->cycleStartMusic > kEpsilon) {
    transport.cycleStart = context->cycleStartMusic;
    transport.cycleEnd = context->cycleEndMusic;
  }
  if (offline || (state & ProcessContext::kPlaying)) transport.flags |= KTransport::kPlaying;
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
