// The plug-in's state document: the section routines and the entry points that store, write,
// read and load the whole state.
#include <cmath>
#include <utility>

#include "core/KAudioPlugin.h"
#include "core/KChannelMode.h"
#include "core/KParameter.h"
#include "core/KStateSection.h"
#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"
#include "kernel/KException.h"

namespace {
// How far from the direct conversion the exact normalised value of a stored one is sought.
constexpr int32_t kSearchSteps = 16;

// Curves round: converting a stored working value back may land a few steps of the
// normalised value away from the one it was stored from, and storing again would then write
// another text. The normalised value whose working value is exactly the stored one, when there
// is one that close, keeps store -> load -> store identical; otherwise the nearest.
double NormalizedFor(const KValueKind& kind, double working) noexcept {
  double best = kind.ToNormalized(working);
  double bestError = std::fabs(kind.ToWorking(best) - working);
  for (const double toward : {-1.0, 2.0}) {
    double normalized = best;
    for (int32_t step = 0; step < kSearchSteps && bestError > 0.0; ++step) {
      normalized = std::nextafter(normalized, toward);
      const double error = std::fabs(kind.ToWorking(normalized) - working);
      if (error < bestError) best = normalized, bestError = error;
    }
  }
  return best;
}

// A section this product does not interpret: loading keeps a copy, storing writes it back.
void KeepAsFound(Element& kept, Element& section, uint32_t flags) {
  if (!(flags & KAudioPlugin::kStore)) {
    kept = section;
    return;
  }
  KString name = section.GetName();
  section = kept;
  section.SetName(std::move(name));
}

// Element offers no removal of children: the element is rebuilt without those of `name`.
void RemoveChildren(Element& element, const KString& name) {
  Element rest(element.GetName());
  rest.SetText(element.GetText());
  for (const Element::Attribute& attribute : element.Attributes()) rest.SetAttribute(attribute.name, attribute.value);
  for (int32_t i = 0; i < element.ChildCount(); ++i)
    if (element.GetChild(i).GetName() != name) rest.AddChild(std::move(element.GetChild(i)));
  element = std::move(rest);
}

// One "Controller" child, both directions. Number and parameter have no default, so they are
// always written; an entry loaded without them is dropped (no parameter has an empty key, and
// Assign refuses the number -1).
void StoreAssignment(KStateSection& entry, KControllerMap::Assignment& assignment, KString& key) {
  entry.Integer("Number", assignment.number, -1);
  entry.Integer("Channel", assignment.channel, 0);
  entry.Text("Parameter", key, {});
}
}  // namespace

// A plug-in on a surround channel set starts in the surround mode; stereo and mono in "Left + Right".
int32_t KAudioPlugin::DefaultChannelMode() const noexcept {
  return ChannelsPerBus() > 2 ? KChannelMode::kSurround : KChannelMode::kLeftRight;
}

