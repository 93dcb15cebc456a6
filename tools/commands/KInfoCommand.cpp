#include <charconv>
#include <cstdio>
#include <string>
#include <vector>

#include "kernel/KFormat.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

namespace {

std::string Json(const std::string& text) {
  std::string out = "\"";
  for (const char c : text) {
    if (c == '"' || c == '\\') out += '\\', out += c;
    else if (static_cast<unsigned char>(c) < 0x20) out += KFormatText("\\u{0 04x}", static_cast<int32_t>(c)).ToUtf8();
    else out += c;
  }
  return out + "\"";
}

std::string Number(double value) { return KFormatText("{0}", value).ToUtf8(); }

// What `info` says of one parameter, every value as the user reads and types it: in the
// parameter's unit, so that the range, the default and the unit agree.
struct Description {
  std::string unit, defaultText, minimumText, maximumText;
  std::vector<std::string> entries;  // the names of a list, else empty
};

bool IsNumber(const std::string& text) {
  double value;
  return std::from_chars(text.data(), text.data() + text.size(), value).ptr == text.data() + text.size() && !text.empty();
}

Description Describe(const KAudioPluginBase::Parameter& p) {
  const KValueKind& kind = p.Kind();
  Description d{p.Unit().ToUtf8(), p.TextForNormalized(p.DefaultNormalized()).ToUtf8(), kind.ToText(kind.Minimum()).ToUtf8(),
                kind.ToText(kind.Maximum()).ToUtf8(), {}};
  if (kind.Steps() > 0 && kind.Steps() < 64 && !IsNumber(d.minimumText))
    for (int32_t i = 0; i <= kind.Steps(); ++i) d.entries.push_back(kind.ToText(kind.Minimum() + i).ToUtf8());
  return d;
}

std::string WithUnit(const std::string& text, const std::string& unit) { return unit.empty() ? text : text + " " + unit; }

void PrintText(const KAudioPlugin& plugin) {
  std::printf("%s\n\n  #  key                      name                     default      range\n", plugin.Identifier().ToUtf8().c_str());
  for (int32_t i = 0; i < plugin.ParameterCount(); ++i) {
    const KAudioPluginBase::Parameter& p = plugin.GetParameter(i);
    const Description d = Describe(p);
    std::string range;
    for (const std::string& entry : d.entries) range += (range.empty() ? "" : ", ") + entry;
    if (d.entries.empty()) range = WithUnit(d.minimumText + " .. " + d.maximumText, d.unit);
    std::printf("%3d  %-24s %-24s %-12s %s%s\n", i, p.Key().ToUtf8().c_str(), p.Name().ToUtf8().c_str(), WithUnit(d.defaultText, d.unit).c_str(),
                range.c_str(), p.IsAutomatable() ? "" : " (not automatable)");
  }
}

void PrintJson(const KAudioPlugin& plugin) {
  std::printf("{\n  \"plugin\": %s,\n  \"parameters\": [", Json(plugin.Identifier().ToUtf8()).c_str());
  for (int32_t i = 0; i < plugin.ParameterCount(); ++i) {
    const KAudioPluginBase::Parameter& p = plugin.GetParameter(i);
    const KValueKind& kind = p.Kind();
    const Description d = Describe(p);
    std::string entries;
    for (const std::string& entry : d.entries) entries += (entries.empty() ? "" : ", ") + Json(entry);
    // The texts carry the unit's values; "working" holds the plain numbers --set and
    // --automate take, in the plug-in's working units.
    std::printf("%s\n    {\"index\": %d, \"key\": %s, \"name\": %s, \"unit\": %s, \"default\": %s, \"minimum\": %s, \"maximum\": %s, "
                "\"entries\": [%s], \"working\": {\"default\": %s, \"minimum\": %s, \"maximum\": %s}, \"steps\": %d, \"automatable\": %s}",
                i ? "," : "", i, Json(p.Key().ToUtf8()).c_str(), Json(p.Name().ToUtf8()).c_str(), Json(d.unit).c_str(), Json(d.defaultText).c_str(),
                Json(d.minimumText).c_str(), Json(d.maximumText).c_str(), entries.c_str(), Number(kind.ToWorking(p.DefaultNormalized())).c_str(),
                Number(kind.Minimum()).c_str(), Number(kind.Maximum()).c_str(), p.Steps(), p.IsAutomatable() ? "true" : "false");
  }
}

}  // namespace

int KRunInfo(std::span<char* const> words) {
  const KCliArguments arguments(words, "info", {}, {"json"});
  if (arguments.Positional().size() != 1) KCliFail("'info' takes one plug-in name.");
  KCliPlugin session(arguments.Positional()[0]);
  KAudioPlugin& plugin = session.Plugin();
  plugin.SetSampleRate(48000.0);
  const KAudioPlugin::Shape& shape = plugin.GetShape();
  if (arguments.Has("json")) {
    PrintJson(plugin);
    std::printf("\n  ],\n  \"inputBuses\": %d,\n  \"outputBuses\": %d,\n  \"channelsPerBus\": [1, 2],\n  \"latency\": %d,\n"
                "  \"midiInput\": %s,\n  \"midiOutput\": %s\n}\n",
                shape.inputBuses, shape.outputBuses, plugin.TotalLatency(), shape.acceptsMIDI ? "true" : "false",
                shape.producesMIDI ? "true" : "false");
    return 0;
  }
  PrintText(plugin);
  std::printf("\ninputs:  %d bus%s%s of 1 or 2 channels\noutputs: %d bus%s of 1 or 2 channels\n", shape.inputBuses,
              shape.inputBuses == 1 ? "" : "es", shape.inputBuses == 2 ? " (main, side-chain)" : "", shape.outputBuses,
              shape.outputBuses == 1 ? "" : "es");
  std::printf("latency: %d samples at 48 kHz\nMIDI:    %s input, %s output\n", plugin.TotalLatency(), shape.acceptsMIDI ? "takes" : "no",
              shape.producesMIDI ? "produces" : "no");
  std::printf("\n--set takes the texts shown (attack=\"5 ms\", kneemode=soft) or a plain number in working units (times in seconds).\n");
  return 0;
}
