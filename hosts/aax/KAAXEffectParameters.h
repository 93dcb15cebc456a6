#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "hosts/aax/KAAXBase.h"
#include "hosts/aax/KAAXParameterManager.h"
#include "kernel/KExport.h"

namespace KAAX {

// A state chunk as the host hands it over: a header, then fSize bytes of data.
struct PluginChunk {
  int32_t fSize;
  int32_t fVersion;
  uint32_t fManufacturerID;
  uint32_t fProductID;
  uint32_t fPlugInID;
  uint32_t fChunkID;
  uint8_t fName[32];
  char fData[1];
};
constexpr uint32_t kChunkHeaderSize = offsetof(PluginChunk, fData);

// The effect-parameters object of an AAX effect: the parameters the host sees, their values and
// texts, and the state chunks. This base keeps the values in its parameter manager; a derived
// effect creates the parameters in EffectInit and follows their changes. Its own chunk, given
// for any identifier a derived effect does not claim, holds every parameter's value as lines of
// "identifier=value". Texts are UTF-8 into the caller's buffer of `capacity` bytes (terminated).
class TORVANE_API KEffectParameters {
public:
  KEffectParameters() = default;
  KEffectParameters(const KEffectParameters&) = delete;
  KEffectParameters& operator=(const KEffectParameters&) = delete;
  virtual ~KEffectParameters() = default;

  // The host's objects (any may be null), then EffectInit.
  virtual Result Initialize(IController* controller, IAutomationDelegate* automation);
  // The host's last reference: the object deletes itself (in the library that made it).
  virtual void Release() noexcept { delete this; }

  virtual Result EffectInit() { return kSuccess; }
  virtual Result GetChunkSize(ChunkId id, uint32_t* size) const;
  virtual Result GetChunk(ChunkId id, PluginChunk* chunk) const;
  virtual Result SetChunk(ChunkId id, const PluginChunk* chunk);
  // The host's word on a value (automation playback, a control surface, its echo of a send).
  virtual Result UpdateParameterNormalizedValue(ParamId id, double normalized);
  virtual Result GetParameterStringFromValue(ParamId id, double normalized, char* text, int32_t capacity) const;
  virtual Result GetParameterNormalizedValue(ParamId id, double* normalized) const;
  // A change from the plug-in's side: goes to the host as automation when a delegate is there,
  // and lands as an update.
  virtual Result SetParameterNormalizedValue(ParamId id, double normalized);
  virtual Result SetParameterNormalizedRelative(ParamId id, double delta);
  // The name cut to `length` bytes (whole characters); the buffer holds `length` + 1.
  virtual Result GetParameterNameOfLength(ParamId id, char* name, int32_t length) const;
  virtual Result GetParameterName(ParamId id, char* name, int32_t capacity) const;
  // The host's periodic call on its user-interface thread.
  virtual Result TimerWakeup() { return kSuccess; }

  KParameterManager& Parameters() noexcept { return parameters_; }
  const KParameterManager& Parameters() const noexcept { return parameters_; }

protected:
  IController* Controller() const noexcept { return controller_; }
  IAutomationDelegate* Automation() const noexcept { return automation_; }
  // `text` into a chunk the host sized by GetChunkSize.
  static Result FillChunk(const std::string& text, PluginChunk* chunk) noexcept;
  // UTF-8 `text` cut to whole characters that fit `capacity` - 1 bytes, terminated.
  static void CopyText(const KString& text, char* to, int32_t capacity);

private:
  std::string ValuesText() const;

  KParameterManager parameters_;
  IController* controller_ = nullptr;
  IAutomationDelegate* automation_ = nullptr;
};

}  // namespace KAAX
