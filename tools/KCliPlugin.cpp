#include "tools/KCliPlugin.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <fstream>
#include <sstream>
#include <vector>

#include "core/Element.h"
#include "core/KPipelineFile.h"
#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KRegistries.h"
#include "tools/KCliArguments.h"
#include "tools/KSuggestions.h"

namespace {

std::string Number(double value) { return KFormatText("{0}", value).ToUtf8(); }

// A leading decimal number (an optional sign, no infinities); `rest` is what follows it, trimmed.
bool LeadingNumber(const std::string& text, double& value, std::string& rest) {
  const size_t first = text.find_first_not_of(" \t");
  if (first == std::string::npos) return false;
  const char* begin = text.data() + first + (text[first] == '+' ? 1 : 0);
  const char* end = text.data() + text.size();
  const auto result = std::from_chars(begin, end, value);
  if (result.ec != std::errc() || !std::isfinite(value)) return false;
  rest = std::string(result.ptr, end);
  rest.erase(0, std::min(rest.find_first_not_of(" \t"), rest.size()));
  rest.erase(rest.find_last_not_of(" \t") + 1);
  return true;
}

// Whether text whose value `working` the kind put at an end of its range lay beyond that end.
// The kind clamps while reading and its unit may scale the number ("5 s" for a kind shown in
// ms), so the number is nudged both ways: a value beyond the end stays clamped either way,
// one on the end moves inside for one of them.
bool ClampedByKind(const KValueKind& kind, const std::string& number, const std::string& rest, double working) {
  double value;
  std::string ignored;
  if (!LeadingNumber(number, value, ignored)) return false;
  const double nudge = std::max(std::fabs(value), 1.0) * 1e-9;
  for (const double nudged : {value - nudge, value + nudge}) {
    char digits[64];
    const auto written = std::to_chars(digits, digits + sizeof(digits), nudged);
    double moved;
    if (!kind.FromText(KString::FromUtf8(std::string(digits, written.ptr) + " " + rest), moved) || moved != working) return false;
  }
  return true;
}

}  // namespace

std::string KCliPlugin::ResolveName(const std::string& name) {
  const KStringList& keys = GetTorvanePluginList();  // builds the registries
  const KPluginRegistry& main = KRegistries::Instance().Main();
  const KPluginRegistry& modules = KRegistries::Instance().Modules();
  std::vector<std::string> known;
  for (const KString& key : keys) {
    known.push_back(key.ToUtf8());
    if (KLowerCase(known.back()) == KLowerCase(name)) return known.back();
  }
  for (int32_t m = 0; m < modules.Count(); ++m) {
    known.push_back(modules.Record(m).key.ToUtf8());
    if (KLowerCase(known.back()) != KLowerCase(name)) continue;
    for (int32_t p = 0; p < main.Count(); ++p)
      if (main.Record(p).factory == modules.Record(m).factory) return main.Record(p).key.ToUtf8();
  }
  KCliFail("Unknown plug-in '" + name + "'." + KSuggestions(name, known) + " 'torvane list' shows them all.");
}

KCliPlugin::KCliPlugin(const std::string& name) : plugin_(CreateTorvanePlugin(KString::FromUtf8(ResolveName(name)))) {
  if (!plugin_) throw KException({});  // the kernel has told the user why
  host_ = std::make_unique<KCliHost>(*plugin_);
  plugin_->SetInterface(host_.get());
}

KCliPlugin::~KCliPlugin() {
  if (plugin_) plugin_->SetInterface(nullptr);
}

KAudioPluginBase::Parameter& KCliPlugin::Find(const std::string& key) {
  if (KAudioPluginBase::Parameter* parameter = plugin_->FindParameter(KString::FromUtf8(key))) return *parameter;
  std::vector<std::string> keys;
  for (int32_t i = 0; i < plugin_->ParameterCount(); ++i) {
    keys.push_back(plugin_->GetParameter(i).Key().ToUtf8());
    if (KLowerCase(keys.back()) == KLowerCase(key)) return plugin_->GetParameter(i);
  }
  KCliFail("Unknown parameter '" + key + "' of " + plugin_->Identifier().ToUtf8() + "." + KSuggestions(key, keys));
}

