// Whole-file storage and the user's data folders, in a fresh temporary folder each time.
#include <gtest/gtest.h>

#include <cstdlib>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "kernel/KException.h"
#include "kernel/KFileStore.h"
#include "kernel/KModule.h"
#include "kernel/platform/KPlatform.h"

template <class Body>
static std::string FailureOf(Body&& body) {
  try {
    body();
  } catch (const KException& e) {
    return e.Message().ToUtf8();
  }
  return "(no failure)";
}

class KFileStoreFiles : public testing::Test {
protected:
  void TearDown() override {
    for (const auto& [name, value] : saved_) value ? setenv(name, value->c_str(), 1) : unsetenv(name);
    KPlatform::RemoveFolderTree(folder_);
  }
  static std::pair<const char*, std::optional<std::string>> Saved(const char* name) {
    return {name, std::getenv(name) ? std::optional<std::string>(std::getenv(name)) : std::nullopt};
  }
  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  const std::pair<const char*, std::optional<std::string>> saved_[2] = {Saved("XDG_DATA_HOME"), Saved("HOME")};
};

TEST_F(KFileStoreFiles, WritesReplaceWholeFilesAndAFailedOneLeavesTheOldFileAndNoTemporary) {
  const std::string path = folder_ + "Pr\u00E9st \u2713.xml";
  EXPECT_EQ(FailureOf([&] { KFileStore::ReadText(path); }), "The file '" + path + "' does not exist.");
  for (const std::string& text : {std::string(200000, 'x'), std::string("a\0b\xFF\n", 5), std::string("old")}) {
    KFileStore::WriteTextAtomically(path, text);
    EXPECT_EQ(KFileStore::ReadText(path), text);  // no tail of a longer predecessor
  }
  KPlatform::InjectAtomicWriteFailures(1);  // as on a full disk, once the temporary is written
  EXPECT_EQ(FailureOf([&] { KFileStore::WriteTextAtomically(path, "new"); }),
            "Could not write the file '" + path + "' (No space left on device).");
  EXPECT_EQ(KFileStore::ReadText(path), "old");
  EXPECT_EQ(KPlatform::ListFiles(folder_), std::vector<std::string>{"Pr\u00E9st \u2713.xml"});
}

TEST_F(KFileStoreFiles, UserDataFoldersFollowXdgThenHomeAndAreMadeOnDemand) {
  setenv("HOME", (folder_ + "home").c_str(), 1);
  for (const char* ignored : {"", "relative/share"}) {  // only an absolute XDG_DATA_HOME counts
    setenv("XDG_DATA_HOME", ignored, 1);
    EXPECT_EQ(KPlatform::UserDataHome(), folder_ + "home/.local/share/");
  }
  unsetenv("XDG_DATA_HOME");
  EXPECT_EQ(KModule::GetDataPath_Shared(), folder_ + "home/.local/share/Torvane/");
  unsetenv("HOME");
  EXPECT_EQ(FailureOf([] { KPlatform::UserDataHome(); }), "Could not find the user's data folder: neither XDG_DATA_HOME nor HOME is set.");

  setenv("XDG_DATA_HOME", (folder_ + "xdg//").c_str(), 1);
  const std::string family = folder_ + "xdg/Torvane/";
  EXPECT_EQ(KModule(KString::FromUtf8("\u00C9qualiseur \u2713")).GetDataPath_User(), family + "\u00C9qualiseur \u2713/");
  KFileStore::WriteTextAtomically(family + "\u00C9qualiseur \u2713/probe", "x");  // throws unless the folder was made
  // Names that are no single safe folder name.
  EXPECT_EQ(KModule(KString::FromUtf8("M/S: Tool?*")).GetDataPath_User(), family + "M_S_ Tool__/");
  EXPECT_EQ(KModule(KString::FromUtf8("..")).GetDataPath_User(), family + "_../");
  EXPECT_EQ(KModule(KString()).GetDataPath_User(), family + "_/");
}

TEST_F(KFileStoreFiles, FoldersListApartFromFilesAndPathsClimbToTheRoot) {
  KPlatform::CreateFolders(folder_ + "b rooms/inner/");
  KPlatform::CreateFolders(folder_ + "A halls/");
  KPlatform::CreateFolders(folder_ + ".hidden/");
  KPlatform::WriteFileAtomically(folder_ + "hall.wav", "RIFF");
  EXPECT_EQ(KPlatform::ListFolders(folder_), (std::vector<std::string>{".hidden", "A halls", "b rooms"}));
  EXPECT_EQ(KPlatform::ListFiles(folder_), std::vector<std::string>{"hall.wav"});
  EXPECT_TRUE(KPlatform::ListFolders(folder_ + "missing/").empty());
  // A file is no folder to list.
  EXPECT_EQ(FailureOf([&] { KPlatform::ListFolders(folder_ + "hall.wav"); }).rfind("Could not list the folder '" + folder_ + "hall.wav'", 0), 0u);

  EXPECT_EQ(KPlatform::ParentFolder(folder_ + "b rooms/inner/"), folder_ + "b rooms/");
  EXPECT_EQ(KPlatform::ParentFolder(folder_ + "b rooms/inner"), folder_ + "b rooms/");
  EXPECT_EQ(KPlatform::ParentFolder(folder_ + "hall.wav"), folder_);
  EXPECT_EQ(KPlatform::ParentFolder("/tmp/"), "/");
  EXPECT_EQ(KPlatform::ParentFolder("/"), "/");
  EXPECT_EQ(KPlatform::AsFolder(folder_ + "A halls"), folder_ + "A halls/");
  EXPECT_EQ(KPlatform::AsFolder(folder_), folder_);

  setenv("HOME", (folder_ + "home").c_str(), 1);
  EXPECT_EQ(KPlatform::HomeFolder(), folder_ + "home/");
  unsetenv("HOME");
  EXPECT_EQ(FailureOf([] { KPlatform::HomeFolder(); }), "Could not find the user's home folder.");
}