void KAudioPlugin::StoreGlobal(Element& section, uint32_t flags) {
  KStateSection s(section, flags);
  const KGlobalSettings defaults;
  KGlobalSettings& g = globals_;
  if (s.Storing()) section.SetAttribute("Version", KString(TORVANE_VERSION));

  int32_t mode = ChannelMode();
  s.Choice("ChannelMode", mode, DefaultChannelMode(), KChannelMode::kNames);
  if (!s.Storing()) SetChannelMode(mode);

  s.Unsigned("SurroundChannelsEnable", g.surroundChannelsEnable, defaults.surroundChannelsEnable);
  s.Integer("AmbisonicsOrder", g.ambisonicsOrder, defaults.ambisonicsOrder);
  s.Number("SurroundVolume", g.surroundVolume, defaults.surroundVolume);
  s.Integer("Channel", g.surroundChannel, defaults.surroundChannel);
  s.Flag("EnableSurroundProcessing", g.enableSurroundProcessing, defaults.enableSurroundProcessing);

  s.Flag("MIDIProgramChangeEnable", g.midiProgramChangeEnable, defaults.midiProgramChangeEnable);
  s.Integer("PreviousNextPresetController", g.previousNextPresetController, defaults.previousNextPresetController);
  s.Flag("SimulateProgramChange", g.simulateProgramChange, defaults.simulateProgramChange);
  s.Child("ProgramChange", [&](Element& child, uint32_t childFlags) {
    KStateSection p(child, childFlags);
    const KGlobalSettings::ProgramChange& d = defaults.programChange;
    KGlobalSettings::ProgramChange& c = g.programChange;
    p.IntegerList("Values", c.values);
    p.Text("Folder", c.folder, d.folder);
    p.Integer("Controller", c.controller, d.controller);
    p.Integer("Channel", c.channel, d.channel);
    p.Flag("Enabled", c.enabled, d.enabled);
  });

  bool bypass = IsBypassed();
  s.Flag("Bypass", bypass, false);
  if (!s.Storing()) SetBypass(bypass);
  s.Flag("SmartBypass", g.smartBypass, defaults.smartBypass);

  s.Integer("MaxLFOBlockSizeOffline", g.maxLFOBlockSizeOffline, defaults.maxLFOBlockSizeOffline);
  s.Flag("RandomizerCompensation", g.randomizerCompensation, defaults.randomizerCompensation);
  s.Flag("Limiter", g.limiter, defaults.limiter);
  s.Flag("AuditionDifference", g.auditionDifference, defaults.auditionDifference);
  s.Flag("EnableLatencyReporting", g.enableLatencyReporting, defaults.enableLatencyReporting);
  s.Flag("DisableOnSilence", g.disableOnSilence, defaults.disableOnSilence);

  s.Choice("Upsampling", g.upsampling, defaults.upsampling, KGlobalSettings::kUpsamplingNames);
  s.Choice("UpsamplingOffline", g.upsamplingOffline, defaults.upsamplingOffline, KGlobalSettings::kUpsamplingNames);
  s.Flag("HQUpsampling", g.hqUpsampling, defaults.hqUpsampling);

  s.Integer("PresetIndex", g.presetIndex, defaults.presetIndex);
  s.Text("Preset", g.preset, defaults.preset);

  s.IntegerPair("EditorSize", g.editorSize, defaults.editorSize);
  s.IntegerPair("EditorSizeEasy", g.editorSizeEasy, defaults.editorSizeEasy);
}

void KAudioPlugin::StoreParameters(Element& section, uint32_t flags, Scope scope) {
  KStateSection s(section, flags);
  for (int32_t i = 0; i < ParameterCount(); ++i) {
    if (!s.Storing() && scope == Scope::kPresetSound && locked_[i]) continue;
    Parameter& parameter = GetParameter(i);
    // The working value's default is compared, not the normalised one: stepped kinds map many
    // normalised values to one working value, and a text must mean the same value either way.
    const double fallback = parameter.Kind().ToWorking(parameter.DefaultNormalized());
    double working = parameter.UnmodulatedWorking();
    s.ExactNumber(parameter.Key(), working, fallback);
    if (s.Storing()) continue;
    parameter.SetNormalized(working == fallback ? parameter.DefaultNormalized() : NormalizedFor(parameter.Kind(), working));
  }
}

void KAudioPlugin::StoreMultiParameters(Element& section, uint32_t flags) {
  KeepAsFound(multiParameters_, section, flags);
  if (!(flags & kStore)) multi_.Read(multiParameters_, *this);
}
void KAudioPlugin::StoreLFO(Element& section, uint32_t flags) {
  KeepAsFound(lfos_, section, flags);
  if (!(flags & kStore)) SetLFOs(lfos_);
}

void KAudioPlugin::SetLFOs(Element section) {
  lfos_ = std::move(section);
  const KModulatorMaker maker = KGetModulatorMaker();
  modulator_.Publish(maker ? maker(*this, lfos_) : nullptr);
}

void KAudioPlugin::SetMultiParameterSection(Element section) {
  multiParameters_ = std::move(section);
  multi_.Read(multiParameters_, *this);
}

void KAudioPlugin::SetMultiParameter(int32_t index, double value, int32_t glideSamples) {
  multi_.Move(index, value, glideSamples, *this, multiParameters_);
}
void KAudioPlugin::StoreArp(Element& section, uint32_t flags) { KeepAsFound(arpeggiator_, section, flags); }

void KAudioPlugin::StoreParamLock(Element& section, uint32_t flags) {
  KStateSection s(section, flags);
  for (int32_t i = 0; i < ParameterCount(); ++i) s.Flag(GetParameter(i).Key(), locked_[i], false);
}

