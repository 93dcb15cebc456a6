// The Windows platform layer under Wine or Windows: files with non-ASCII names replaced whole,
// partial files renamed into place, the roaming data folder, the kernel's folder, the clock.
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <io.h>

#include <chrono>
#include <cstdlib>
#include <string>
#include <thread>
#include <vector>

#include "kernel/KException.h"
#include "kernel/platform/KPlatform.h"

namespace {
template <class Body>
std::string FailureOf(Body&& body) {
  try {
    body();
  } catch (const KException& e) {
    return e.Message().ToUtf8();
  }
  return "(no failure)";
}

class KWindowsPlatform : public testing::Test {
protected:
  void TearDown() override { KPlatform::RemoveFolderTree(folder_); }
  const std::string folder_ = KPlatform::CreateTemporaryFolder();
};
}  // namespace

TEST_F(KWindowsPlatform, AtomicWritesReplaceWholeFilesAndAFailureLeavesTheOldOneAlone) {
  ASSERT_EQ(folder_.back(), '\\');
  const std::string path = folder_ + "Pr\u00E9st \u2713.xml";
  EXPECT_FALSE(KPlatform::ReadFile(path).has_value());
  for (const std::string& text : {std::string(200000, 'x'), std::string("a\0b\xFF\r\n", 6), std::string("old")}) {
    KPlatform::WriteFileAtomically(path, text);
    EXPECT_EQ(KPlatform::ReadFile(path), text);  // no tail of a longer predecessor, no line-end changes
  }
  KPlatform::InjectAtomicWriteFailures(1);
  EXPECT_THAT(FailureOf([&] { KPlatform::WriteFileAtomically(path, "new"); }), testing::StartsWith("Could not write the file '" + path + "' ("));
  EXPECT_EQ(KPlatform::ReadFile(path), "old");
  EXPECT_EQ(KPlatform::ListFiles(folder_), std::vector<std::string>{"Pr\u00E9st \u2713.xml"});
  EXPECT_TRUE(KPlatform::RemoveFile(path));
  EXPECT_FALSE(KPlatform::RemoveFile(path));
  EXPECT_TRUE(KPlatform::ListFiles(folder_ + "missing\\").empty());
}

TEST_F(KWindowsPlatform, APartialFileIsWrittenThroughItsDescriptorAndRenamedOverTheTarget) {
  const std::string path = folder_ + "out.wav";
  KPlatform::WriteFileAtomically(path, "previous");
  std::string partial;
  const int fd = KPlatform::CreatePartialFile(path, partial);
  ASSERT_GE(fd, 0);
  EXPECT_NE(partial, path);
  EXPECT_EQ(::_write(fd, "rendered\n", 9), 9);
  EXPECT_EQ(::_close(fd), 0);
  EXPECT_EQ(KPlatform::ReadFile(path), "previous");  // untouched until the rename
  KPlatform::RenameFile(partial, path);
  EXPECT_EQ(KPlatform::ReadFile(path), "rendered\n");  // binary: no carriage return added
  EXPECT_EQ(KPlatform::ListFiles(folder_), std::vector<std::string>{"out.wav"});
  EXPECT_THAT(FailureOf([&] { KPlatform::RenameFile(partial, path); }), testing::StartsWith("Could not rename the file '" + partial + "' to '"));
}

TEST(KWindowsPlatformFolders, TheRoamingDataFolderAndTheKernelsFolderAreAbsoluteAndEndInABackslash) {
  const std::string home = KPlatform::UserDataHome();
  ASSERT_GE(home.size(), 4u);
  EXPECT_EQ(home.substr(1, 2), ":\\") << home;
  EXPECT_EQ(home.back(), '\\');
  EXPECT_EQ(KPlatform::SubfolderPath(home, "Torvane"), home + "Torvane\\");
  const std::string kernel = KPlatform::KernelFolder();
  EXPECT_EQ(kernel.back(), '\\') << kernel;
  // The fonts are copied beside the kernel (the test links it statically): found from there.
  EXPECT_TRUE(KPlatform::ReadFile(kernel + "DejaVuSans.ttf").has_value()) << kernel;
}

// %APPDATA% moves the user's data when it is absolute (a drive's path or a share's); anything
// else leaves the shell's folder.
TEST(KWindowsPlatformFolders, AnAbsoluteAppDataMovesTheUsersData) {
  const char* old = std::getenv("APPDATA");
  const std::string saved = old ? old : "";
  _putenv_s("APPDATA", "");
  const std::string shell = KPlatform::UserDataHome();
  for (const char* ignored : {"relative\\data", "\\single", "C:"}) {
    _putenv_s("APPDATA", ignored);
    EXPECT_EQ(KPlatform::UserDataHome(), shell) << ignored;
  }
  for (const auto& [set, home] : {std::pair{"D:\\Moved\\Data\\", "D:\\Moved\\Data\\"}, {"E:/data", "E:/data\\"},
                                  {"\\\\server\\share", "\\\\server\\share\\"}}) {
    _putenv_s("APPDATA", set);
    EXPECT_EQ(KPlatform::UserDataHome(), home) << set;
  }
  _putenv_s("APPDATA", saved.c_str());
}

TEST(KWindowsPlatformClock, TheMillisecondClockAdvancesWithTheWallClock) {
  const uint64_t before = KPlatform::MillisecondClock();
  std::this_thread::sleep_for(std::chrono::milliseconds(50));
  const uint64_t after = KPlatform::MillisecondClock();
  EXPECT_GE(after - before, 40u);
  EXPECT_LT(after - before, 5000u);
}
