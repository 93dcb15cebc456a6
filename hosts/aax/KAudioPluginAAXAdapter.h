#pragma once

#include <memory>

#include "core/KAudioPlugin.h"
#include "hosts/KAudioPluginInterface.h"
#include "hosts/aax/KAAXEffectParameters.h"
#include "hosts/aax/KAAXLiveObject.h"
#include "hosts/aax/KAAXProcessContext.h"
#include "hosts/common/KHostMIDIList.h"
#include "hosts/common/KHostState.h"

class KAAXGUI;

// A plug-in of the kernel as the effect-parameters object of an AAX effect. It translates
// between the host and the plug-in and keeps no logic of its own: the master bypass and one
// continuous parameter per plug-in parameter (identified by its index in decimal), the state
// as the chunk 'Torv' (the UTF-8 XML text every host format carries), processing through
// KAAXProcessCallback, and the plug-in's way back to the host in AAX terms.
//
// Every method the host calls is guarded: a KException gives the neutral answer, anything else
// is traced as "SYSTEM EXCEPTION! KAudioPluginAAXAdapter::<Method>" and gives it too.
// Process runs on the host's real-time thread and neither allocates nor waits for a lock.
class TORVANE_API KAudioPluginAAXAdapter final : public KAAX::KEffectParameters, public KAudioPluginInterface {
public:
  static constexpr KAAX::ChunkId kStateChunk = KAAX::KFourCC("Torv");

  explicit KAudioPluginAAXAdapter(std::unique_ptr<KAudioPlugin> plugin);
  ~KAudioPluginAAXAdapter() override;

  // ---- effect parameters
  KAAX::Result EffectInit() override;
  KAAX::Result GetChunkSize(KAAX::ChunkId id, uint32_t* size) const override;
  KAAX::Result GetChunk(KAAX::ChunkId id, KAAX::PluginChunk* chunk) const override;
  KAAX::Result SetChunk(KAAX::ChunkId id, const KAAX::PluginChunk* chunk) override;
  KAAX::Result UpdateParameterNormalizedValue(KAAX::ParamId id, double normalized) override;
  KAAX::Result GetParameterStringFromValue(KAAX::ParamId id, double normalized, char* text, int32_t capacity) const override;
  KAAX::Result GetParameterNormalizedValue(KAAX::ParamId id, double* normalized) const override;
  KAAX::Result SetParameterNormalizedValue(KAAX::ParamId id, double normalized) override;
  KAAX::Result SetParameterNormalizedRelative(KAAX::ParamId id, double delta) override;
  KAAX::Result GetParameterNameOfLength(KAAX::ParamId id, char* name, int32_t length) const override;
  KAAX::Result GetParameterName(KAAX::ParamId id, char* name, int32_t capacity) const override;
  // The host's periodic call on its user-interface thread: quiet gestures end, latency is told.
  KAAX::Result TimerWakeup() override;

  // One buffer of the host's real-time thread (KAAXProcessCallback).
  void Process(const KAAXProcessContext& context) noexcept;

  // The GUI the host made for this effect, while it lives (for editor resizing).
  void AttachGUI(KAAXGUI* gui) noexcept { gui_ = gui; }
  KAudioPlugin& GetPlugin() noexcept { return *plugin_; }
  const KString& HostApplication() const noexcept { return hostApplication_; }

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

private:
  // The plug-in parameter an identifier names ("12" is the thirteenth), or -1.
  int32_t PluginIndex(KAAX::ParamId id) const noexcept;

  std::unique_ptr<KAudioPlugin> plugin_;
  KString hostApplication_;
  KHostMIDIList midiOut_;
  mutable KHostState state_;
  KAAXGUI* gui_ = nullptr;
  KAAXLiveObject live_;
};
