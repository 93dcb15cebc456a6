// The preset store against real files in a fresh folder (XDG_DATA_HOME points there): round
// trips with awkward names, refusals, corrupt files left alone byte for byte, failed writes,
// the shared configuration, and concurrent stores.
#include <gtest/gtest.h>

#include <atomic>
#include <cstdlib>
#include <optional>
#include <string>
#include <thread>
#include <vector>

#include "core/KPresetStore.h"
#include "core/KXMLReader.h"
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

KString Text(const char* utf8) { return KString::FromUtf8(utf8); }

// A plug-in state tree with one value and a nested section.
Element State(const char* gain) {
  Element state("State");
  state.SetAttribute("Gain", Text(gain));
  state.AddChild("Controllers").SetAttribute("ControllersEnabled", "1");
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
    if (saved_) setenv("XDG_DATA_HOME", saved_->c_str(), 1);
    else unsetenv("XDG_DATA_HOME");
    KPlatform::RemoveFolderTree(folder_);
  }

  Names List() const {
    Names names;
    for (const KString& name : store_->ListNames()) names.push_back(name.ToUtf8());
    return names;
  }
  std::string FileText() const { return KFileStore::ReadText(store_->PresetsPath()); }
  Names FilesInPluginFolder() const { return KPlatform::ListFiles(folder_ + "Torvane/Test Plug/"); }

  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  std::optional<std::string> saved_;
  std::optional<KPresetStore> store_;
};
}  // namespace

TEST_F(KPresetStoreFiles, AMissingFileHoldsNoPresetsAndRefusalsWriteNothing) {
  EXPECT_EQ(store_->PresetsPath(), folder_ + "Torvane/Test Plug/presets.xml");
  EXPECT_EQ(List(), Names{});
  const std::string absent = "There is no preset named 'Warm'.";
  EXPECT_EQ(FailureOf([&] { store_->Load("Warm"); }), absent);
  EXPECT_EQ(FailureOf([&] { store_->Rename("Warm", "Cold"); }), absent);
  EXPECT_EQ(FailureOf([&] { store_->Delete("Warm"); }), absent);
  EXPECT_EQ(FailureOf([&] { store_->Store("", State("1")); }), "A preset needs a name.");
  EXPECT_EQ(FilesInPluginFolder(), Names{});  // the folder exists, nothing written
}

TEST_F(KPresetStoreFiles, AwkwardNamesRoundTripInFileOrderAndReplaceInPlace) {
  const Names names = {"Warm", "Ünïcødé ✓ 🎵", "a&b<c>\"d\" 'e'", "  spaced  ", "tab\tand\nline"};
  for (size_t i = 0; i < names.size(); ++i) store_->Store(Text(names[i].c_str()), State(std::to_string(i).c_str()));
  store_->Store(Text(names[1].c_str()), State("new"));
  EXPECT_EQ(List(), names);
  EXPECT_EQ(store_->Load(Text(names[1].c_str())), State("new"));
  for (size_t i : {0u, 2u, 3u, 4u}) EXPECT_EQ(store_->Load(Text(names[i].c_str())), State(std::to_string(i).c_str())) << names[i];

  // The documented layout, as another tool would read it.
  const Element root = KXMLReader::Read(FileText());
  EXPECT_EQ(root.GetName().ToUtf8(), "Presets");
  ASSERT_EQ(root.ChildCount(), static_cast<int32_t>(names.size()));
  EXPECT_EQ(root.GetChild(2).GetName().ToUtf8(), "Preset");
  EXPECT_EQ(root.GetChild(2).GetAttribute("Name").ToUtf8(), names[2]);
  EXPECT_EQ(root.GetChild(2).GetChild(0), State("2"));
  EXPECT_EQ(FilesInPluginFolder(), Names{"presets.xml"});
}

TEST_F(KPresetStoreFiles, RenameAndDeleteKeepOrderAndForeignContent) {
  KFileStore::WriteTextAtomically(store_->PresetsPath(),
                                  "<Presets Version=\"2\"><Folder Name=\"Mine\"/><Preset Name=\"A\"><State/></Preset>"
                                  "<Preset Name=\"B\"/><Preset Name=\"C\"><State/></Preset></Presets>");
  EXPECT_EQ(List(), (Names{"A", "B", "C"}));  // the "Folder" is no preset
  EXPECT_EQ(FailureOf([&] { store_->Load("B"); }), "The preset 'B' holds no settings.");

  const std::string before = FileText();
  EXPECT_EQ(FailureOf([&] { store_->Rename("A", "C"); }), "A preset named 'C' already exists.");
  EXPECT_EQ(FailureOf([&] { store_->Rename("A", ""); }), "A preset needs a name.");
  store_->Rename("A", "A");
  EXPECT_EQ(FileText(), before);

  store_->Rename("C", Text("Çé ✓"));
  store_->Delete("A");
  EXPECT_EQ(List(), (Names{"B", "Çé ✓"}));
  EXPECT_EQ(store_->Load(Text("Çé ✓")), Element("State"));
  const Element root = KXMLReader::Read(FileText());
  EXPECT_EQ(root.GetAttribute("Version").ToUtf8(), "2");
  EXPECT_EQ(root.GetChild(0).GetName().ToUtf8(), "Folder");
}

