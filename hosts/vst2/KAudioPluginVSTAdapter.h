#pragma once

#include <cstdint>
#include <memory>

#include "core/KAudioPlugin.h"
#include "hosts/KAudioPluginInterface.h"
#include "hosts/common/KHostChannelMap.h"
#include "hosts/common/KHostMIDIList.h"
#include "hosts/common/KHostState.h"
#include "hosts/vst2/KVST2Effect.h"
#include "hosts/vst2/KVST2Events.h"
#include "kernel/KString.h"

struct KPluginDescription;

// A plug-in of the kernel as one VST 2 instance. It translates between the host and the
// plug-in and keeps no logic of its own: the binary interface and its dispatcher are KVST2's
// (KVST2Interface, KVST2Effect), time information and events have their own files, and what
// every host format shares (the method guard, transport rules, echo recognition, channel
// mapping, MIDI lists, the state text) lives in hosts/common.
// The editor is KEditor (KVST2Editor), in the host's X11 window.
//
// Every method the host calls is guarded: a KException gives the neutral answer, anything else
// is traced as "SYSTEM EXCEPTION! KAudioPluginVSTAdapter::<method>" and gives it too.
// processReplacing runs on the audio thread and neither allocates nor waits for a lock.
class KAudioPluginVSTAdapter final : public KVST2::KEffect, public KAudioPluginInterface {
public:
  // Hosts of a VST version up to this one are VST 1 hosts.
  static constexpr int32_t kLastVST1Version = 99;

  class KEditor;

  KAudioPluginVSTAdapter(KVST2::HostCallback host, std::unique_ptr<KAudioPlugin> plugin, int32_t uniqueId);
  ~KAudioPluginVSTAdapter() override;

  // ---- KEffect: what the host calls
  void resume() override;
  void setSampleRate(float rate) override;
  void setBlockSize(int32_t size) override;
  void processReplacing(float** inputs, float** outputs, int32_t sampleFrames) override;
  void setParameter(int32_t index, float value) override;
  float getParameter(int32_t index) override;
  int32_t getProgram() override { return 0; }
  void setProgram(int32_t) override {}
  void setProgramName(char*) override {}
  void getProgramName(char* name) override;
  void getParameterLabel(int32_t index, char* label) override;
  void getParameterDisplay(int32_t index, char* text) override;
  void getParameterName(int32_t index, char* text) override;
  int32_t getChunk(void** data, bool isPreset) override;
  int32_t setChunk(void* data, int32_t byteSize, bool isPreset) override;
  bool getInputProperties(int32_t index, KVST2::VstPinProperties* properties) override;
  bool getOutputProperties(int32_t index, KVST2::VstPinProperties* properties) override;
  bool setSpeakerArrangement(KVST2::VstSpeakerArrangement* input, KVST2::VstSpeakerArrangement* output) override;
  int32_t processEvents(KVST2::VstEvents* events) override;
  bool getEffectName(char* name) override;
  bool getVendorString(char* text) override;
  bool getProductString(char* text) override;
  int32_t canDo(char* text) override;
  int32_t idle() override;

  // ---- KAudioPluginInterface: the plug-in's way back to the host
  void BeginGesture(int32_t index) override;
  void SendAutomationValue(int32_t index, double normalized) override;
  void EndGesture(int32_t index) override;
  void SendMIDIEvent(int32_t sampleOffset, const uint8_t bytes[4]) override;
  void ReportLatency(int32_t samples) override;
  void UpdateParameterNames() override;
  void NotifyPresetChanged() override;
  bool ResizeEditor(int32_t width, int32_t height) override;

  int32_t HostVersion() const noexcept { return hostVersion_; }
  const KString& HostProduct() const noexcept { return hostProduct_; }
  KEditor& Editor() noexcept { return *editor_; }

private:
  bool PinProperties(int32_t index, bool input, KVST2::VstPinProperties* properties);
  const KPluginDescription& Description() const;

  std::unique_ptr<KAudioPlugin> plugin_;
  std::unique_ptr<KEditor> editor_;
  int32_t hostVersion_ = 1;
  KString hostProduct_;
  // The plug-in's channels as built, and the host's, which an arrangement may make fewer.
  int32_t channelsPerBus_;
  int32_t pluginInputs_, pluginOutputs_;
  int32_t hostInputs_, hostOutputs_;
  // The host's buffers go to the plug-in as they are.
  bool direct_ = true;
  KHostMIDIList midiIn_, midiOut_;
  KVST2::KEventOutput eventOutput_;
  // Silence and the discard buffer for channels the host does not have, sized at resume.
  KHostChannelMap channels_;
  KHostState state_;
};
