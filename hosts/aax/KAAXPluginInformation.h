#pragma once

#include <cstdint>

#include "hosts/aax/KAAXBase.h"
#include "hosts/aax/KAAXProcessContext.h"

class KAAXGUI;
namespace KAAX {
class KEffectParameters;
}

// What a host's registration needs to know of one plug-in: names, identifiers, a stem format
// pair (with its own plug-in identifier) per channel configuration, and the entries through
// which the host makes and runs instances.
struct KAAXPluginInformation {
  static constexpr int32_t kMaxConfigurations = 4;
  struct Configuration {
    uint32_t inputStem;      // kStemFormatNone for an instrument
    uint32_t outputStem;
    uint32_t sideChainStem;  // kStemFormatNone without a side-chain input
    uint32_t pluginId;       // the native plug-in identifier of this configuration
  };

  char key[64];   // the registry key, for createInstance
  char name[64];
  uint32_t category;  // KAAX::kCategory... bits
  uint32_t manufacturerId;
  uint32_t productId;
  int32_t configurationCount;
  Configuration configurations[kMaxConfigurations];
  bool acceptsMIDI;
  bool producesMIDI;

  KAAX::KEffectParameters* (*createInstance)(const char* pluginName, const char* subName);
  KAAXGUI* (*createGUI)(KAAX::KEffectParameters* effect);
  void (*processCallback)(KAAXProcessContext* const instances[], const void* end);
};

namespace KAAX {
// The plug-ins a library registers with the host (ACFRegisterPlugin).
class IACFPluginDefinition {
public:
  virtual int32_t Count() const = 0;
  virtual const KAAXPluginInformation* At(int32_t index) const = 0;
  // The host's last reference: the definition deletes itself.
  virtual void Release() noexcept = 0;

protected:
  ~IACFPluginDefinition() = default;
};

// The interface version the declarations here follow, as ACFGetSDKVersion reports it: the
// version in the upper 32 bits, the revision in the lower.
constexpr uint64_t kSDKVersion = (uint64_t{0x0204} << 32) | 0;
}  // namespace KAAX