double KCliPlugin::WorkingValue(const KAudioPluginBase::Parameter& parameter, const std::string& text) {
  const KValueKind& kind = parameter.Kind();
  const std::string key = "'" + parameter.Key().ToUtf8() + "'";
  double value, working;
  std::string rest;
  const bool numeric = LeadingNumber(text, value, rest);
  if (numeric && rest.empty()) {  // working units
    if (value < kind.Minimum() || value > kind.Maximum())
      KCliFail("The value " + text + " of " + key + " is out of range (" + Number(kind.Minimum()) + " to " + Number(kind.Maximum()) + ").");
    return value;
  }
  if (kind.FromText(KString::FromUtf8(text), working)) {
    const bool atEnd = working == kind.Minimum() || working == kind.Maximum();
    const bool beyond = kind.Steps() > 0 ? numeric && (value < kind.Minimum() || value > kind.Maximum())
                                         : numeric && atEnd && ClampedByKind(kind, text, rest, working);
    const std::string unit = parameter.Unit().IsEmpty() ? "" : " " + parameter.Unit().ToUtf8();
    if (beyond)
      KCliFail("The value " + text + " of " + key + " is out of range (" + kind.ToText(kind.Minimum()).ToUtf8() + unit + " to " +
               kind.ToText(kind.Maximum()).ToUtf8() + unit + ").");
    return working;
  }
  std::string expected = "a number from " + Number(kind.Minimum()) + " to " + Number(kind.Maximum());
  if (kind.Steps() > 0 && kind.Steps() < 32) {
    expected = "one of ";
    for (int32_t i = 0; i <= kind.Steps(); ++i) expected += (i ? ", " : "") + kind.ToText(kind.Minimum() + i).ToUtf8();
  }
  KCliFail("'" + text + "' is not a value of " + key + ": expected " + expected + ".");
}

void KCliPlugin::Set(const std::string& assignment) {
  const size_t equals = assignment.find('=');
  if (equals == std::string::npos || equals == 0) KCliFail("--set takes KEY=VALUE, not '" + assignment + "'.");
  KAudioPluginBase::Parameter& parameter = Find(assignment.substr(0, equals));
  parameter.SetWorking(WorkingValue(parameter, assignment.substr(equals + 1)));
}

void KCliPlugin::LoadPreset(const std::string& fileOrName) {
  const std::string identifier = plugin_->Identifier().ToUtf8();
  std::ifstream file(fileOrName, std::ios::binary);
  if (!file) {
    // Factory presets first, as listed; the one matched is the one loaded.
    const KStringList names = plugin_->ListPresets();
    for (int32_t i = 0; i < names.Count(); ++i) {
      if (KLowerCase(names[i].ToUtf8()) != KLowerCase(fileOrName)) continue;
      plugin_->SelectPreset(i);
      return;
    }
    std::vector<std::string> known;
    for (const KString& name : names) known.push_back(name.ToUtf8());
    KCliFail("There is no preset file, factory preset or saved preset '" + fileOrName + "' of " + identifier + "." + KSuggestions(fileOrName, known));
  }
  std::ostringstream text;
  text << file.rdbuf();
  auto unreadable = [&](const KException& failure) {
    KCliFail("The preset file '" + fileOrName + "' cannot be loaded: " + failure.Message().ToUtf8());
  };
  Element state;
  try {
    state = KXMLReader::Read(text.str());
  } catch (const KException& failure) {
    unreadable(failure);
  }
  if (state.GetName() == KString::Static(KPipelineFile::kRoot)) {
    // An effect pipeline file: what a pipeline host loads as its whole chain.
    const KStringList& hosts = KRegistries::Instance().PipelineHosts();
    if (hosts.IndexOf(plugin_->Identifier()) < 0)
      KCliFail("The file '" + fileOrName + "' is an effect pipeline; load it into " +
               (hosts.Count() > 0 ? hosts[0].ToUtf8() : std::string("a pipeline host")) + ", not " + identifier + ".");
    state = KPipelineFile::StateDocument(state);
  }
  const std::string owner = state.GetAttribute(KString::Static("Plugin")).ToUtf8();
  if (!owner.empty() && owner != identifier)
    KCliFail("The preset file '" + fileOrName + "' holds the state of " + owner + ", not of " + identifier + ".");
  try {
    plugin_->LoadState(std::move(state));
  } catch (const KException& failure) {
    unreadable(failure);
  }
}

void KCliPlugin::ApplySettings(const KCliArguments& arguments) {
  for (const KCliArguments::Option& option : arguments.Options()) {
    if (option.name == "set") Set(option.value);
    else if (option.name == "preset") LoadPreset(option.value);
  }
}

std::string KCliPlugin::StateText() {
  Element root(KString::Static(KAudioPlugin::kStateRoot));
  plugin_->StoreState(root);
  return KXMLWriter::Write(root);
}
