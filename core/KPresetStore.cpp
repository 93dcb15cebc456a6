#include "core/KPresetStore.h"

#include <optional>

#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"
#include "kernel/KException.h"
#include "kernel/KFileStore.h"
#include "kernel/KFormat.h"
#include "kernel/KModule.h"

namespace {
const KString kPresetsRoot = "Presets";
const KString kPresetElement = "Preset";
const KString kNameAttribute = "Name";
const KString kConfigurationRoot = "Configuration";

// The tree of a settings file, an empty root when the file is missing. A file that does not
// read as the expected document is reported with its path and never treated as empty, so
// that no change can overwrite what the user may still recover.
Element ReadDocument(const std::string& path, const KString& rootName, const KString& kind) {
  const std::optional<std::string> text = KFileStore::ReadTextIfExists(path);
  if (!text) return Element(rootName);
  Element root;
  try {
    root = KXMLReader::Read(*text);
  } catch (const KException& e) {
    throw KException(KFormatText("Could not read the file '{0}'. {1}", KString::FromUtf8(path), e.Message()));
  }
  if (root.GetName() != rootName) throw KException(KFormatText("The file '{0}' is not a {1} file.", KString::FromUtf8(path), kind));
  return root;
}

// The name of a child that is a preset, or null for anything else the file holds.
const KString* PresetName(const Element& child) noexcept {
  return child.GetName() == kPresetElement ? child.FindAttribute(kNameAttribute) : nullptr;
}

// Index of the first preset of that name among the children of `presets`, or -1.
int32_t FindPreset(const Element& presets, const KString& name) {
  for (int32_t i = 0; i < presets.ChildCount(); ++i) {
    const KString* found = PresetName(presets.GetChild(i));
    if (found && *found == name) return i;
  }
  return -1;
}

void RequireName(const KString& name) {
  if (name.IsEmpty()) throw KException("A preset needs a name.");
}

int32_t RequirePreset(const Element& presets, const KString& name) {
  const int32_t index = FindPreset(presets, name);
  if (index < 0) throw KException(KFormatText("There is no preset named '{0}'.", name));
  return index;
}
}  // namespace

KPresetStore::KPresetStore(const KModule& module)
    : presetsPath_(module.GetDataPath_User() + "presets.xml"),
      configurationPath_(KModule::GetDataPath_Shared() + "KPluginConfiguration.xml") {}

KStringList KPresetStore::ListNames() const {
  const Element presets = ReadPresets();
  KStringList names;
  for (int32_t i = 0; i < presets.ChildCount(); ++i)
    if (const KString* name = PresetName(presets.GetChild(i))) names.Append(*name);
  return names;
}

Element KPresetStore::Load(const KString& name) const {
  const Element presets = ReadPresets();
  const Element& preset = presets.GetChild(RequirePreset(presets, name));
  if (preset.ChildCount() == 0) throw KException(KFormatText("The preset '{0}' holds no settings.", name));
  return preset.GetChild(0);
}

void KPresetStore::Store(const KString& name, const Element& state) {
  RequireName(name);
  Element presets = ReadPresets();
  Element preset(kPresetElement);
  preset.SetAttribute(kNameAttribute, name);
  preset.AddChild(state);
  const int32_t index = FindPreset(presets, name);
  if (index >= 0) presets.GetChild(index) = std::move(preset);
  else presets.AddChild(std::move(preset));
  WritePresets(presets);
}

void KPresetStore::Rename(const KString& from, const KString& to) {
  RequireName(to);
  Element presets = ReadPresets();
  const int32_t index = RequirePreset(presets, from);
  if (from == to) return;
  if (FindPreset(presets, to) >= 0) throw KException(KFormatText("A preset named '{0}' already exists.", to));
  presets.GetChild(index).SetAttribute(kNameAttribute, to);
  WritePresets(presets);
}

void KPresetStore::Delete(const KString& name) {
  Element presets = ReadPresets();
  const int32_t index = RequirePreset(presets, name);
  // Element offers no removal of a child: rebuild the root without it.
  Element rest(presets.GetName());
  rest.SetText(presets.GetText());
  for (const Element::Attribute& attribute : presets.Attributes()) rest.SetAttribute(attribute.name, attribute.value);
  for (int32_t i = 0; i < presets.ChildCount(); ++i)
    if (i != index) rest.AddChild(std::move(presets.GetChild(i)));
  WritePresets(rest);
}

Element KPresetStore::LoadConfiguration() const { return ReadDocument(configurationPath_, kConfigurationRoot, "configuration"); }

void KPresetStore::StoreConfiguration(Element configuration) {
  LoadConfiguration();  // refuses to replace a file the user may still repair
  configuration.SetName(kConfigurationRoot);
  KFileStore::WriteTextAtomically(configurationPath_, KXMLWriter::Write(configuration));
}

Element KPresetStore::ReadPresets() const { return ReadDocument(presetsPath_, kPresetsRoot, "presets"); }

void KPresetStore::WritePresets(const Element& presets) const { KFileStore::WriteTextAtomically(presetsPath_, KXMLWriter::Write(presets)); }