void KAudioPlugin::StoreControllers(Element& section, uint32_t flags) {
  KStateSection s(section, flags);
  KControllerMap& map = controllers_;
  bool enabled = map.IsEnabled(), notes = map.AreNoteControllersEnabled();
  bool keep = map.DoNotLoadFromPresets(), single = map.IsSingleChannel();
  s.Flag("ControllersEnabled", enabled, true);
  s.Flag("NoteControllersEnabled", notes, true);
  s.Flag("DoNotLoadFromPresets", keep, false);
  s.Flag("SingleChannel", single, false);
  s.Child("NoteControllers", [this](Element& child, uint32_t childFlags) {
    KeepAsFound(noteControllers_, child, childFlags);
  });

  if (s.Storing()) {
    RemoveChildren(section, "Controller");
    for (int32_t i = 0; i < map.Count(); ++i) {
      KControllerMap::Assignment assignment = map.Get(i);
      if (assignment.parameter >= ParameterCount()) continue;  // never heard either
      KString key = GetParameter(assignment.parameter).Key();
      Element& child = section.AddChild("Controller");
      KStateSection entry(child, flags);
      StoreAssignment(entry, assignment, key);
    }
    return;
  }
  map.SetEnabled(enabled);
  map.SetNoteControllersEnabled(notes);
  map.SetDoNotLoadFromPresets(keep);
  map.SetSingleChannel(single);
  map.Clear();
  Element::Iterator it;
  it.Start(section, "Controller");
  while (Element* child = it.Next()) {
    KControllerMap::Assignment assignment{};
    KString key;
    KStateSection entry(*child, flags);
    StoreAssignment(entry, assignment, key);
    // Entries for parameters this plug-in does not have are dropped.
    if (const Parameter* parameter = FindParameter(key)) {
      assignment.parameter = parameter->Index();
      map.Assign(assignment);
    }
  }
}

void KAudioPlugin::StoreActivePresets(Element& section, uint32_t flags) {
  KStateSection s(section, flags);
  s.Text("Name", activePreset_.name, {});
  s.Flag("Current", activePreset_.current, false);
  s.Flag("Factory", activePreset_.factory, false);
}

void KAudioPlugin::StoreSections(Element& root, uint32_t flags, Scope scope) {
  KStateSection state(root, flags);
  const bool whole = scope == Scope::kWholeState;
  auto section = [&](const KString& name, void (KAudioPlugin::*routine)(Element&, uint32_t)) {
    state.Child(name, [&](Element& child, uint32_t childFlags) { (this->*routine)(child, childFlags); });
  };
  // Loading, each routine returns every value it owns to its default before it takes what the
  // document holds (a missing section reads as an empty one), so one pass does both.
  if (whole) StoreGlobal(root, flags);
  state.Child("Parameters", [&](Element& child, uint32_t childFlags) { StoreParameters(child, childFlags, scope); });
  section("PluginSettings", &KAudioPlugin::StorePluginSettings);
  section("MultiParameters", &KAudioPlugin::StoreMultiParameters);
  section("LFOs", &KAudioPlugin::StoreLFO);
  if (whole) section("ParamLock", &KAudioPlugin::StoreParamLock);
  section("Arpeggiator", &KAudioPlugin::StoreArp);
  if (whole || !controllers_.DoNotLoadFromPresets()) section("Controllers", &KAudioPlugin::StoreControllers);
  if (whole) section("ActivePreset", &KAudioPlugin::StoreActivePresets);
}

void KAudioPlugin::StoreState(Element& root, uint32_t flags) {
  root.SetName(KString::Static(kStateRoot));
  KStateSection s(root, flags | kStore);
  KString identifier = identifier_;
  s.Text("Plugin", identifier, {});
  StoreSections(root, flags | kStore, Scope::kWholeState);
}

std::string KAudioPlugin::WriteState() {
  Element root;
  StoreState(root);
  return KXMLWriter::Write(root, "utf-8", KXMLWriter::kCompact);
}

void KAudioPlugin::RequireStateRoot(const Element& root) {
  if (root.GetName() != KString::Static(kStateRoot)) throw KException("These settings are not the state of a plug-in.");
}

void KAudioPlugin::LoadState(Element root) {
  RequireStateRoot(root);
  StoreSections(root, 0, Scope::kWholeState);
  RequestJump();
}

void KAudioPlugin::ReadState(std::string_view text) { LoadState(KXMLReader::Read(text)); }
