// Whole-file storage: atomic replacement and what a failed write leaves, the folder and file
// primitives of the platform layer, and where the user's data folders are. Every test works in
// a fresh temporary folder; XDG_DATA_HOME and HOME point there and are restored afterwards.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "kernel/KException.h"
#include "kernel/KFileStore.h"
#include "kernel/KModule.h"
#include "kernel/platform/KPlatform.h"

namespace {
using Names = std::vector<std::string>;

template <class Body>
std::string FailureOf(Body&& body) {
  try {
    body();
  } catch (const KException& e) {
    return e.Message().ToUtf8();
  }
  return "(no failure)";
}

std::optional<std::string> Environment(const char* name) {
  const char* value = std::getenv(name);
  return value ? std::optional<std::string>(value) : std::nullopt;
}

void SetEnvironment(const char* name, const std::optional<std::string>& value) {
  if (value) setenv(name, value->c_str(), 1);
  else unsetenv(name);
}

class KFileStoreFiles : public testing::Test {
protected:
  void TearDown() override {
    SetEnvironment("XDG_DATA_HOME", xdg_);
    SetEnvironment("HOME", home_);
    KPlatform::RemoveFolderTree(folder_);
  }

  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  const std::optional<std::string> xdg_ = Environment("XDG_DATA_HOME"), home_ = Environment("HOME");
};
}  // namespace

TEST_F(KFileStoreFiles, ReplacesWholeFilesAndReportsMissingOnes) {
  const std::string path = folder_ + "Prést ✓.xml";
  EXPECT_FALSE(KFileStore::ReadTextIfExists(path).has_value());
  EXPECT_EQ(FailureOf([&] { KFileStore::ReadText(path); }), "The file '" + path + "' does not exist.");
  for (const std::string& text : {std::string(200000, 'x'), std::string("a\0b\xFF\n", 5), std::string()}) {
    KFileStore::WriteTextAtomically(path, text);
    EXPECT_EQ(KFileStore::ReadText(path), text);  // no tail of a longer predecessor
  }
  EXPECT_EQ(KPlatform::ListFiles(folder_), Names{"Prést ✓.xml"});
  EXPECT_EQ(FailureOf([&] { KFileStore::ReadText(folder_); }), "Could not read the file '" + folder_ + "' (Is a directory).");
}

TEST_F(KFileStoreFiles, AFailedWriteLeavesTheOldFileAndNoTemporary) {
  const std::string path = folder_ + "settings.xml";
  KFileStore::WriteTextAtomically(path, "old");
  KPlatform::InjectAtomicWriteFailures(1);
  EXPECT_EQ(FailureOf([&] { KFileStore::WriteTextAtomically(path, "new"); }),
            "Could not write the file '" + path + "' (No space left on device).");
  EXPECT_EQ(KFileStore::ReadText(path), "old");

  // A parent that is a regular file: not even the temporary file can be made.
  EXPECT_EQ(FailureOf([&] { KFileStore::WriteTextAtomically(path + "/x", "new"); }),
            "Could not write the file '" + path + "/x' (Not a directory).");
  // A target that is a folder: the temporary is written, the rename fails and is cleaned up.
  KPlatform::CreateFolders(folder_ + "taken/");
  KFileStore::WriteTextAtomically(folder_ + "taken/inside", "kept");
  EXPECT_EQ(FailureOf([&] { KFileStore::WriteTextAtomically(folder_ + "taken", "new"); }),
            "Could not write the file '" + folder_ + "taken' (Is a directory).");
  EXPECT_EQ(KFileStore::ReadText(folder_ + "taken/inside"), "kept");
  EXPECT_EQ(KPlatform::ListFiles(folder_), Names{"settings.xml"});

  KFileStore::WriteTextAtomically(path, "new");  // the injected failure was used up
  EXPECT_EQ(KFileStore::ReadText(path), "new");
}

TEST_F(KFileStoreFiles, ConcurrentWritersNeverShowAReaderAMixture) {
  const std::string path = folder_ + "shared.xml";
  const std::string a(100000, 'a'), b(150000, 'b');
  KFileStore::WriteTextAtomically(path, a);
  std::atomic<int> writersLeft{2};
  auto writer = [&](const std::string& text) {
    for (int i = 0; i < 40; ++i) KFileStore::WriteTextAtomically(path, text);
    --writersLeft;
  };
  std::thread first(writer, a), second(writer, b);
  int mixtures = 0;
  do {
    const std::string seen = KFileStore::ReadText(path);
    mixtures += seen != a && seen != b;
  } while (writersLeft > 0);
  first.join();
  second.join();
  EXPECT_EQ(mixtures, 0);
  EXPECT_EQ(KPlatform::ListFiles(folder_), Names{"shared.xml"});
}

