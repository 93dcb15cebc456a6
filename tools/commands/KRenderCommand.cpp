#include <charconv>
#include <cmath>
#include <cstdio>
#include <memory>
#include <set>

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
  if (!parameter.IsAutomatable())
    KCliFail("'" + parameter.Key().ToUtf8() + "' of " + session.Plugin().Identifier().ToUtf8() + " cannot be automated.");
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

// The words of one plug-in of the chain: its options (set, preset, automate, sidechain) and
// those of the whole render, which may stand anywhere.
KCliArguments Segment(std::span<char* const> words) {
  return KCliArguments(words, "render",
                       {"set", "preset", "automate", "sidechain", "block", "tail", "format", "type", "dither", "clipping", "output-dir"},
                       {"quiet"});
}

struct RenderSettings {
  KRenderOptions options;
  KOutputType type;
  std::string outputFolder;
  bool failOnClipping = false;
  bool quiet = false;
};

RenderSettings ReadSettings(const std::vector<KCliArguments>& segments) {
  RenderSettings settings;
  for (const KCliArguments& arguments : segments) {
    for (const KCliArguments::Option& option : arguments.Options()) {
      const std::string& value = option.value;
      if (option.name == "block") {
        settings.options.blockSize = value == "random" ? 0 : static_cast<int32_t>(NumberOf(value, "a block size"));
        if (value != "random" && (settings.options.blockSize < 1 || settings.options.blockSize > 512 || std::to_string(settings.options.blockSize) != value))
          KCliFail("--block takes a whole number from 1 to 512, or 'random'.");
      } else if (option.name == "tail") {
        settings.options.tailSeconds = NumberOf(value, "the tail in seconds");
        if (settings.options.tailSeconds < 0.0 || settings.options.tailSeconds > 3600.0) KCliFail("--tail takes 0 to 3600 seconds.");
      } else if (option.name == "format") {
        settings.type.format = KParseSampleFormat(value);
      } else if (option.name == "type") {
        settings.type.container = value;
        KFileFormat(value, KSampleFormat::kDefault, KSampleFormat::kDefault);  // names an error now
      } else if (option.name == "dither") {
        if (value != "tpdf" && value != "none") KCliFail("--dither takes tpdf or none.");
        settings.type.dither = value == "tpdf";
      } else if (option.name == "clipping") {
        if (value != "warn" && value != "fail") KCliFail("--clipping takes warn or fail.");
        settings.failOnClipping = value == "fail";
      } else if (option.name == "output-dir") {
        settings.outputFolder = value.ends_with('/') ? value : value + "/";
      } else if (option.name == "quiet") {
        settings.quiet = true;
      }
    }
  }
  return settings;
}

// One plug-in of the chain, set up for the input's channels and rate with its own options.
struct ChainPlugin {
  std::unique_ptr<KCliPlugin> session;
  std::vector<std::unique_ptr<KAudioFileReader>> sideChains;
  KRenderStage stage;
};

ChainPlugin CreateStage(const KCliArguments& arguments, const KAudioSource& input, const std::string& inputName) {
  ChainPlugin chain{std::make_unique<KCliPlugin>(arguments.Positional()[0]), {}, {}};
  KAudioPlugin& plugin = chain.session->Plugin();
  const std::string identifier = plugin.Identifier().ToUtf8();
  chain.stage.plugin = &plugin;
  if (!plugin.SetChannelsPerBus(input.Channels()))
    KCliFail(identifier + " works on 1 or 2 channels; " + inputName + " has " + std::to_string(input.Channels()) + ".");
  if (!plugin.SetSampleRate(input.SampleRate()))
    KCliFail(identifier + " does not run at the sample rate of " + inputName + " (" + KFormatText("{0}", input.SampleRate()).ToUtf8() + " Hz).");
  chain.session->ApplySettings(arguments);
  std::set<int32_t> set;
  for (const KCliArguments::Option& option : arguments.Options()) {
    if (option.name == "set") set.insert(chain.session->Find(option.value.substr(0, option.value.find('='))).Index());
  }
  for (const KCliArguments::Option& option : arguments.Options()) {
    if (option.name == "automate") {
      const KAutomationLane& lane = chain.stage.automation.emplace_back(ParseLane(*chain.session, option.value));
      if (set.count(lane.parameter))
        KCliFail("'" + plugin.GetParameter(lane.parameter).Key().ToUtf8() + "' is both set and automated: give --set or --automate.");
    } else if (option.name == "sidechain") {
      if (plugin.GetShape().inputBuses < 2) KCliFail(identifier + " has no side-chain input.");
      chain.sideChains.push_back(std::make_unique<KAudioFileReader>(option.value));
      if (chain.sideChains.back()->SampleRate() != input.SampleRate())
        KCliFail("The side-chain file '" + option.value + "' has another sample rate than the input.");
      chain.stage.sideChain = chain.sideChains.back().get();
    }
  }
  return chain;
}

