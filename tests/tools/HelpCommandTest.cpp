// `torvane help`: the plug-in's help as text, as the web page the kernel exports and as the
// picture the help window draws.
#include <memory>

#include "kernel/KEntryPoints.h"
#include "plugins/KPluginHelpPage.h"
#include "tests/tools/CliFixture.h"
#include "ui/KBitmap.h"

namespace {

std::string ReadAll(const fs::path& path) { return (std::ostringstream() << std::ifstream(path, std::ios::binary).rdbuf()).str(); }

TEST_F(CliTest, HelpAsTextPageAndPicture) {
  const CliRun text = Run({"help", "KSampleWarmer"});
  ASSERT_EQ(text.exit, 0) << text.err;
  EXPECT_NE(text.out.find("SampleWarmer\n"), std::string::npos);
  EXPECT_NE(text.out.find("\nDry/wet\n\nDry/wet blends the saturated signal"), std::string::npos) << text.out;
  EXPECT_NE(text.out.find("Range 0.0\u00A0dB to 36.0\u00A0dB, default 6.0\u00A0dB."), std::string::npos);

  ASSERT_EQ(Run({"help", "KCompressorPlugin", "--html", "help.html", "--png", "help.png", "--scale", "2"}).exit, 0);
  const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString("KCompressorPlugin")));
  const KPluginHelpPage page(*plugin);
  EXPECT_EQ(ReadAll(Work() / "help.html"), page.Html());
  const KBitmap picture = KBitmap::Load((Work() / "help.png").string());
  EXPECT_EQ(picture.Width(), 960);
  EXPECT_EQ(picture.Height(), page.Picture(480, 2).Height());
}

TEST_F(CliTest, HelpRefusesWhatItCannotDo) {
  EXPECT_EQ(Run({"help", "KNoSuchPlugin"}).exit, 1);
  const CliRun scale = Run({"help", "KUtilityPlugin", "--png", "x.png", "--scale", "9"});
  EXPECT_EQ(scale.exit, 1);
  EXPECT_NE(scale.err.find("The scale must lie between 0.5 and 4."), std::string::npos) << scale.err;
  EXPECT_FALSE(fs::exists(Work() / "x.png"));
  EXPECT_NE(Run({"help", "--help"}).out.find("usage: torvane help PLUGIN"), std::string::npos);
}

}  // namespace
