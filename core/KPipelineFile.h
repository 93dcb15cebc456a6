#pragma once

#include <cstdint>
#include <vector>

#include "core/Element.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"

// An effect pipeline as a document: the same element in an "Effect pipeline file" and, under
// "PluginSettings", in the state of the plug-in that hosts the pipeline.
//   <EffectPipeline>
//     <Module Key="Compressor" Slot="2" Bypass="1">   one per module, in processing order
//       <TorvaneState .../>                            the module's own state document
//     </Module>
//   </EffectPipeline>
// Key names the module in the effect-module registry; Slot says which of the host's parameter
// slots carries its parameters (absent: the first free one); Bypass is absent when off.
struct KPipelineModule {
  KString key;
  int32_t slot = -1;  // -1: the first free slot
  bool bypass = false;
  Element state;
};

namespace KPipelineFile {
inline constexpr const char* kRoot = "EffectPipeline";
inline constexpr const char* kExtension = "tvpipe";

TORVANE_API Element Write(const std::vector<KPipelineModule>& modules);
// KException with a sentence for the user when `document` is no pipeline or a module entry
// has no key; the modules are not looked up here.
TORVANE_API std::vector<KPipelineModule> Read(const Element& document);
// A state document of a pipeline host that holds `document` and nothing else, for loaders that
// take whole states.
TORVANE_API Element StateDocument(const Element& document);
}  // namespace KPipelineFile
