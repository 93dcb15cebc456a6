// Effect pipelines on the command line: pipeline files made by `torvane pipeline` and played
// through the pipeline plug-in.
#include <gmock/gmock.h>

#include <string>

#include "tests/tools/CliFixture.h"

// A pipeline file made from a chain renders through the pipeline plug-in as the chain renders
// plug-in after plug-in: bit for bit, latency compensated alike, at fixed and random blocks.
TEST_F(CliTest, PipelineFileRendersAsTheChain) {
  const CliRun made = Shell("\"$TORVANE\" pipeline KCompressorPlugin --set ratio=4 --set threshold=0.1 + samplewarmer --set drive=12 "
                            "+ Utility --set gain=-3 --bypass > chain.tvpipe");
  ASSERT_EQ(made.exit, 0) << made.err;
  const std::string file = (std::ostringstream() << std::ifstream(Work() / "chain.tvpipe").rdbuf()).str();
  EXPECT_THAT(file, testing::HasSubstr("<EffectPipeline>"));
  EXPECT_THAT(file, testing::HasSubstr("Key=\"SampleWarmer\""));
  for (const std::string block : {"512", "random"}) {
    const CliRun chain = Run({"render", "KCompressorPlugin", "--set", "ratio=4", "--set", "threshold=0.1", "+", "KSampleWarmer", "--set",
                              "drive=12", "in.wav", "chain.wav", "--block", block, "--format", "f32"});
    const CliRun pipeline = Run({"render", "KEffectPipeline", "--preset", "chain.tvpipe", "in.wav", "pipeline.wav", "--block", block, "--format", "f32"});
    ASSERT_EQ(chain.exit + pipeline.exit, 0) << chain.err << pipeline.err;
    EXPECT_TRUE(Same(AudioFile(Work() / "chain.wav"), AudioFile(Work() / "pipeline.wav"))) << block;
  }
  const CliRun wrong = Run({"render", "KCompressorPlugin", "--preset", "chain.tvpipe", "out.wav"});
  EXPECT_EQ(wrong.exit, 1);
  EXPECT_THAT(wrong.err, testing::HasSubstr("is an effect pipeline; load it into KEffectPipeline"));
  const CliRun host = Run({"pipeline", "KEffectPipeline"});
  EXPECT_EQ(host.exit, 1);
  EXPECT_THAT(host.err, testing::HasSubstr("KEffectPipeline is no effect module"));
}
