// The exported help pages opened in a real browser (headless Chromium, installed by
// scripts/install-deps.sh): every catalogue plug-in's page loads without a console message and
// renders a screenshot, and the browser's computed styles show the semantic classes and heading
// bands as the style sheet means them.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <memory>
#include <sstream>
#include <string>

#include "kernel/KCatalogue.h"
#include "kernel/KEntryPoints.h"
#include "plugins/KPluginHelpPage.h"
#include "ui/KBitmap.h"

namespace {

namespace fs = std::filesystem;

const fs::path kFolder = fs::path(TORVANE_UI_PICTURES) / "help";

std::string ReadFile(const fs::path& path) {
  std::ifstream file(path, std::ios::binary);
  std::stringstream bytes;
  bytes << file.rdbuf();
  return bytes.str();
}

// Runs headless Chromium on a page with its own profile folder; answers its exit status, with
// what it printed in `out` and `log`.
int Chromium(const std::string& arguments, const fs::path& page, std::string& out, std::string& log) {
  const fs::path profile = kFolder / ("profile-" + page.stem().string());
  const fs::path outPath = kFolder / (page.stem().string() + ".out"), logPath = kFolder / (page.stem().string() + ".log");
  const std::string command = "timeout 90 chromium --headless --no-sandbox --disable-gpu --no-first-run --hide-scrollbars "
                              "--enable-logging=stderr --v=0 --user-data-dir='" + profile.string() + "' " + arguments +
                              " 'file://" + fs::absolute(page).string() + "' >'" + outPath.string() + "' 2>'" + logPath.string() + "'";
  const int status = std::system(command.c_str());
  out = ReadFile(outPath);
  log = ReadFile(logPath);
  return status;
}

std::string HelpPage(const char* key) {
  const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::Static(key)));
  return KPluginHelpPage(*plugin).Html();
}

class BrowserTest : public ::testing::Test {
protected:
  void SetUp() override {
    if (std::system("command -v chromium >/dev/null 2>&1") != 0) GTEST_FAIL() << "chromium is missing: run scripts/install-deps.sh";
    fs::create_directories(kFolder);
  }
};

TEST_F(BrowserTest, EveryHelpPageLoadsCleanlyAndRenders) {
  for (const KPluginDescription& entry : KProductCatalogue().plugins) {
    SCOPED_TRACE(entry.key);
    const fs::path page = kFolder / (std::string(entry.key) + ".html");
    std::ofstream(page, std::ios::binary) << HelpPage(entry.key);
    const fs::path shot = kFolder / (std::string(entry.key) + ".png");
    fs::remove(shot);
    std::string out, log;
    ASSERT_EQ(Chromium("--window-size=900,1400 --screenshot='" + shot.string() + "'", page, out, log), 0) << log;
    // The page has no script and loads nothing: any console line is a fault of ours.
    EXPECT_EQ(log.find(":CONSOLE"), std::string::npos) << log;
    const KBitmap picture = KBitmap::Load(shot.string());
    ASSERT_EQ(picture.Width(), 900);
    ASSERT_EQ(picture.Height(), 1400);
    // The title's black band near the top, white paper below the text.
    int32_t black = 0;
    for (int32_t x = 0; x < picture.Width(); ++x) black += (picture.Pixel(x, 40) & 0xFFFFFF) == 0;
    EXPECT_GT(black, picture.Width() / 2);
    EXPECT_EQ(picture.Pixel(5, picture.Height() - 5) & 0xFFFFFF, 0xFFFFFFu);
  }
}

TEST_F(BrowserTest, ComputedStylesOfControlsAndHeadings) {
  // The page with a script of the test's own that writes computed styles into the document,
  // which the browser then prints.
  std::string html = HelpPage("KCompressorPlugin");
  const std::string probe =
      "<script>const styleOf = s => { const c = getComputedStyle(document.querySelector(s));"
      " return [c.color, c.fontWeight, c.backgroundColor].join('|'); };"
      " document.body.setAttribute('data-probe', ['.control', 'h1', 'h2', '.range'].map(styleOf).join(';'));</script>";
  html.insert(html.rfind("</body>"), probe);
  const fs::path page = kFolder / "probe.html";
  std::ofstream(page, std::ios::binary) << html;
  std::string dom, log;
  ASSERT_EQ(Chromium("--dump-dom", page, dom, log), 0) << log;
  const size_t at = dom.find("data-probe=\"");
  ASSERT_NE(at, std::string::npos) << dom.substr(0, 400);
  const std::string values = dom.substr(at + 12, dom.find('"', at + 12) - at - 12);
  EXPECT_EQ(values,
            "rgb(0, 136, 0)|700|rgba(0, 0, 0, 0);"          // control: #008800, bold
            "rgb(255, 255, 255)|700|rgb(0, 0, 0);"          // h1: white on black
            "rgb(255, 255, 255)|700|rgb(51, 51, 51);"       // h2: white on #333
            "rgb(0, 136, 0)|400|rgba(0, 0, 0, 0)");         // range: #008800
}

}  // namespace
