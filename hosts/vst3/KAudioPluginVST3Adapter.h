#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

#include "core/KAudioPlugin.h"
#include "hosts/KAudioPluginInterface.h"
#include "hosts/common/KHostChannelMap.h"
#include "hosts/common/KHostMIDIList.h"
#include "hosts/common/KHostState.h"
#include "hosts/vst3/KVST3Buses.h"
#include "hosts/vst3/KVST3Controller.h"
#include "hosts/vst3/KVST3HostContext.h"
#include "hosts/vst3/KVST3Parameters.h"
#include "hosts/vst3/KVST3Processing.h"

namespace KVST3 {
// IComponent and IEditController both name a state setter and getter, in different slots and
// with different meanings; these two give each pair a name of its own.
class KComponentSide : public IComponent {
public:
  TResult SetState(IBStream* state) final { return LoadComponentState(state); }
  TResult GetState(IBStream* state) final { return StoreComponentState(state); }
  virtual TResult LoadComponentState(IBStream* state) = 0;
  virtual TResult StoreComponentState(IBStream* state) = 0;

protected:
  ~KComponentSide() = default;
};

class KControllerSide : public IEditController {
public:
  TResult SetState(IBStream* state) final { return LoadControllerState(state); }
  TResult GetState(IBStream* state) final { return StoreControllerState(state); }
  virtual TResult LoadControllerState(IBStream* state) = 0;
  virtual TResult StoreControllerState(IBStream* state) = 0;

protected:
  ~KControllerSide() = default;
};
}  // namespace KVST3

