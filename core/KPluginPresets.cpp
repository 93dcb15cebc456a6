// The plug-in's presets and its undo history: what the editor offers around the state.
#include <string>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "core/KPresetStore.h"
#include "core/KXMLReader.h"
#include "core/KStateSection.h"
#include "core/KAudioPluginHost.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KGuard.h"
#include "kernel/KModule.h"

namespace {
constexpr const char* kFactoryNameTaken = "'{0}' is the name of a factory preset; please choose another name.";
}  // namespace

KModule& KAudioPlugin::Module() const {
  if (module_) return *module_;
  if (identifier_.IsEmpty()) throw KException("This plug-in has no name, so it has no folder for presets.");
  return *KModuleMap::Instance().Acquire(identifier_);
}

void KAudioPlugin::FollowActivePreset(const KPresetStore& store) {
  globals_.preset = activePreset_.name;
  int32_t index = -1;
  if (activePreset_.factory) {
    index = FactoryPresetNames().IndexOf(activePreset_.name);
  } else if (!activePreset_.name.IsEmpty()) {
    const int32_t user = store.ListNames().IndexOf(activePreset_.name);
    if (user >= 0) index = FactoryPresetCount() + user;
  }
  globals_.presetIndex = index;
}

void KAudioPlugin::TellHostSettingsChanged() noexcept {
  KGuard("KAudioPlugin::TellHostSettingsChanged", [this] {
    if (KAudioPluginHost* host = Interface()) host->NotifyPresetChanged();
  });
}

KStringList KAudioPlugin::FactoryPresetNames() const {
  KStringList names;
  for (const KFactoryPreset& preset : factoryPresets_) names.Append(KString::FromUtf8(preset.name));
  return names;
}

const KFactoryPreset* KAudioPlugin::FindFactoryPreset(const KString& name) const {
  const int32_t index = FactoryPresetNames().IndexOf(name);
  return index < 0 ? nullptr : &factoryPresets_[static_cast<size_t>(index)];
}

void KAudioPlugin::RequireUserPresetName(const KString& name, const char* refusal) const {
  if (FindFactoryPreset(name)) throw KException(KFormatText(KString::Static(refusal), name));
}

KStringList KAudioPlugin::ListPresets() const {
  KStringList names = FactoryPresetNames();
  for (const KString& name : KPresetStore(Module()).ListNames()) names.Append(name);
  return names;
}

void KAudioPlugin::SelectPreset(int32_t index) {
  if (index >= 0 && index < FactoryPresetCount()) return LoadFactoryPreset(factoryPresets_[static_cast<size_t>(index)]);
  KPresetStore store(Module());
  const KStringList names = store.ListNames();
  const int32_t user = index - FactoryPresetCount();
  if (index < 0 || user >= names.Count()) throw KException(KFormatText("There is no preset number {0}.", index));
  LoadUserPreset(store, names[user]);
}

void KAudioPlugin::SavePreset(const KString& name) {
  RequireUserPresetName(name, kFactoryNameTaken);
  KPresetStore store(Module());
  Element state;
  StoreState(state);
  store.Store(name, state);
  activePreset_ = {name, true, false};
  FollowActivePreset(store);
  TellHostSettingsChanged();  // the host's list of presets grew
}

void KAudioPlugin::LoadPreset(const KString& name) {
  if (const KFactoryPreset* preset = FindFactoryPreset(name)) return LoadFactoryPreset(*preset);
  LoadUserPreset(KPresetStore(Module()), name);
}

void KAudioPlugin::LoadUserPreset(const KPresetStore& store, const KString& name) {
  Element preset = store.Load(name);  // a preset that cannot be read changes nothing
  RequireStateRoot(preset);
  undo_.UndoStoreSettings();
  StoreSections(preset, 0, Scope::kPresetSound);
  RequestJump();
  activePreset_ = {name, true, false};
  FollowActivePreset(store);
  TellHostSettingsChanged();
}

void KAudioPlugin::LoadFactoryPreset(const KFactoryPreset& preset) {
  // The sound as a preset document holds it, so that it loads exactly as a saved one would.
  Element sound(KString::Static(kStateRoot));
  Element parameters(KString::Static("Parameters"));
  KStateSection values(parameters, kStore);
  for (const KFactoryPreset::Value& value : preset.values) {
    const KString key = KString::Static(value.key);
    const Parameter* parameter = FindParameter(key);
    if (!parameter) throw KException(KString::FromUtf8(std::string("The preset \"") + preset.name + "\" names no parameter \"" + value.key + "\"."));
    double working = value.working;
    values.ExactNumber(key, working, parameter->Kind().ToWorking(parameter->DefaultNormalized()));
  }
  sound.AddChild(std::move(parameters));
  if (preset.settings) sound.AddChild(KXMLReader::Read(preset.settings));
  undo_.UndoStoreSettings();
  StoreSections(sound, 0, Scope::kPresetSound);
  RequestJump();
  activePreset_ = {KString::FromUtf8(preset.name), true, true};
  globals_.preset = activePreset_.name;
  // Its place among the plug-in's own; a sound from elsewhere has none.
  const KFactoryPreset* first = factoryPresets_.data();
  const bool own = first && &preset >= first && &preset < first + factoryPresets_.size();
  globals_.presetIndex = own ? static_cast<int32_t>(&preset - first) : -1;
  TellHostSettingsChanged();
}

// Renaming and deleting touch the user's presets alone; a name only the factory knows is refused
// with a sentence that says why.
void KAudioPlugin::RenamePreset(const KString& from, const KString& to) {
  RequireUserPresetName(to, kFactoryNameTaken);
  KPresetStore store(Module());
  if (store.ListNames().IndexOf(from) < 0) RequireUserPresetName(from, "'{0}' is a factory preset, which cannot be renamed.");
  store.Rename(from, to);
  if (!activePreset_.factory && activePreset_.name == from) activePreset_.name = to;
  FollowActivePreset(store);
  TellHostSettingsChanged();
}

void KAudioPlugin::DeletePreset(const KString& name) {
  KPresetStore store(Module());
  if (store.ListNames().IndexOf(name) < 0) RequireUserPresetName(name, "'{0}' is a factory preset, which cannot be deleted.");
  store.Delete(name);
  if (!activePreset_.factory && activePreset_.name == name) activePreset_ = {};
  FollowActivePreset(store);
  TellHostSettingsChanged();
}

double KAudioPlugin::GetParameterValue(int32_t index) const { return GetParameter(index).Normalized(); }
void KAudioPlugin::SetParameterValue(int32_t index, double value) { GetParameter(index).SetNormalized(value); }

void KAudioPlugin::UndoStore(int32_t index, double value) noexcept {
  undo_.UndoStore(index, value);
  activePreset_.current = false;
}

void KAudioPlugin::UndoStoreSettings() noexcept {
  undo_.UndoStoreSettings();  // the snapshot still says the preset was current
  activePreset_.current = false;
}

void KAudioPlugin::Undo() noexcept {
  undo_.Undo();
  TellHostSettingsChanged();
}

void KAudioPlugin::Redo() noexcept {
  undo_.Redo();
  TellHostSettingsChanged();
}
