#include <cstdio>
#include <string>

#include "kernel/KFormat.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/commands/KCommands.h"

namespace {

std::string Json(const KString& text) {
  std::string out = "\"";
  for (const char c : text.ToUtf8()) {
    if (c == '"' || c == '\\') out += '\\', out += c;
    else if (static_cast<unsigned char>(c) < 0x20) out += KFormatText("\\u{0 04x}", static_cast<int32_t>(c)).ToUtf8();
    else out += c;
  }
  return out + "\"";
}

std::string Number(double value) { return KFormatText("{0}", value).ToUtf8(); }

std::string WithUnit(std::string text, const KString& unit) {
  if (!unit.IsEmpty()) text.append(" ").append(unit.ToUtf8());
  return text;
}

}  // namespace

int KRunInfo(std::span<char* const> words) {
  const KCliArguments arguments(words, "info", {}, {"json"});
  if (arguments.Positional().size() != 1) KCliFail("'info' takes one plug-in name.");
  KCliPlugin session(arguments.Positional()[0]);
  KAudioPlugin& plugin = session.Plugin();
  plugin.SetSampleRate(48000.0);
  const KAudioPlugin::Shape& shape = plugin.GetShape();
  const bool json = arguments.Has("json");

  if (json) std::printf("{\n  \"plugin\": %s,\n  \"parameters\": [", Json(plugin.Identifier()).c_str());
  else std::printf("%s\n\n  #  key                      name                     default      range\n", plugin.Identifier().ToUtf8().c_str());
  for (int32_t i = 0; i < plugin.ParameterCount(); ++i) {
    const KAudioPluginBase::Parameter& p = plugin.GetParameter(i);
    const KValueKind& kind = p.Kind();
    const double defaultValue = kind.ToWorking(p.DefaultNormalized());
    const std::string defaultText = p.TextForNormalized(p.DefaultNormalized()).ToUtf8();
    if (json) {
      std::printf("%s\n    {\"index\": %d, \"key\": %s, \"name\": %s, \"unit\": %s, \"default\": %s, \"defaultText\": %s, "
                  "\"minimum\": %s, \"maximum\": %s, \"steps\": %d, \"automatable\": %s}",
                  i ? "," : "", i, Json(p.Key()).c_str(), Json(p.Name()).c_str(), Json(p.Unit()).c_str(), Number(defaultValue).c_str(),
                  Json(KString::FromUtf8(defaultText)).c_str(), Number(kind.Minimum()).c_str(), Number(kind.Maximum()).c_str(),
                  p.Steps(), p.IsAutomatable() ? "true" : "false");
    } else {
      std::printf("%3d  %-24s %-24s %-12s %s .. %s%s%s\n", i, p.Key().ToUtf8().c_str(), p.Name().ToUtf8().c_str(),
                  WithUnit(defaultText, p.Unit()).c_str(), Number(kind.Minimum()).c_str(),
                  Number(kind.Maximum()).c_str(), p.Steps() > 0 ? KFormatText(" in {0} steps", p.Steps()).ToUtf8().c_str() : "",
                  p.IsAutomatable() ? "" : ", not automatable");
    }
  }
  if (json) {
    std::printf("\n  ],\n  \"inputBuses\": %d,\n  \"outputBuses\": %d,\n  \"channelsPerBus\": [1, 2],\n  \"latency\": %d,\n"
                "  \"midiInput\": %s,\n  \"midiOutput\": %s\n}\n",
                shape.inputBuses, shape.outputBuses, plugin.TotalLatency(), shape.acceptsMIDI ? "true" : "false",
                shape.producesMIDI ? "true" : "false");
  } else {
    std::printf("\ninputs:  %d bus%s%s of 1 or 2 channels\noutputs: %d bus%s of 1 or 2 channels\n", shape.inputBuses,
                shape.inputBuses == 1 ? "" : "es", shape.inputBuses == 2 ? " (main, side-chain)" : "", shape.outputBuses,
                shape.outputBuses == 1 ? "" : "es");
    std::printf("latency: %d samples at 48 kHz\nMIDI:    %s input, %s output\n", plugin.TotalLatency(), shape.acceptsMIDI ? "takes" : "no",
                shape.producesMIDI ? "produces" : "no");
  }
  return 0;
}
