#include "hosts/vst3/KVST3Parameters.h"

#include <algorithm>
#include <cmath>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/common/KHostEcho.h"
#include "hosts/vst3/KVST3Util.h"
#include "kernel/KFormat.h"

namespace KVST3 {
namespace {
constexpr int32_t kControllerRows = KParameterTable::kChannels * KParameterTable::kControllersPerChannel;
constexpr int32_t kPitchBendRange = 16383;

int32_t Scaled(double normalized, int32_t top) noexcept {
  return static_cast<int32_t>(std::clamp<long>(std::lround(normalized * top), 0, top));
}

// The top of a controller's MIDI value range: 14 bits for pitch bend, 7 bits otherwise.
int32_t ControllerTop(int32_t controller) noexcept { return controller == IMidiMapping::kPitchBend ? kPitchBendRange : 127; }

// A whole number written the way Text writes it; false for anything else.
bool ReadWholeNumber(const KString& text, int32_t top, int32_t& number) {
  if (text.IsEmpty() || text.CharAt(0) < u'0' || text.CharAt(0) > u'9') return false;
  const int64_t value = text.ToInteger();
  if (value > top) return false;
  number = static_cast<int32_t>(value);
  return true;
}
}  // namespace

KParameterTable::KParameterTable(KAudioPlugin& plugin)
    : plugin_(plugin), stored_(new std::atomic<double>[1 + kControllerRows]) {
  for (int32_t i = 0; i < 1 + kControllerRows; ++i) stored_[i].store(0.0, std::memory_order_relaxed);
}

void KParameterTable::Build() noexcept {
  pluginCount_ = plugin_.ParameterCount();
  controllerChannels_ = plugin_.GetShape().inputBuses == 0 ? kChannels : 1;
  built_ = true;
}

int32_t KParameterTable::Count() const noexcept {
  return built_ ? pluginCount_ + 2 + controllerChannels_ * kControllersPerChannel : 0;
}

KParameterTable::Decoded KParameterTable::Decode(ParamID id) const noexcept {
  Decoded decoded;
  if (!built_) return decoded;
  if (id < static_cast<ParamID>(pluginCount_)) {
    decoded.kind = Kind::kPlugin;
    decoded.index = static_cast<int32_t>(id);
  } else if (id == kBypass) {
    decoded.kind = Kind::kBypass;
  } else if (id == kProgram) {
    decoded.kind = Kind::kProgram;
  } else if (id >= kFirstController && id < kFirstController + static_cast<ParamID>(controllerChannels_ * kControllersPerChannel)) {
    decoded.kind = Kind::kController;
    decoded.controller = static_cast<int32_t>(id - kFirstController) % kControllersPerChannel;
    decoded.channel = static_cast<int32_t>(id - kFirstController) / kControllersPerChannel;
  }
  return decoded;
}

bool KParameterTable::ControllerId(int32_t channel, int32_t controller, ParamID& id) const noexcept {
  if (!built_ || channel < 0 || channel >= controllerChannels_ || controller < 0 || controller >= kControllersPerChannel) return false;
  id = kFirstController + static_cast<ParamID>(controller + kControllersPerChannel * channel);
  return true;
}

bool KParameterTable::Describe(int32_t index, ParameterInfo& info) const {
  if (index < 0 || index >= Count()) return false;
  info = ParameterInfo{};
  info.unitId = UnitInfo::kRootUnitId;
  if (index < pluginCount_) {
    const KAudioPluginBase::Parameter& parameter = plugin_.GetParameter(index);
    info.id = static_cast<ParamID>(index);
    KCopyText(parameter.Name(), info.title, 128);
    KCopyText(parameter.Unit(), info.units, 128);
    info.stepCount = parameter.Steps();
    info.defaultNormalizedValue = parameter.DefaultNormalized();
    // Every plug-in parameter: a host hides the others from its generic controls and lanes.
    info.flags = ParameterInfo::kCanAutomate;
  } else if (index == pluginCount_) {
    info.id = kBypass;
    KCopyText("Bypass", info.title, 128);
    info.stepCount = 1;
    info.flags = ParameterInfo::kCanAutomate | ParameterInfo::kIsBypass;
  } else if (index == pluginCount_ + 1) {
    info.id = kProgram;
    KCopyText("Program", info.title, 128);
    info.stepCount = ProgramSteps();
    info.unitId = UnitInfo::kRootUnitId;
    info.flags = ParameterInfo::kCanAutomate | ParameterInfo::kIsProgramChange;
  } else {
    const int32_t row = index - pluginCount_ - 2;
    const int32_t controller = row % kControllersPerChannel, channel = row / kControllersPerChannel;
    info.id = kFirstController + static_cast<ParamID>(row);
    KCopyText(controllerChannels_ > 1 ? KFormatText("MIDI CC {0} channel {1}", controller, channel + 1)
                                      : KFormatText("MIDI CC {0}", controller),
              info.title, 128);
  }
  return true;
}

bool KParameterTable::Text(ParamID id, double normalized, KString& text) const {
  const Decoded parameter = Decode(id);
  switch (parameter.kind) {
    case Kind::kPlugin:
      text = plugin_.GetParameter(parameter.index).TextForNormalized(normalized);
      return true;
    case Kind::kBypass:
      text = normalized >= 0.5 ? KString("On") : KString("Off");
      return true;
    case Kind::kProgram: {
      const int32_t index = ProgramIndex(normalized);
      text = index < programs_.Count() ? programs_[index] : KFormatText("{0}", index);
      return true;
    }
    case Kind::kController:
      text = KFormatText("{0}", Scaled(normalized, ControllerTop(parameter.controller)));
      return true;
    case Kind::kNone:
      break;
  }
  return false;
}

bool KParameterTable::Value(ParamID id, const KString& text, double& normalized) const {
  const Decoded parameter = Decode(id);
  int32_t number = 0;
  switch (parameter.kind) {
    case Kind::kPlugin:
      return plugin_.GetParameter(parameter.index).NormalizedFromText(text, normalized);
    case Kind::kBypass:
      if (text == KString("On") || text == KString("1")) normalized = 1.0;
      else if (text == KString("Off") || text == KString("0")) normalized = 0.0;
      else return false;
      return true;
    case Kind::kProgram:
      number = programs_.IndexOf(text);
      if (number < 0 && !ReadWholeNumber(text, std::max(programs_.Count() - 1, 0), number)) return false;
      normalized = static_cast<double>(number) / ProgramSteps();
      return true;
    case Kind::kController:
      if (!ReadWholeNumber(text, ControllerTop(parameter.controller), number)) return false;
      normalized = static_cast<double>(number) / ControllerTop(parameter.controller);
      return true;
    case Kind::kNone:
      break;
  }
  return false;
}

double KParameterTable::ToPlain(ParamID id, double normalized) const noexcept {
  const Decoded parameter = Decode(id);
  switch (parameter.kind) {
    case Kind::kPlugin: return plugin_.GetParameter(parameter.index).Kind().ToWorking(normalized);
    case Kind::kProgram: return ProgramIndex(normalized);
    case Kind::kController: return Scaled(normalized, ControllerTop(parameter.controller));
    default: return normalized;
  }
}

double KParameterTable::ToNormalized(ParamID id, double plain) const noexcept {
  const Decoded parameter = Decode(id);
  switch (parameter.kind) {
    case Kind::kPlugin: return plugin_.GetParameter(parameter.index).Kind().ToNormalized(plain);
    case Kind::kProgram: return std::clamp(plain / ProgramSteps(), 0.0, 1.0);
    case Kind::kController: return std::clamp(plain / ControllerTop(parameter.controller), 0.0, 1.0);
    default: return std::clamp(plain, 0.0, 1.0);
  }
}

void KParameterTable::SelectPendingProgram() {
  const int32_t index = pendingProgram_.exchange(-1, std::memory_order_acquire);
  if (index >= 0) SelectProgram(index);
}

void KParameterTable::SelectProgram(int32_t index) {
  if (index < programCount_.load(std::memory_order_relaxed) && index != plugin_.GlobalSettings().presetIndex) plugin_.SelectPreset(index);
}

KParameterTable::ProgramChange KParameterTable::SetPrograms(KStringList names) {
  ProgramChange change = names.Count() != programs_.Count() ? ProgramChange::kCount : ProgramChange::kNone;
  for (int32_t i = 0; change == ProgramChange::kNone && i < names.Count(); ++i)
    if (!(names[i] == programs_[i])) change = ProgramChange::kNames;
  programs_ = std::move(names);
  programCount_.store(programs_.Count(), std::memory_order_relaxed);
  return change;
}

// One step per preset after the first; a list of one or none still steps, so that the program
// never reads as a continuous control.
int32_t KParameterTable::ProgramSteps() const noexcept { return std::max(programCount_.load(std::memory_order_relaxed) - 1, 1); }

int32_t KParameterTable::ProgramIndex(double normalized) const noexcept {
  const int32_t last = std::max(programCount_.load(std::memory_order_relaxed) - 1, 0);
  return std::min(Scaled(normalized, ProgramSteps()), last);
}

std::atomic<double>* KParameterTable::Stored(const Decoded& parameter) const noexcept {
  if (parameter.kind == Kind::kProgram) return &stored_[0];
  if (parameter.kind == Kind::kController) return &stored_[1 + parameter.controller + kControllersPerChannel * parameter.channel];
  return nullptr;
}

double KParameterTable::Normalized(ParamID id) const noexcept {
  const Decoded parameter = Decode(id);
  if (parameter.kind == Kind::kPlugin) return plugin_.GetParameter(parameter.index).Normalized();
  if (parameter.kind == Kind::kBypass) return plugin_.IsBypassed() ? 1.0 : 0.0;
  if (parameter.kind == Kind::kProgram) {
    const int32_t current = plugin_.GlobalSettings().presetIndex;
    if (current >= 0 && current < programCount_.load(std::memory_order_relaxed)) return static_cast<double>(current) / ProgramSteps();
  }
  const std::atomic<double>* stored = Stored(parameter);
  return stored ? stored->load(std::memory_order_relaxed) : 0.0;
}

bool KParameterTable::SetNormalized(ParamID id, double normalized) {
  const Decoded parameter = Decode(id);
  normalized = std::clamp(normalized, 0.0, 1.0);
  if (parameter.kind == Kind::kPlugin) {
    KTakeHostValue(plugin_, parameter.index, normalized);
  } else if (parameter.kind == Kind::kBypass) {
    plugin_.SetBypass(normalized >= 0.5);
  } else if (parameter.kind == Kind::kProgram) {
    stored_[0].store(normalized, std::memory_order_relaxed);
    SelectProgram(ProgramIndex(normalized));
  } else if (std::atomic<double>* stored = Stored(parameter)) {
    stored->store(normalized, std::memory_order_relaxed);
  } else {
    return false;
  }
  return true;
}

void KParameterTable::Apply(const Decoded& parameter, int32_t sampleOffset, double normalized) noexcept {
  normalized = std::clamp(normalized, 0.0, 1.0);
  if (parameter.kind == Kind::kBypass) {
    plugin_.SetBypass(normalized >= 0.5);
  } else if (parameter.kind == Kind::kProgram) {
    stored_[0].store(normalized, std::memory_order_relaxed);
    pendingProgram_.store(ProgramIndex(normalized), std::memory_order_release);
  } else if (parameter.kind == Kind::kController) {
    Stored(parameter)->store(normalized, std::memory_order_relaxed);
    plugin_.ScheduleMIDIEvent(sampleOffset, ControllerMessage(parameter.controller, parameter.channel, normalized));
  }
}

KMIDIBytes KParameterTable::ControllerMessage(int32_t controller, int32_t channel, double normalized) noexcept {
  const auto status = static_cast<uint8_t>(channel & 15);
  if (controller == IMidiMapping::kPitchBend) {
    const int32_t bend = Scaled(normalized, kPitchBendRange);
    return {static_cast<uint8_t>(0xE0 | status), static_cast<uint8_t>(bend & 127), static_cast<uint8_t>(bend >> 7), 0};
  }
  const auto value = static_cast<uint8_t>(Scaled(normalized, 127));
  if (controller == IMidiMapping::kAfterTouch) return {static_cast<uint8_t>(0xD0 | status), value, 0, 0};
  return {static_cast<uint8_t>(0xB0 | status), static_cast<uint8_t>(controller & 127), value, 0};
}

}  // namespace KVST3
