// Skins: the built-in one, a user's file over it, and every way a file can fail falling back to
// the default with a message, never to an empty look.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <string>
#include <vector>

#include "kernel/KUserMessage.h"
#include "ui/controls/KStyle.h"

namespace {

std::vector<std::string> gMessages;
void Record(const KString& text) { gMessages.push_back(text.ToUtf8()); }

struct SkinFixture : ::testing::Test {
  std::filesystem::path folder = std::filesystem::temp_directory_path() / ("torvane_skin_" + std::to_string(::getpid()));
  KUserMessageHook previous = nullptr;
  void SetUp() override {
    std::filesystem::create_directories(folder);
    gMessages.clear();
    previous = KSetUserMessageHook(Record);
  }
  void TearDown() override {
    KSetUserMessageHook(previous);
    std::filesystem::remove_all(folder);
  }
  std::string Write(const std::string& text, const std::string& name = "skin.xml") {
    std::ofstream((folder / name).string()) << text;
    return (folder / name).string();
  }
  static void ExpectDefault(const KStyle& style) {
    const KStyle fallback;
    for (int32_t c = 0; c < KStyle::kColorCount; ++c) EXPECT_EQ(style.Get(KStyle::Color(c)), fallback.Get(KStyle::Color(c))) << c;
    for (int32_t s = 0; s < KStyle::kSizeCount; ++s) EXPECT_EQ(style.Get(KStyle::Size(s)), fallback.Get(KStyle::Size(s))) << s;
    EXPECT_EQ(style.BackgroundBitmap(), nullptr);
  }
};

TEST_F(SkinFixture, TheDefaultSkinIsOpaqueAndReadable) {
  const KStyle style;
  EXPECT_EQ(style.Name(), KString("Graphite"));
  for (int32_t c = 0; c < KStyle::kColorCount; ++c) {
    if (c == KStyle::kGraphFill) continue;
    EXPECT_EQ(KAlphaOf(style.Get(KStyle::Color(c))), 255u) << c;
  }
  EXPECT_GT(KAlphaOf(style.Get(KStyle::kGraphFill)), 0u);
  EXPECT_NE(style.Get(KStyle::kText), style.Get(KStyle::kPanel));
}

TEST_F(SkinFixture, AUserSkinOverridesOnlyWhatItNames) {
  const std::string path = Write(R"(<Skin Name="Paper"><Colors accent="ff0000" graphFill="00ff0080"/><Sizes knob="64"/></Skin>)");
  const KStyle style = KStyle::Load(path);
  const KStyle fallback;
  EXPECT_TRUE(gMessages.empty());
  EXPECT_EQ(style.Name(), KString("Paper"));
  EXPECT_EQ(style.Get(KStyle::kAccent), 0xFFFF0000u);
  EXPECT_EQ(style.Get(KStyle::kGraphFill), 0x8000FF00u);  // RRGGBBAA
  EXPECT_EQ(style.Get(KStyle::kKnob), 64);
  EXPECT_EQ(style.Get(KStyle::kPanel), fallback.Get(KStyle::kPanel));
  EXPECT_EQ(style.Get(KStyle::kLabelFont), fallback.Get(KStyle::kLabelFont));
}

TEST_F(SkinFixture, AMissingFileIsTheDefaultWithoutAWord) {
  ExpectDefault(KStyle::Load((folder / "none.xml").string()));
  ExpectDefault(KStyle::Load(""));
  EXPECT_TRUE(gMessages.empty());
}

TEST_F(SkinFixture, ABrokenFileIsTheDefaultWithAMessageNamingIt) {
  const std::vector<std::string> broken = {
      "<Skin><Colors accent=\"ff0000\"",                         // cut short
      "<Look><Colors accent=\"ff0000\"/></Look>",                // another root
      "<Skin><Colors accent=\"red\"/></Skin>",                   // not a colour
      "<Skin><Colors accent=\"ff00000\"/></Skin>",               // seven digits
      "<Skin><Colors text=\"ffffff\"/><Fonts label=\"0\"/></Skin>",  // a good value beside a bad one
      "<Skin><Sizes knob=\"12px\"/></Skin>",
      "<Skin><Bitmaps background=\"missing.png\"/></Skin>",
  };
  for (const std::string& text : broken) {
    gMessages.clear();
    const std::string path = Write(text);
    ExpectDefault(KStyle::Load(path));
    ASSERT_EQ(gMessages.size(), 1u) << text;
    EXPECT_NE(gMessages[0].find(path), std::string::npos) << gMessages[0];
    EXPECT_NE(gMessages[0].find("default skin"), std::string::npos) << gMessages[0];
  }
}

TEST_F(SkinFixture, ABackgroundBitmapIsReadFromBesideTheSkin) {
  KBitmap tile(4, 4);
  tile.Fill(0xFF336699);
  tile.Store((folder / "tile.png").string());
  const KStyle style = KStyle::Load(Write(R"(<Skin><Bitmaps background="tile.png"/></Skin>)"));
  ASSERT_NE(style.BackgroundBitmap(), nullptr);
  EXPECT_EQ(style.BackgroundBitmap()->Pixel(3, 3), 0xFF336699u);
  // A damaged image is a broken skin like any other.
  Write("not a picture", "tile.png");
  ExpectDefault(KStyle::Load(Write(R"(<Skin><Bitmaps background="tile.png"/></Skin>)")));
  EXPECT_EQ(gMessages.size(), 1u);
}

}  // namespace