TEST_F(KFileStoreFiles, FolderPrimitivesListRenameAndRemove) {
  const std::string nested = folder_ + "a/b/";
  KPlatform::CreateFolders(nested);
  KPlatform::CreateFolders(nested);  // existing is fine
  for (const char* name : {"z", ".hidden", "B", "a"}) KFileStore::WriteTextAtomically(nested + name, name);
  KPlatform::CreateFolders(nested + "sub/");
  EXPECT_EQ(KPlatform::ListFiles(nested), (Names{".hidden", "B", "a", "z"}));
  EXPECT_EQ(KPlatform::ListFiles(folder_ + "missing/"), Names{});
  EXPECT_EQ(FailureOf([&] { KPlatform::ListFiles(nested + "a"); }), "Could not list the folder '" + nested + "a' (Not a directory).");
  EXPECT_EQ(FailureOf([&] { KPlatform::CreateFolders(nested + "a/c/"); }),
            "Could not create the folder '" + nested + "a/c/' (Not a directory).");

  KPlatform::RenameFile(nested + "a", nested + "z");
  EXPECT_EQ(KFileStore::ReadText(nested + "z"), "a");
  EXPECT_EQ(FailureOf([&] { KPlatform::RenameFile(nested + "a", nested + "y"); }),
            "Could not rename the file '" + nested + "a' to '" + nested + "y' (No such file or directory).");
  EXPECT_TRUE(KPlatform::RemoveFile(nested + "z"));
  EXPECT_FALSE(KPlatform::RemoveFile(nested + "z"));
  EXPECT_EQ(FailureOf([&] { KPlatform::RemoveFile(nested + "sub"); }), "Could not remove the file '" + nested + "sub' (Is a directory).");
  EXPECT_EQ(KPlatform::ListFiles(nested), (Names{".hidden", "B"}));
}

TEST_F(KFileStoreFiles, UserDataFoldersFollowXdgThenHomeAndAreMadeOnDemand) {
  setenv("HOME", (folder_ + "home").c_str(), 1);
  for (const char* ignored : {"", "relative/share"}) {
    setenv("XDG_DATA_HOME", ignored, 1);
    EXPECT_EQ(KPlatform::UserDataHome(), folder_ + "home/.local/share/");
  }
  unsetenv("XDG_DATA_HOME");
  EXPECT_EQ(KPlatform::UserDataHome(), folder_ + "home/.local/share/");
  unsetenv("HOME");
  EXPECT_EQ(FailureOf([] { KPlatform::UserDataHome(); }), "Could not find the user's data folder: neither XDG_DATA_HOME nor HOME is set.");

  setenv("XDG_DATA_HOME", (folder_ + "xdg//").c_str(), 1);
  const std::string family = folder_ + "xdg/Torvane/";
  EXPECT_EQ(FailureOf([&] { KFileStore::WriteTextAtomically(family + "probe", "x"); }),
            "Could not write the file '" + family + "probe' (No such file or directory).");
  EXPECT_EQ(KModule(KString::FromUtf8("Équaliseur ✓")).GetDataPath_User(), family + "Équaliseur ✓/");
  KFileStore::WriteTextAtomically(family + "Équaliseur ✓/probe", "x");  // the folder now exists
  EXPECT_EQ(KModule::GetDataPath_Shared(), family);

  // Names that are no single safe folder name.
  EXPECT_EQ(KModule(KString::FromUtf8("M/S: Tool?*")).GetDataPath_User(), family + "M_S_ Tool__/");
  EXPECT_EQ(KModule(KString::FromUtf8("..")).GetDataPath_User(), family + "_../");
  EXPECT_EQ(KModule(KString()).GetDataPath_User(), family + "_/");

  KPlatform::RemoveFolderTree(family);
  KFileStore::WriteTextAtomically(folder_ + "xdg/Torvane", "in the way");
  EXPECT_EQ(FailureOf([] { KModule::GetDataPath_Shared(); }), "Could not create the folder '" + family + "' (File exists).");
}
