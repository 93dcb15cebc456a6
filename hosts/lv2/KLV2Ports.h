#pragma once

#include <cstdint>
#include <string>
#include <vector>

class KAudioPlugin;

namespace KLV2 {

// The ports of one plug-in, in index order, as both its bundle's description and the running
// instance number them: main audio inputs, side-chain inputs, audio outputs, one control input
// per parameter (working units), the level meters, the latency, then MIDI in and out where the
// plug-in has them. Channels per bus are the plug-in's first choice (stereo).
struct KPort {
  enum class Kind { kAudioIn, kSideChainIn, kAudioOut, kParameter, kMeter, kLatency, kMIDIIn, kMIDIOut };
  Kind kind;
  int32_t index;  // the channel of its bus, the parameter, or the meter
  std::string symbol;
  std::string name;
};

class KPortLayout {
public:
  explicit KPortLayout(const KAudioPlugin& plugin);

  const std::vector<KPort>& Ports() const noexcept { return ports_; }
  int32_t Count() const noexcept { return static_cast<int32_t>(ports_.size()); }
  // The first port of a kind, or -1: ports of one kind are numbered consecutively.
  int32_t First(KPort::Kind kind) const noexcept;
  int32_t CountOf(KPort::Kind kind) const noexcept;

private:
  void Add(KPort::Kind kind, int32_t index, std::string symbol, std::string name);
  std::vector<KPort> ports_;
};

// A parameter key as an LV2 port symbol: letters, digits and '_', never a leading digit.
std::string KPortSymbol(const std::string& key);

}  // namespace KLV2
