#include "hosts/lv2/KLV2Ports.h"

#include <algorithm>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

namespace KLV2 {
namespace {
constexpr const char* kMeterSymbols[] = {"meter_in_l", "meter_in_r", "meter_out_l", "meter_out_r"};
constexpr const char* kMeterNames[] = {"Input level left", "Input level right", "Output level left", "Output level right"};
static_assert(std::size(kMeterSymbols) == KAudioPlugin::kMeterCount);
}  // namespace

std::string KPortSymbol(const std::string& key) {
  std::string symbol;
  for (const char c : key) symbol += (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') || (c >= '0' && c <= '9') ? c : '_';
  if (symbol.empty() || (symbol[0] >= '0' && symbol[0] <= '9')) symbol.insert(0, 1, '_');
  return symbol;
}

KPortLayout::KPortLayout(const KAudioPlugin& plugin) {
  const KAudioPlugin::Shape& shape = plugin.GetShape();
  const int32_t channels = KAudioPlugin::kChannelCounts[0];
  // A second input bus is the side-chain; any further bus is another main input.
  for (int32_t bus = 0; bus < shape.inputBuses; ++bus) {
    const bool sideChain = bus == 1 && shape.inputBuses == 2;
    for (int32_t c = 0; c < channels; ++c) {
      const int32_t channel = bus * channels + c;
      const std::string number = std::to_string(c + 1);
      if (sideChain) Add(KPort::Kind::kSideChainIn, channel, "sc_in_" + number, "Side-chain " + number);
      else Add(KPort::Kind::kAudioIn, channel, "in_" + std::to_string(channel + 1), "Input " + std::to_string(channel + 1));
    }
  }
  for (int32_t channel = 0; channel < shape.outputBuses * channels; ++channel)
    Add(KPort::Kind::kAudioOut, channel, "out_" + std::to_string(channel + 1), "Output " + std::to_string(channel + 1));
  for (int32_t p = 0; p < plugin.ParameterCount(); ++p) {
    const KAudioPluginBase::Parameter& parameter = plugin.GetParameter(p);
    Add(KPort::Kind::kParameter, p, KPortSymbol(parameter.Key().ToUtf8()), parameter.Name().ToUtf8());
  }
  for (int32_t m = 0; m < KAudioPlugin::kMeterCount; ++m) Add(KPort::Kind::kMeter, m, kMeterSymbols[m], kMeterNames[m]);
  Add(KPort::Kind::kLatency, 0, "latency", "Latency");
  if (shape.acceptsMIDI) Add(KPort::Kind::kMIDIIn, 0, "midi_in", "MIDI in");
  if (shape.producesMIDI) Add(KPort::Kind::kMIDIOut, 0, "midi_out", "MIDI out");
}

void KPortLayout::Add(KPort::Kind kind, int32_t index, std::string symbol, std::string name) {
  ports_.push_back({kind, index, std::move(symbol), std::move(name)});
}

int32_t KPortLayout::First(KPort::Kind kind) const noexcept {
  const auto found = std::find_if(ports_.begin(), ports_.end(), [&](const KPort& port) { return port.kind == kind; });
  return found == ports_.end() ? -1 : static_cast<int32_t>(found - ports_.begin());
}

int32_t KPortLayout::CountOf(KPort::Kind kind) const noexcept {
  return static_cast<int32_t>(std::count_if(ports_.begin(), ports_.end(), [&](const KPort& port) { return port.kind == kind; }));
}

}  // namespace KLV2
