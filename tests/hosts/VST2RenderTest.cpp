// The VST 2 door renders what `torvane render` renders, bit for bit, latency included.
#include "tests/hosts/VST2Host.h"
#include "tests/tools/CliFixture.h"

using namespace KVST2Test;

namespace {
// `input` through a module's instance in blocks of `block`, loaded with `state` as a host loads a
// project, then its latency in silence; the first latency frames cut, as the command line does.
Audio ThroughModule(const std::string& name, const Audio& input, int32_t block, const std::string& state) {
  KHost host;
  KModuleFile module(name);
  KInstance instance(module.Create());
  instance.Call(effOpen);
  instance.Call(effSetSampleRate, 0, 0, nullptr, static_cast<float>(input.rate));
  instance.Call(effSetBlockSize, 0, block);
  EXPECT_EQ(instance.SetChunk(state), 1);
  instance.Call(effMainsChanged, 0, 1);
  const int32_t latency = instance.effect->initialDelay, inputs = instance.effect->numInputs, outputs = instance.effect->numOutputs;
  const auto frames = static_cast<int32_t>(input.samples.size() / 2);
  Audio output{outputs, input.rate, std::vector<float>(static_cast<size_t>(frames) * static_cast<size_t>(outputs))};
  for (int32_t start = 0; start < frames + latency; start += block) {
    KBuffers in(inputs, block), out(outputs, block);  // side-chain inputs stay silent
    for (int32_t i = 0; i < block && start + i < frames; ++i)
      for (size_t c = 0; c < 2; ++c) in.planes[c][static_cast<size_t>(i)] = input.samples[2 * static_cast<size_t>(start + i) + c];
    instance.Process(in.pointers, out.pointers, block);
    for (int32_t i = 0; i < block; ++i) {
      const int32_t at = start + i - latency;
      if (at < 0 || at >= frames) continue;
      for (int32_t c = 0; c < outputs; ++c) output.samples[static_cast<size_t>(at * outputs + c)] = out.planes[static_cast<size_t>(c)][static_cast<size_t>(i)];
    }
  }
  return output;
}
}  // namespace

// The saturator has latency; the compressor's side-chain hears silence on both doors.
TEST_F(CliTest, VST2ModulesRenderAsTheCommandLineDoes) {
  const std::pair<const char*, Words> cases[] = {{"KSampleWarmer", {"drive=20", "tone=40", "shape=0"}},
                                                 {"KCompressorPlugin", {"threshold=0.1", "ratio=6", "attack=0.0005", "rmslength=0.01"}},
                                                 {"KEqualizerPlugin", {"band2gain=12", "band1type=2", "band6type=5", "band6q=4"}}};
  const Audio input = AudioFile(Work() / "in.wav");
  for (const auto& [key, assignments] : cases) {
    const CliRun state = Run(Sets({"state", key}, assignments));
    ASSERT_EQ(state.exit, 0) << state.err;
    const std::string whole(key), name = whole.ends_with("Plugin") ? whole.substr(1, whole.size() - 7) : whole.substr(1);
    for (const int32_t block : {64, 512}) {
      Words render = Sets({"render", key, "in.wav", "--block", std::to_string(block)}, assignments);
      render.push_back("rendered.wav");
      const CliRun run = Run(render);
      ASSERT_EQ(run.exit, 0) << run.err;
      EXPECT_TRUE(Same(AudioFile(Work() / "rendered.wav"), ThroughModule(name, input, block, state.out))) << key << " in blocks of " << block;
    }
  }
}
