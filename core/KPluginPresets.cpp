// The plug-in's presets and its undo history: what the editor offers around the state.
#include <string>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "core/KPresetStore.h"
#include "core/KXMLReader.h"
#include "core/KStateSection.h"
#include "core/KAudioPluginHost.h"
#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "kernel/KModule.h"

KModule& KAudioPlugin::Module() const {
  if (module_) return *module_;
  if (identifier_.IsEmpty()) throw KException("This plug-in has no name, so it has no folder for presets.");
  return *KModuleMap::Instance().Acquire(identifier_);
}

void KAudioPlugin::FollowActivePreset(const KPresetStore& store) {
  globals_.preset = activePreset_.name;
  globals_.presetIndex = activePreset_.name.IsEmpty() ? -1 : store.ListNames().IndexOf(activePreset_.name);
}

void KAudioPlugin::TellHostSettingsChanged() noexcept {
  KGuard("KAudioPlugin::TellHostSettingsChanged", [this] {
    if (KAudioPluginHost* host = Interface()) host->NotifyPresetChanged();
  });
}

void KAudioPlugin::SavePreset(const KString& name) {
  KPresetStore store(Module());
  Element state;
  StoreState(state);
  store.Store(name, state);
  activePreset_ = {name, true};
  FollowActivePreset(store);
}

void KAudioPlugin::LoadPreset(const KString& name) {
  KPresetStore store(Module());
  Element preset = store.Load(name);  // a preset that cannot be read changes nothing
  RequireStateRoot(preset);
  undo_.UndoStoreSettings();
  StoreSections(preset, 0, Scope::kPresetSound);
  RequestJump();
  activePreset_ = {name, true};
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
  activePreset_ = {KString::FromUtf8(preset.name), true};
  globals_.preset = activePreset_.name;
  globals_.presetIndex = -1;  // not one of the user's presets
  TellHostSettingsChanged();
}

KStringList KAudioPlugin::ListPresets() const { return KPresetStore(Module()).ListNames(); }

void KAudioPlugin::RenamePreset(const KString& from, const KString& to) {
  KPresetStore store(Module());
  store.Rename(from, to);
  if (activePreset_.name == from) activePreset_.name = to;
  FollowActivePreset(store);
}

void KAudioPlugin::DeletePreset(const KString& name) {
  KPresetStore store(Module());
  store.Delete(name);
  if (activePreset_.name == name) activePreset_ = {};
  FollowActivePreset(store);
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
