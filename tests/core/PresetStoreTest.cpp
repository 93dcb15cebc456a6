// The preset store against real files in a fresh folder (XDG_DATA_HOME points there).
#include <gtest/gtest.h>

#include <cstdlib>
#include <optional>

#include "core/KPresetStore.h"
#include "kernel/KFileStore.h"
#include "kernel/KModule.h"
#include "kernel/platform/KPlatform.h"
#include "tests/core/TraceCapture.h"

namespace {
using Names = std::vector<std::string>;

KString Text(const std::string& utf8) { return KString::FromUtf8(utf8); }

Element State(const std::string& gain) {
  Element state("State");
  state.SetAttribute("Gain", Text(gain));
  state.AddChild("Controllers").SetAttribute("Enabled", "1");
  return state;
}

class KPresetStoreFiles : public testing::Test {
protected:
  void SetUp() override {
    if (const char* old = std::getenv("XDG_DATA_HOME")) saved_ = old;
    setenv("XDG_DATA_HOME", folder_.c_str(), 1);
    store_.emplace(KModule(Text("Test Plug")));
  }
  void TearDown() override {
    saved_ ? setenv("XDG_DATA_HOME", saved_->c_str(), 1) : unsetenv("XDG_DATA_HOME");
    KPlatform::RemoveFolderTree(folder_);
  }
  Names List() {
    Names names;
    for (const KString& name : store_->ListNames()) names.push_back(name.ToUtf8());
    return names;
  }

  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  const std::string path_ = folder_ + "Torvane/Test Plug/presets.xml";
  std::optional<std::string> saved_;
  std::optional<KPresetStore> store_;
};
}  // namespace

TEST_F(KPresetStoreFiles, AwkwardNamesSurviveStoreListLoadRenameAndDelete) {
  EXPECT_EQ(KFailureOf([&] { store_->Load("Warm"); }), "There is no preset named 'Warm'.");  // no file yet
  const Names names = {"Warm", "Ünïcødé ✓ 🎵", "a&b<c>\"d\" 'e'", "  spaced  ", "tab\tand\nline"};
  for (size_t i = 0; i < names.size(); ++i) store_->Store(Text(names[i]), State(std::to_string(i)));
  store_->Store(Text(names[1]), State("new"));  // replaced in place
  EXPECT_EQ(List(), names);
  for (size_t i = 0; i < names.size(); ++i) EXPECT_EQ(store_->Load(Text(names[i])), State(i == 1 ? "new" : std::to_string(i)));
  EXPECT_EQ(KFailureOf([&] { store_->Rename("Warm", Text(names[3])); }), "A preset named '  spaced  ' already exists.");
  store_->Rename(Text(names[2]), Text("Çé ✓"));
  store_->Delete(Text(names[1]));
  EXPECT_EQ(List(), (Names{"Warm", "Çé ✓", "  spaced  ", "tab\tand\nline"}));
  EXPECT_EQ(store_->Load(Text("Çé ✓")), State("2"));
  EXPECT_EQ(KPlatform::ListFiles(folder_ + "Torvane/Test Plug/"), Names{"presets.xml"});
}

TEST_F(KPresetStoreFiles, ACorruptFileIsReportedAndNeverTouched) {
  for (const std::string corrupt : {"<Presets><Preset Name=\"A\"><State/></Preset>", "<Presets><1/></Presets>"}) {
    KFileStore::WriteTextAtomically(path_, corrupt);
    const std::string reported = KFailureOf([&] { store_->ListNames(); });
    EXPECT_TRUE(reported.starts_with("Could not read the file '" + path_ + "'. Invalid file contents. ")) << reported;
    EXPECT_EQ(KFailureOf([&] { store_->Load("A"); }), reported);
    EXPECT_EQ(KFailureOf([&] { store_->Store("A", State("1")); }), reported);
    EXPECT_EQ(KFailureOf([&] { store_->Rename("A", "B"); }), reported);
    EXPECT_EQ(KFailureOf([&] { store_->Delete("A"); }), reported);
    EXPECT_EQ(KFileStore::ReadText(path_), corrupt);
  }
}