TEST_F(KPresetStoreFiles, ACorruptFileIsReportedAndNeverTouched) {
  const std::string path = store_->PresetsPath();
  for (const std::string corrupt : {"<Presets><Preset Name=\"A\"><State/></Preset>", "", "<Presets><1/></Presets>"}) {
    KFileStore::WriteTextAtomically(path, corrupt);
    const std::string message = FailureOf([&] { store_->ListNames(); });
    EXPECT_EQ(message.rfind("Could not read the file '" + path + "'. Invalid file contents. ", 0), 0u) << message;
    EXPECT_EQ(FailureOf([&] { store_->Load("A"); }), message);
    EXPECT_EQ(FailureOf([&] { store_->Store("A", State("1")); }), message);
    EXPECT_EQ(FailureOf([&] { store_->Rename("A", "B"); }), message);
    EXPECT_EQ(FailureOf([&] { store_->Delete("A"); }), message);
    EXPECT_EQ(FileText(), corrupt);
  }
  KFileStore::WriteTextAtomically(path, "<Configuration/>");  // well formed, but no presets
  EXPECT_EQ(FailureOf([&] { store_->Store("A", State("1")); }), "The file '" + path + "' is not a presets file.");
  EXPECT_EQ(FileText(), "<Configuration/>");
  EXPECT_EQ(FilesInPluginFolder(), Names{"presets.xml"});
}

TEST_F(KPresetStoreFiles, AFailedStoreLeavesThePresetsAsTheyWere) {
  store_->Store("A", State("1"));
  const std::string before = FileText();
  KPlatform::InjectAtomicWriteFailures(1);
  EXPECT_EQ(FailureOf([&] { store_->Store("B", State("2")); }),
            "Could not write the file '" + store_->PresetsPath() + "' (No space left on device).");
  EXPECT_EQ(FailureOf([&] { store_->Store("C", Element("not a name")); }), "Invalid XML name. 'not a name'");
  EXPECT_EQ(FileText(), before);
  EXPECT_EQ(FilesInPluginFolder(), Names{"presets.xml"});
}

TEST_F(KPresetStoreFiles, TheConfigurationIsOneTreeSharedByTheFamily) {
  EXPECT_EQ(store_->ConfigurationPath(), folder_ + "Torvane/KPluginConfiguration.xml");
  EXPECT_EQ(store_->LoadConfiguration(), Element("Configuration"));
  Element configuration("Settings");
  configuration.SetAttribute("Skin", Text("Dark ✓"));
  configuration.AddChild("Window").SetAttribute("Size", "800,600");
  store_->StoreConfiguration(configuration);

  configuration.SetName("Configuration");
  EXPECT_EQ(KPresetStore(KModule(Text("Other Plug"))).LoadConfiguration(), configuration);
  KFileStore::WriteTextAtomically(store_->ConfigurationPath(), "<Configuration");
  const std::string message = FailureOf([&] { store_->LoadConfiguration(); });
  EXPECT_EQ(message.rfind("Could not read the file '" + store_->ConfigurationPath() + "'. Invalid", 0), 0u) << message;
  EXPECT_EQ(FailureOf([&] { store_->StoreConfiguration(configuration); }), message);
  EXPECT_EQ(KFileStore::ReadText(store_->ConfigurationPath()), "<Configuration");
}

// Stores are last-writer-wins: racing stores of one preset leave one of the two states, and a
// reader meanwhile always finds a whole file.
TEST_F(KPresetStoreFiles, ConcurrentStoresLeaveAValidFile) {
  store_->Store("Shared", State("start"));
  // Failures are counted, not thrown, so that the threads are always joined.
  std::atomic<int> writersLeft{2}, failures{0};
  auto writer = [&](const char* gain) {
    KPresetStore own(KModule(Text("Test Plug")));
    for (int i = 0; i < 30; ++i) failures += FailureOf([&] { own.Store("Shared", State(gain)); }) != "(no failure)";
    --writersLeft;
  };
  std::thread first(writer, "first"), second(writer, "second");
  do {
    failures += FailureOf([&] { store_->Load("Shared"); }) != "(no failure)";
  } while (writersLeft > 0);
  first.join();
  second.join();
  EXPECT_EQ(failures, 0);
  const Element last = store_->Load("Shared");
  EXPECT_TRUE(last == State("first") || last == State("second"));
  EXPECT_EQ(FilesInPluginFolder(), Names{"presets.xml"});
}
