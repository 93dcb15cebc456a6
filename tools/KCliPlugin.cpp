#include "tools/KCliPlugin.h"

#include <algorithm>
#include <charconv>
#include <cmath>
#include <fstream>
#include <sstream>
#include <vector>

#include "core/Element.h"
#include "core/KXMLWriter.h"
#include "kernel/KEntryPoints.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "tools/KCliArguments.h"

namespace {

// Letters to add, drop or change to turn one key into the other.
size_t EditDistance(const std::string& a, const std::string& b) {
  std::vector<size_t> row(b.size() + 1);
  for (size_t j = 0; j <= b.size(); ++j) row[j] = j;
  for (size_t i = 1; i <= a.size(); ++i) {
    size_t diagonal = row[0];
    row[0] = i;
    for (size_t j = 1; j <= b.size(); ++j) {
      const size_t above = row[j];
      row[j] = std::min({row[j] + 1, row[j - 1] + 1, diagonal + (a[i - 1] == b[j - 1] ? 0 : 1)});
      diagonal = above;
    }
  }
  return row[b.size()];
}

std::string Number(double value) { return KFormatText("{0}", value).ToUtf8(); }

// A plain decimal number and nothing else.
bool ParseNumber(const std::string& text, double& value) {
  const char* begin = text.data() + (!text.empty() && text[0] == '+' ? 1 : 0);
  const auto result = std::from_chars(begin, text.data() + text.size(), value);
  return result.ec == std::errc() && result.ptr == text.data() + text.size() && std::isfinite(value);
}

}  // namespace

KCliPlugin::KCliPlugin(const std::string& name) : plugin_(CreateTorvanePlugin(KString::FromUtf8(name))) {
  if (!plugin_) throw KException({});
  host_ = std::make_unique<KCliHost>(*plugin_);
  plugin_->SetInterface(host_.get());
}

KCliPlugin::~KCliPlugin() {
  if (plugin_) plugin_->SetInterface(nullptr);
}

KAudioPluginBase::Parameter& KCliPlugin::Find(const std::string& key) {
  if (KAudioPluginBase::Parameter* parameter = plugin_->FindParameter(KString::FromUtf8(key))) return *parameter;
  std::vector<std::pair<size_t, std::string>> close;
  for (int32_t i = 0; i < plugin_->ParameterCount(); ++i) {
    const std::string candidate = plugin_->GetParameter(i).Key().ToUtf8();
    const size_t distance = EditDistance(key, candidate);
    if (distance <= std::max<size_t>(2, key.size() / 3) || candidate.find(key) != std::string::npos)
      close.emplace_back(distance, candidate);
  }
  std::sort(close.begin(), close.end());
  std::string message = "Unknown parameter '" + key + "' of " + plugin_->Identifier().ToUtf8() + ".";
  if (!close.empty()) {
    message += " Did you mean ";
    for (size_t i = 0; i < close.size() && i < 3; ++i) message += (i ? ", " : "") + close[i].second;
    message += "?";
  }
  KCliFail(message);
}

double KCliPlugin::WorkingValue(const KAudioPluginBase::Parameter& parameter, const std::string& text) {
  const KValueKind& kind = parameter.Kind();
  double value;
  if (ParseNumber(text, value)) {
    if (value < kind.Minimum() || value > kind.Maximum())
      KCliFail("The value " + text + " of '" + parameter.Key().ToUtf8() + "' is out of range (" + Number(kind.Minimum()) +
               " to " + Number(kind.Maximum()) + ").");
    return value;
  }
  if (kind.FromText(KString::FromUtf8(text), value)) return value;
  std::string expected = "a number from " + Number(kind.Minimum()) + " to " + Number(kind.Maximum());
  if (kind.Steps() > 0 && kind.Steps() < 32) {
    expected = "one of ";
    for (int32_t i = 0; i <= kind.Steps(); ++i) expected += (i ? ", " : "") + kind.ToText(kind.Minimum() + i).ToUtf8();
  }
  KCliFail("'" + text + "' is not a value of '" + parameter.Key().ToUtf8() + "': expected " + expected + ".");
}

void KCliPlugin::Set(const std::string& assignment) {
  const size_t equals = assignment.find('=');
  if (equals == std::string::npos || equals == 0) KCliFail("--set takes KEY=VALUE, not '" + assignment + "'.");
  KAudioPluginBase::Parameter& parameter = Find(assignment.substr(0, equals));
  parameter.SetWorking(WorkingValue(parameter, assignment.substr(equals + 1)));
}

void KCliPlugin::LoadPreset(const std::string& path) {
  std::ifstream file(path, std::ios::binary);
  if (!file) KCliFail("Cannot read the preset file '" + path + "'.");
  std::ostringstream text;
  text << file.rdbuf();
  try {
    plugin_->ReadState(text.str());
  } catch (const KException& failure) {
    KCliFail("The preset file '" + path + "' cannot be loaded: " + failure.Message().ToUtf8());
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
