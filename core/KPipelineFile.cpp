#include "core/KPipelineFile.h"

#include "core/KAudioPlugin.h"
#include "kernel/KException.h"

namespace {
const KString kModule = KString::Static("Module");
const KString kKey = KString::Static("Key");
const KString kSlot = KString::Static("Slot");
const KString kBypass = KString::Static("Bypass");
}  // namespace

Element KPipelineFile::Write(const std::vector<KPipelineModule>& modules) {
  Element document(KString::Static(kRoot));
  for (const KPipelineModule& module : modules) {
    Element& entry = document.AddChild(kModule);
    entry.SetAttribute(kKey, module.key);
    if (module.slot >= 0) entry.SetAttribute(kSlot, KString::FromUtf8(std::to_string(module.slot)));
    if (module.bypass) entry.SetAttribute(kBypass, KString::Static("1"));
    entry.AddChild(module.state);
  }
  return document;
}

std::vector<KPipelineModule> KPipelineFile::Read(const Element& document) {
  if (document.GetName() != KString::Static(kRoot)) throw KException("This is not an effect pipeline.");
  std::vector<KPipelineModule> modules;
  for (int32_t i = 0; i < document.ChildCount(); ++i) {
    const Element& entry = document.GetChild(i);
    if (entry.GetName() != kModule) continue;  // room for what later versions add
    KPipelineModule module;
    module.key = entry.GetAttribute(kKey);
    if (module.key.IsEmpty()) throw KException("An effect pipeline names a module without its key.");
    const std::string slot = entry.GetAttribute(kSlot).ToUtf8();
    module.slot = -1;
    if (!slot.empty() && slot.find_first_not_of("0123456789") == std::string::npos && slot.size() < 6) module.slot = std::stoi(slot);
    module.bypass = entry.GetAttribute(kBypass).ToUtf8() == "1";
    if (const Element* state = entry.FindChild(KString::Static(KAudioPlugin::kStateRoot))) module.state = *state;
    else module.state = Element(KString::Static(KAudioPlugin::kStateRoot));
    modules.push_back(std::move(module));
  }
  return modules;
}

Element KPipelineFile::StateDocument(const Element& document) {
  Element state(KString::Static(KAudioPlugin::kStateRoot));
  state.AddChild(KString::Static("PluginSettings")).AddChild(document);
  return state;
}