// A plug-in of the kernel as one VST 3 object that is processor and edit controller at once
// (no separate controller class, no messages between halves). It translates between the host
// and the plug-in and keeps no logic of its own; the concerns live beside it: buses
// (KVST3Buses), parameter identifiers and texts (KVST3Parameters), the processing call's input
// (KVST3ProcessInput), MIDI output (KVST3MIDIOutput), the host's objects (KVST3HostContext)
// and the channel the host puts the plug-in on (KVST3ChannelContext). What every host format
// shares (the method guard, transport rules, ramps from host points, echo recognition, channel
// mapping, MIDI lists, the state text) lives in hosts/common.
// The editor is a view of its own (KVST3Editor); help and the about box are not offered.
//
// Every method the host calls is guarded: a KException gives the neutral answer, anything else
// is traced as "SYSTEM EXCEPTION! KAudioPluginVST3Adapter::<Method>" and gives it too.
// Process runs on the audio thread and neither allocates nor waits for a lock.
class KAudioPluginVST3Adapter final : public KVST3::KComponentSide,
                                      public KVST3::IAudioProcessor,
                                      public KVST3::IProcessContextRequirements,
                                      public KVST3::KControllerSide,
                                      public KVST3::IEditController2,
                                      public KVST3::IMidiMapping,
                                      public KVST3::IUnitInfo,
                                      public KVST3::ChannelContext::IInfoListener,
                                      public KAudioPluginInterface {
public:
  using TResult = KVST3::TResult;
  using ParamID = KVST3::ParamID;

  // Takes the plug-in; the host's one reference is the caller's.
  explicit KAudioPluginVST3Adapter(std::unique_ptr<KAudioPlugin> plugin);
  ~KAudioPluginVST3Adapter() override;

  // ---- FUnknown, IPluginBase
  class KEditor;

  TResult QueryInterface(const char* iid, void** object) override;
  uint32_t AddRef() override;
  uint32_t Release() override;
  TResult Initialize(KVST3::FUnknown* context) override;
  TResult Terminate() override;

  // ---- IComponent
  TResult GetControllerClassId(char* classId) override;
  TResult SetIoMode(int32_t mode) override;
  int32_t GetBusCount(int32_t type, int32_t direction) override;
  TResult GetBusInfo(int32_t type, int32_t direction, int32_t index, KVST3::BusInfo& info) override;
  TResult GetRoutingInfo(KVST3::RoutingInfo& input, KVST3::RoutingInfo& output) override;
  TResult ActivateBus(int32_t type, int32_t direction, int32_t index, KVST3::TBool state) override;
  TResult SetActive(KVST3::TBool state) override;
  TResult LoadComponentState(KVST3::IBStream* state) override;
  TResult StoreComponentState(KVST3::IBStream* state) override;

  // ---- IAudioProcessor, IProcessContextRequirements
  TResult SetBusArrangements(KVST3::SpeakerArrangement* inputs, int32_t inputCount, KVST3::SpeakerArrangement* outputs,
                             int32_t outputCount) override;
  TResult GetBusArrangement(int32_t direction, int32_t index, KVST3::SpeakerArrangement& arrangement) override;
  TResult CanProcessSampleSize(int32_t symbolicSampleSize) override;
  uint32_t GetLatencySamples() override;
  TResult SetupProcessing(KVST3::ProcessSetup& setup) override;
  TResult SetProcessing(KVST3::TBool state) override;
  TResult Process(KVST3::ProcessData& data) override;
  uint32_t GetTailSamples() override;
  uint32_t GetProcessContextRequirements() override;

  // ---- IEditController
  TResult SetComponentState(KVST3::IBStream* state) override;
  TResult LoadControllerState(KVST3::IBStream* state) override;
  TResult StoreControllerState(KVST3::IBStream* state) override;
  int32_t GetParameterCount() override;
  TResult GetParameterInfo(int32_t index, KVST3::ParameterInfo& info) override;
  TResult GetParamStringByValue(ParamID id, double normalized, KVST3::String128 text) override;
  TResult GetParamValueByString(ParamID id, KVST3::TChar* text, double& normalized) override;
  double NormalizedParamToPlain(ParamID id, double normalized) override;
  double PlainParamToNormalized(ParamID id, double plain) override;
  double GetParamNormalized(ParamID id) override;
  TResult SetParamNormalized(ParamID id, double normalized) override;
  TResult SetComponentHandler(KVST3::IComponentHandler* handler) override;
  KVST3::IPlugView* CreateView(KVST3::FIDString name) override;

  // ---- IEditController2
  TResult SetKnobMode(int32_t mode) override;
  TResult OpenHelp(KVST3::TBool onlyCheck) override;
  TResult OpenAboutBox(KVST3::TBool onlyCheck) override;

  // ---- IMidiMapping
  TResult GetMidiControllerAssignment(int32_t busIndex, int16_t channel, int16_t controller, ParamID& id) override;

  // ---- IUnitInfo: the root unit "Root" and its program list "Presets"
  int32_t GetUnitCount() override;
  TResult GetUnitInfo(int32_t unitIndex, KVST3::UnitInfo& info) override;
  int32_t GetProgramListCount() override;
  TResult GetProgramListInfo(int32_t listIndex, KVST3::ProgramListInfo& info) override;
  TResult GetProgramName(int32_t listId, int32_t programIndex, KVST3::String128 name) override;
  TResult GetProgramInfo(int32_t listId, int32_t programIndex, const char* attribute, KVST3::String128 value) override;
  TResult HasProgramPitchNames(int32_t listId, int32_t programIndex) override;
  TResult GetProgramPitchName(int32_t listId, int32_t programIndex, int16_t pitch, KVST3::String128 name) override;
  int32_t GetSelectedUnit() override;
  TResult SelectUnit(int32_t unitId) override;
  TResult GetUnitByBus(int32_t type, int32_t direction, int32_t busIndex, int32_t channel, int32_t& unitId) override;
  TResult SetUnitProgramData(int32_t listOrUnitId, int32_t programIndex, KVST3::IBStream* data) override;

  // ---- ChannelContext::IInfoListener: the channel's name, colour and the plug-in's place on it
  TResult SetChannelContextInfos(KVST3::IAttributeList* list) override;

  // ---- KAudioPluginInterface: the plug-in's way back to the host
  void BeginGesture(int32_t index) override;
  void SendAutomationValue(int32_t index, double normalized) override;
  void EndGesture(int32_t index) override;
  void SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) override;
  void ReportLatency(int32_t samples) override;
  void UpdateParameterNames() override;
  void NotifyPresetChanged() override;
  bool ResizeEditor(int32_t width, int32_t height) override;
  void SendBypassValue(bool bypass) override;
  // Also loads a preset the host chose through the program parameter while processing.
  void Idle() override;

  const KString& HostName() const noexcept { return host_.HostName(); }
  // The host's knob mode (IEditController2::KnobMode), for the editor to come.
  int32_t KnobMode() const noexcept { return knobMode_; }

private:
  KStringList PresetNames() const;

  std::unique_ptr<KAudioPlugin> plugin_;
  std::atomic<uint32_t> references_{1};
  int32_t initializations_ = 0;
  int32_t knobMode_ = KVST3::IEditController2::kCircularMode;
  KVST3::KParameterTable table_;
  KVST3::KBusLayout buses_;
  KVST3::KHostContext host_;
  KHostMIDIList midiOut_;
  // Silence and the discard buffer for buses the host leaves out, sized at setupProcessing.
  KHostChannelMap channels_;
  KHostState state_;
};
