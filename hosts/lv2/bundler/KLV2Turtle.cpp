#include "hosts/lv2/bundler/KLV2Turtle.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cmath>
#include <string_view>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/lv2/KAudioPluginLV2Adapter.h"
#include "hosts/lv2/KLV2Ports.h"
#include "hosts/lv2/KLV2UI.h"

namespace KLV2 {
namespace {
constexpr const char* kPrefixes =
    "@prefix atom: <http://lv2plug.in/ns/ext/atom#> .\n"
    "@prefix doap: <http://usefulinc.com/ns/doap#> .\n"
    "@prefix lv2: <http://lv2plug.in/ns/lv2core#> .\n"
    "@prefix midi: <http://lv2plug.in/ns/ext/midi#> .\n"
    "@prefix pprops: <http://lv2plug.in/ns/ext/port-props#> .\n"
    "@prefix pset: <http://lv2plug.in/ns/ext/presets#> .\n"
    "@prefix rdf: <http://www.w3.org/1999/02/22-rdf-syntax-ns#> .\n"
    "@prefix rdfs: <http://www.w3.org/2000/01/rdf-schema#> .\n"
    "@prefix state: <http://lv2plug.in/ns/ext/state#> .\n"
    "@prefix time: <http://lv2plug.in/ns/ext/time#> .\n"
    "@prefix ui: <http://lv2plug.in/ns/extensions/ui#> .\n"
    "@prefix units: <http://lv2plug.in/ns/extensions/units#> .\n"
    "@prefix urid: <http://lv2plug.in/ns/ext/urid#> .\n\n";

// A decimal literal the parser reads as a number in any locale: shortest round trip, always
// with a point or an exponent.
std::string Number(double value) {
  char text[32];
  const auto end = std::to_chars(text, text + sizeof text, value).ptr;
  std::string number(text, end);
  if (number.find_first_of(".e") == std::string::npos) number += ".0";
  return number;
}

// A preset's port value as a plain decimal, never with an exponent: Turtle reads it as
// xsd:decimal, which hosts hand to a control port as the float it expects (an exponent would
// make it xsd:double).
std::string Decimal(double value) {
  char text[400];
  const auto end = std::to_chars(text, text + sizeof text, value, std::chars_format::fixed).ptr;
  std::string number(text, end);
  if (number.find('.') == std::string::npos) number += ".0";
  return number;
}

std::string Quoted(std::string_view text) {
  std::string quoted = "\"";
  for (const char c : text) {
    if (c == '\n') quoted += "\\n";
    else if (c == '\r') quoted += "\\r";
    else if (c == '\t') quoted += "\\t";
    else {
      if (c == '"' || c == '\\') quoted += '\\';
      quoted += c;
    }
  }
  return quoted + "\"";
}

// The working unit of a kind. Time kinds are shown in milliseconds but work in seconds.
const char* UnitOf(const std::string& unit) {
  if (unit == "dB") return "units:db";
  if (unit == "Hz") return "units:hz";
  if (unit == "ms") return "units:s";
  if (unit == "%") return "units:pc";
  return nullptr;
}

// Half travel at the geometric mean of a positive range: equal travel per octave.
bool IsLogarithmic(const KValueKind& kind) {
  if (kind.Minimum() <= 0.0 || kind.Steps() > 0) return false;
  const double middle = std::sqrt(kind.Minimum() * kind.Maximum());
  return std::fabs(kind.ToWorking(0.5) - middle) <= 1e-9 * middle;
}

// A stepped kind whose texts are names rather than numbers is a choice among them.
bool IsEnumeration(const KValueKind& kind) {
  double parsed = 0.0;
  const std::string text = kind.ToText(kind.Minimum()).ToUtf8();
  return kind.Steps() > 0 && std::from_chars(text.data(), text.data() + text.size(), parsed).ec != std::errc();
}

void ControlPort(std::string& out, const KAudioPluginBase::Parameter& parameter) {
  const KValueKind& kind = parameter.Kind();
  out += " ;\n    lv2:default " + Number(parameter.Info().defaultValue) + " ;\n    lv2:minimum " + Number(kind.Minimum()) +
         " ;\n    lv2:maximum " + Number(kind.Maximum());
  if (const char* unit = UnitOf(kind.Unit().ToUtf8())) out += std::string(" ;\n    units:unit ") + unit;
  if (kind.Steps() == 1 && kind.Minimum() == 0.0) out += " ;\n    lv2:portProperty lv2:toggled";
  else if (kind.Steps() > 0) out += " ;\n    lv2:portProperty lv2:integer";
  if (IsEnumeration(kind) && kind.Steps() > 1) {
    out += " , lv2:enumeration";
    for (int32_t step = 0; step <= kind.Steps(); ++step) {
      const double value = kind.Minimum() + step;
      out += std::string(step == 0 ? " ;\n    lv2:scalePoint " : " ,\n      ") + "[ rdfs:label " + Quoted(kind.ToText(value).ToUtf8()) +
             " ; rdf:value " + Number(value) + " ]";
    }
  }
  if (IsLogarithmic(kind)) out += " ;\n    lv2:portProperty pprops:logarithmic";
}
}  // namespace

std::string KManifestTurtle(const KAudioPlugin& plugin, const std::string& uri, const std::string& name) {
  std::string out = std::string(kPrefixes) + "<" + uri + ">\n  a lv2:Plugin ;\n  lv2:binary <" + name + ".so> ;\n  rdfs:seeAlso <" + name +
                    ".ttl> .\n\n<" + UIURI(uri) + ">\n  a ui:X11UI ;\n  ui:binary <" + name + ".so> ;\n  rdfs:seeAlso <" + name + ".ttl> .\n";
  for (const KFactoryPreset& preset : plugin.FactoryPresets())
    out += "\n<" + KPresetURI(uri, preset.name) + ">\n  a pset:Preset ;\n  lv2:appliesTo <" + uri + "> ;\n  rdfs:seeAlso <" + kPresetsFile + "> .\n";
  return out;
}

std::string KPresetURI(const std::string& uri, const char* presetName) {
  std::string slug;
  for (const char* c = presetName; *c; ++c) {
    const auto byte = static_cast<unsigned char>(*c);
    if (std::isalnum(byte)) slug += static_cast<char>(std::tolower(byte));
    else if (!slug.empty() && slug.back() != '-') slug += '-';
  }
  while (!slug.empty() && slug.back() == '-') slug.pop_back();
  return uri + "#" + slug;
}

std::string KPresetsTurtle(KAudioPlugin& plugin, const std::string& uri) {
  std::string out = kPrefixes;
  const KPortLayout layout(plugin);
  const int32_t first = layout.First(KPort::Kind::kParameter);
  const auto presets = plugin.FactoryPresets();
  // The state's one property, described for the validators wherever a preset uses it.
  if (std::any_of(presets.begin(), presets.end(), [](const KFactoryPreset& preset) { return preset.settings != nullptr; }))
    out += std::string("<") + KAudioPluginLV2Adapter::kStateKey + ">\n  a rdf:Property ;\n  rdfs:label \"Torvane plug-in state\" ;\n"
           "  rdfs:range atom:String .\n\n";
  for (const KFactoryPreset& preset : presets) {
    plugin.LoadFactoryPreset(preset);
    out += "<" + KPresetURI(uri, preset.name) + ">\n  a pset:Preset ;\n  lv2:appliesTo <" + uri + "> ;\n  rdfs:label " + Quoted(preset.name);
    for (int32_t p = 0; p < plugin.ParameterCount(); ++p) {
      out += std::string(p == 0 ? " ;\n  lv2:port " : " ,\n    ") + "[ lv2:symbol " + Quoted(layout.Ports()[static_cast<size_t>(first + p)].symbol) +
             " ; pset:value " + Decimal(plugin.GetParameter(p).Working()) + " ]";
    }
    // Settings beyond the ports reach the plug-in only through its state.
    if (preset.settings) out += std::string(" ;\n  state:state [ <") + KAudioPluginLV2Adapter::kStateKey + "> " + Quoted(plugin.WriteState()) + " ]";
    out += " .\n\n";
  }
  return out;
}

std::string KPluginTurtle(const KAudioPlugin& plugin, const std::string& uri, const std::string& name) {
  const KAudioPlugin::Shape& shape = plugin.GetShape();
  const bool needsMap = shape.acceptsMIDI || shape.producesMIDI;
  std::string out = std::string(kPrefixes) + "<" + uri + ">\n  a lv2:Plugin ;\n  doap:name " + Quoted(name) +
                    " ;\n  lv2:optionalFeature lv2:hardRTCapable" + (needsMap ? "" : " , urid:map") +
                    (needsMap ? " ;\n  lv2:requiredFeature urid:map" : "") + " ;\n  lv2:extensionData state:interface ;\n  ui:ui <" +
                    UIURI(uri) + ">";
  const KPortLayout layout(plugin);
  using Kind = KPort::Kind;
  for (int32_t index = 0; index < layout.Count(); ++index) {
    const KPort& port = layout.Ports()[index];
    const bool input = port.kind == Kind::kAudioIn || port.kind == Kind::kSideChainIn || port.kind == Kind::kParameter || port.kind == Kind::kMIDIIn;
    const bool audio = port.kind == Kind::kAudioIn || port.kind == Kind::kSideChainIn || port.kind == Kind::kAudioOut;
    const bool midi = port.kind == Kind::kMIDIIn || port.kind == Kind::kMIDIOut;
    out += std::string(index == 0 ? " ;\n  lv2:port [\n" : " , [\n") + "    a lv2:" + (input ? "InputPort" : "OutputPort") + " , " +
           (audio ? "lv2:AudioPort" : midi ? "atom:AtomPort" : "lv2:ControlPort") + " ;\n    lv2:index " + std::to_string(index) +
           " ;\n    lv2:symbol " + Quoted(port.symbol) + " ;\n    lv2:name " + Quoted(port.name);
    switch (port.kind) {
      case Kind::kSideChainIn:
        out += " ;\n    lv2:portProperty lv2:isSideChain , lv2:connectionOptional";
        break;
      case Kind::kParameter:
        ControlPort(out, plugin.GetParameter(port.index));
        break;
      case Kind::kMeter:
        out += " ;\n    lv2:minimum 0.0 ;\n    lv2:maximum 2.0";
        break;
      case Kind::kLatency:
        out += " ;\n    lv2:designation lv2:latency ;\n    lv2:portProperty lv2:reportsLatency , lv2:integer ;\n    lv2:minimum 0.0 ;\n"
               "    lv2:maximum 192000.0";
        break;
      case Kind::kMIDIIn:
        out += " ;\n    atom:bufferType atom:Sequence ;\n    atom:supports midi:MidiEvent , time:Position";
        break;
      case Kind::kMIDIOut:
        out += " ;\n    atom:bufferType atom:Sequence ;\n    atom:supports midi:MidiEvent";
        break;
      default:
        break;
    }
    out += "\n  ]";
  }
  // The editor works on the instance itself: a host that cannot give it (another process) shows
  // its generic controls instead.
  return out + " .\n\n<" + UIURI(uri) + ">\n  a ui:X11UI ;\n  ui:binary <" + name +
         ".so> ;\n  lv2:requiredFeature ui:parent , ui:idleInterface , <http://lv2plug.in/ns/ext/instance-access> ;\n"
         "  lv2:optionalFeature ui:resize , ui:touch ;\n  lv2:extensionData ui:idleInterface .\n";
}

}  // namespace KLV2