// Renders one input (null: the demo) through the chain into `outputPath`.
void RenderOne(const std::vector<KCliArguments>& segments, const RenderSettings& settings, const std::string* inputPath,
               const std::string& outputPath) {
  std::unique_ptr<KAudioSource> input;
  KOutputType type = settings.type;
  KAudioTags tags;
  std::string inputName = "the demo signal";
  if (inputPath) {
    auto file = std::make_unique<KAudioFileReader>(*inputPath);
    type.preferred = file->Format();
    tags = file->Tags();
    inputName = file->Name();
    input = std::move(file);
  } else {
    input = std::make_unique<KDemoSignal>();
  }
  if (outputPath == "-" && type.container.empty()) KCliFail("Standard output needs an audio type: give --type (for example -t wav).");
  std::vector<ChainPlugin> chain;
  std::vector<KRenderStage> stages;
  for (const KCliArguments& arguments : segments) stages.push_back((chain.emplace_back(CreateStage(arguments, *input, inputName))).stage);

  KRenderOptions options = settings.options;
  options.showProgress = !settings.quiet && KPlatform::IsErrorStreamTerminal();
  KAudioFileWriter output(outputPath, type, stages.back().plugin->OutputChannelCount(), input->SampleRate(), tags);
  const KRenderSummary summary = KRender(stages, *input, output, options);
  output.Finish();
  const int64_t clipped = output.ClippedSamples();
  const std::string shownName = output.IsStandardOutput() ? "standard output" : outputPath;
  if (clipped > 0 && settings.failOnClipping)
    KCliFail(std::to_string(clipped) + " samples of " + shownName + " were clipped at full scale; nothing was written.");
  output.Commit();
  if (clipped > 0)
    std::fprintf(stderr, "torvane: warning: %lld samples clipped at full scale in %s; lower the level or write f32.\n",
                 static_cast<long long>(clipped), shownName.c_str());
  if (!settings.quiet)
    std::fprintf(stderr, "%s: %.2f s; input peak %s, RMS %s; output peak %s, RMS %s; %.0fx realtime\n", shownName.c_str(), summary.seconds,
                 Decibels(summary.inputPeak).c_str(), Decibels(summary.inputRms).c_str(), Decibels(summary.outputPeak).c_str(),
                 Decibels(summary.outputRms).c_str(), summary.realtimeFactor);
}

// `folder` + the input's file name, its extension that of --type when one is given.
std::string OutputInFolder(const std::string& folder, const std::string& input, const std::string& container) {
  std::string name = input.substr(input.find_last_of('/') + 1);
  if (!container.empty()) name = name.substr(0, name.find_last_of('.')) + "." + container;
  return folder + name;
}

}  // namespace

int KRunRender(std::span<char* const> words) {
  // "A [options] + B [options] ... [INPUT...] OUTPUT": "+" separates the plug-ins of a chain.
  std::vector<KCliArguments> segments;
  for (std::span<char* const> part : KSplitChain(words)) {
    segments.push_back(Segment(part));
    if (segments.back().Positional().empty()) KCliFail("'render' takes PLUGIN [+ PLUGIN...] [INPUT...] OUTPUT: a plug-in name is missing.");
  }
  const RenderSettings settings = ReadSettings(segments);
  std::vector<std::string> files;
  for (const KCliArguments& segment : segments) files.insert(files.end(), segment.Positional().begin() + 1, segment.Positional().end());

  if (!settings.outputFolder.empty()) {
    if (files.empty()) KCliFail("'render --output-dir' takes one or more input files.");
    std::set<std::string> outputs;
    for (const std::string& input : files) {
      if (input == "-") KCliFail("'render --output-dir' takes input files, not standard input.");
      if (!outputs.insert(OutputInFolder(settings.outputFolder, input, settings.type.container)).second)
        KCliFail("Two inputs would be written to '" + OutputInFolder(settings.outputFolder, input, settings.type.container) + "'.");
    }
    for (const std::string& input : files) RenderOne(segments, settings, &input, OutputInFolder(settings.outputFolder, input, settings.type.container));
    return 0;
  }
  if (files.empty() || files.size() > 2) KCliFail("'render' takes PLUGIN [+ PLUGIN...] [INPUT] OUTPUT, or inputs with --output-dir.");
  RenderOne(segments, settings, files.size() == 2 ? &files[0] : nullptr, files.back());
  return 0;
}
