#include <charconv>
#include <cmath>
#include <cstdio>
#include <memory>

#include "core/KParameter.h"
#include "kernel/KFormat.h"
#include "kernel/platform/KPlatform.h"
#include "tools/KAudioFile.h"
#include "tools/KCliArguments.h"
#include "tools/KCliPlugin.h"
#include "tools/KDemoSignal.h"
#include "tools/KRenderer.h"
#include "tools/commands/KCommands.h"

namespace {

double NumberOf(const std::string& text, const std::string& what) {
  double value = 0.0;
  const auto result = std::from_chars(text.data(), text.data() + text.size(), value);
  if (result.ec != std::errc() || result.ptr != text.data() + text.size() || !std::isfinite(value))
    KCliFail("'" + text + "' is not a number (" + what + ").");
  return value;
}

// "KEY=T:V[,T:V...]": times in seconds, values in working units.
KAutomationLane ParseLane(KCliPlugin& session, const std::string& text) {
  const size_t equals = text.find('=');
  if (equals == std::string::npos) KCliFail("--automate takes KEY=T:V[,T:V...], not '" + text + "'.");
  KAudioPluginBase::Parameter& parameter = session.Find(text.substr(0, equals));
  KAutomationLane lane{parameter.Index(), {}};
  for (size_t at = equals + 1; at <= text.size();) {
    const size_t comma = std::min(text.find(',', at), text.size());
    const std::string point = text.substr(at, comma - at);
    const size_t colon = point.find(':');
    if (colon == std::string::npos) KCliFail("An automation point is TIME:VALUE, not '" + point + "'.");
    const double seconds = NumberOf(point.substr(0, colon), "a time in seconds");
    if (seconds < 0.0 || (!lane.points.empty() && seconds < lane.points.back().seconds))
      KCliFail("Automation times must start at 0 or later and never go back: '" + point + "'.");
    const double working = KCliPlugin::WorkingValue(parameter, point.substr(colon + 1));
    lane.points.push_back({seconds, parameter.Kind().ToNormalized(working)});
    at = comma + 1;
  }
  return lane;
}

std::string Decibels(double linear) {
  return linear > 0.0 ? KFormatText("{0.1} dBFS", 20.0 * std::log10(linear)).ToUtf8() : std::string("-inf dBFS");
}

}  // namespace

int KRunRender(std::span<char* const> words) {
  const KCliArguments arguments(words, "render", {"set", "preset", "automate", "block", "tail", "sidechain", "format"}, {});
  const auto& positional = arguments.Positional();
  if (positional.size() < 2 || positional.size() > 3) KCliFail("'render' takes PLUGIN [INPUT] OUTPUT.");
  KCliPlugin session(positional[0]);
  KAudioPlugin& plugin = session.Plugin();

  std::unique_ptr<KAudioSource> input;
  if (positional.size() == 3) input = std::make_unique<KAudioFileReader>(positional[1]);
  else input = std::make_unique<KDemoSignal>();
  const std::string inputName = positional.size() == 3 ? "'" + positional[1] + "'" : "the demo signal";
  if (!plugin.SetChannelsPerBus(input->Channels()))
    KCliFail(plugin.Identifier().ToUtf8() + " works on 1 or 2 channels; " + inputName + " has " + std::to_string(input->Channels()) + ".");
  if (!plugin.SetSampleRate(input->SampleRate()))
    KCliFail(plugin.Identifier().ToUtf8() + " does not run at the sample rate of " + inputName + " (" +
             KFormatText("{0}", input->SampleRate()).ToUtf8() + " Hz).");

  session.ApplySettings(arguments);
  KRenderOptions options;
  KSampleFormat format = KSampleFormat::kDefault;
  std::unique_ptr<KAudioFileReader> sideChain;
  for (const KCliArguments::Option& option : arguments.Options()) {
    if (option.name == "automate") {
      options.automation.push_back(ParseLane(session, option.value));
    } else if (option.name == "block") {
      options.blockSize = option.value == "random" ? 0 : static_cast<int32_t>(NumberOf(option.value, "a block size"));
      if (option.value != "random" && (options.blockSize < 1 || options.blockSize > 512 || std::to_string(options.blockSize) != option.value))
        KCliFail("--block takes a whole number from 1 to 512, or 'random'.");
    } else if (option.name == "tail") {
      options.tailSeconds = NumberOf(option.value, "the tail in seconds");
      if (options.tailSeconds < 0.0 || options.tailSeconds > 3600.0) KCliFail("--tail takes 0 to 3600 seconds.");
    } else if (option.name == "sidechain") {
      if (plugin.GetShape().inputBuses < 2) KCliFail(plugin.Identifier().ToUtf8() + " has no side-chain input.");
      sideChain = std::make_unique<KAudioFileReader>(option.value);
      if (sideChain->SampleRate() != input->SampleRate()) KCliFail("The side-chain file '" + option.value + "' has another sample rate than the input.");
      options.sideChain = sideChain.get();
    } else if (option.name == "format") {
      format = KAudioFileWriter::ParseFormat(option.value);
    }
  }
  options.showProgress = KPlatform::IsErrorStreamTerminal();

  KAudioFileWriter output(positional.back(), format, plugin.OutputChannelCount(), input->SampleRate());
  const KRenderSummary summary = KRender(plugin, *input, output, options);
  output.Commit();
  std::printf("%s: %.2f s; input peak %s, RMS %s; output peak %s, RMS %s; %.0fx realtime\n", positional.back().c_str(), summary.seconds,
              Decibels(summary.inputPeak).c_str(), Decibels(summary.inputRms).c_str(), Decibels(summary.outputPeak).c_str(),
              Decibels(summary.outputRms).c_str(), summary.realtimeFactor);
  return 0;
}
