#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "core/KMIDIQueue.h"
#include "hosts/vst3/KVST3Controller.h"
#include "kernel/KString.h"
#include "kernel/KStringList.h"

class KAudioPlugin;

namespace KVST3 {

// The parameters the adapter shows its host, in the order they are registered:
//   0 .. N-1                 the plug-in's parameters, in its own order
//   32767 "Bypass"           the plug-in's bypass switch
//   32766 "Program"          the preset, one step per entry of the program list
//   10000 + cc + 130 x ch    MIDI controller cc (0-127; 128 channel aftertouch, 129 pitch bend)
//                            on channel ch: all 16 channels for a plug-in without an audio
//                            input (an instrument), channel 0 alone otherwise
// plus the root unit "Root" with its program list "Presets": the plug-in's presets, factory
// ones first (KAudioPlugin::ListPresets), which the program parameter selects and names. The
// plug-in's own parameters keep their values in the plug-in; the controllers keep theirs here,
// so that the host reads back what it set; the program reads as the plug-in's current preset.
class KParameterTable {
public:
  static constexpr ParamID kBypass = 32767;
  static constexpr ParamID kProgram = 32766;
  static constexpr ParamID kFirstController = 10000;
  static constexpr int32_t kControllersPerChannel = 130;
  static constexpr int32_t kChannels = 16;
  static constexpr int32_t kPresetList = 1;

  enum class Kind { kNone, kPlugin, kBypass, kProgram, kController };
  struct Decoded {
    Kind kind = Kind::kNone;
    int32_t index = 0;       // kPlugin: the plug-in parameter
    int32_t controller = 0;  // kController
    int32_t channel = 0;     // kController, 0-15
  };

  explicit KParameterTable(KAudioPlugin& plugin);

  // Registers the parameters (at initialize); until then the table is empty.
  void Build() noexcept;
  int32_t Count() const noexcept;
  int32_t ControllerChannels() const noexcept { return controllerChannels_; }
  Decoded Decode(ParamID id) const noexcept;
  // The identifier of MIDI controller `controller` on `channel`, when registered.
  bool ControllerId(int32_t channel, int32_t controller, ParamID& id) const noexcept;

  bool Describe(int32_t index, ParameterInfo& info) const;
  // Display text of a normalised value, and back. Bypass: "On" / "Off"; program: the preset's
  // name (its number is taken back too); controllers: 0-127, pitch bend 0-16383 (8192 the centre).
  bool Text(ParamID id, double normalized, KString& text) const;
  bool Value(ParamID id, const KString& text, double& normalized) const;
  // Plain values: the plug-in's working units, the preset's position, the controller's MIDI value.
  double ToPlain(ParamID id, double normalized) const noexcept;
  double ToNormalized(ParamID id, double plain) const noexcept;

  double Normalized(ParamID id) const noexcept;
  // Takes a value the host set outside processing: a plug-in parameter moves at once, a program
  // other than the current preset loads (KException from the preset passes on).
  bool SetNormalized(ParamID id, double normalized);
  // Audio thread: one point of a queue of a fixed parameter, at `sampleOffset` of the block. A
  // program is only noted: SelectPendingProgram loads it on the user-interface thread.
  void Apply(const Decoded& parameter, int32_t sampleOffset, double normalized) noexcept;
  void SelectPendingProgram();

  // ---- the program list (user-interface thread)
  // The presets' names as the host is to see them; answers what changed: nothing, only names,
  // or their count (and with it the program parameter's step count).
  enum class ProgramChange { kNone, kNames, kCount };
  ProgramChange SetPrograms(KStringList names);
  const KStringList& Programs() const noexcept { return programs_; }
  int32_t ProgramSteps() const noexcept;
  // The preset a normalised program value stands for, within the list.
  int32_t ProgramIndex(double normalized) const noexcept;

  // The MIDI message a controller parameter stands for.
  static KMIDIBytes ControllerMessage(int32_t controller, int32_t channel, double normalized) noexcept;

private:
  std::atomic<double>* Stored(const Decoded& parameter) const noexcept;
  // Loads the preset at `index` unless it is the current one already: a host that writes back
  // the value it read changes nothing.
  void SelectProgram(int32_t index);

  KAudioPlugin& plugin_;
  int32_t pluginCount_ = 0;
  int32_t controllerChannels_ = 0;
  bool built_ = false;
  KStringList programs_;
  std::atomic<int32_t> programCount_{0};
  // The preset the audio thread was asked for, -1 when none waits.
  std::atomic<int32_t> pendingProgram_{-1};
  // The program's value, then 16 x 130 controller values.
  std::unique_ptr<std::atomic<double>[]> stored_;
};

}  // namespace KVST3
