// The convolution reverb's impulse response chosen in the editor: the chooser lists a folder's
// sub-folders and sound files, goes down and up, takes a typed path, and a chosen file plays,
// shows in the graph and is saved with the state.
#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include "kernel/KUserMessage.h"
#include "kernel/platform/KPlatform.h"
#include "plugins/KPluginEditors.h"
#include "plugins/convolutionreverb/KConvolutionReverbPlugin.h"
#include "tests/ui/DrawerTestSupport.h"
#include "tests/ui/EditorTestSupport.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KFileChooser.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KTimeGraph.h"
#include "ui/editor/KHelpPanel.h"

namespace {
using R = KConvolutionReverbPlugin;

std::vector<std::string> gMessages;
void Record(const KString& text) { gMessages.push_back(text.ToUtf8()); }

// A mono 16-bit WAV file at 48 kHz of `length` samples, silent but for full scale at `click`.
void WriteClickWav(const std::string& path, int32_t length, int32_t click) {
  const auto word = [](std::string& s, uint32_t v, int bytes) {
    for (int i = 0; i < bytes; ++i) s.push_back(static_cast<char>((v >> (8 * i)) & 0xFF));
  };
  std::string data;
  for (int32_t i = 0; i < length; ++i) word(data, i == click ? 0x7FFF : 0, 2);
  std::string file = "RIFF";
  word(file, static_cast<uint32_t>(36 + data.size()), 4);
  file += "WAVEfmt ";
  word(file, 16, 4);
  word(file, 1, 2);          // PCM
  word(file, 1, 2);          // one channel
  word(file, 48000, 4);
  word(file, 48000 * 2, 4);  // bytes per second
  word(file, 2, 2);          // bytes per frame
  word(file, 16, 2);
  file += "data";
  word(file, static_cast<uint32_t>(data.size()), 4);
  KPlatform::WriteFileAtomically(path, file + data);
}

std::vector<std::string> Names(const KFileChooser& chooser) {
  std::vector<std::string> names;
  for (const KFileChooser::Entry& e : chooser.Entries()) names.push_back(e.name + (e.folder ? "/" : ""));
  return names;
}

int32_t IndexOf(const KFileChooser& chooser, const std::string& name) {
  for (size_t i = 0; i < chooser.Entries().size(); ++i)
    if (chooser.Entries()[i].name == name) return static_cast<int32_t>(i);
  ADD_FAILURE() << "no entry " << name;
  return -1;
}

class ImpulseFileChoice : public ::testing::Test {
protected:
  void SetUp() override {
    ASSERT_TRUE(reverb_.SetSampleRate(48000.0));
    KPlatform::CreateFolders(folder_ + "Rooms/");
    KPlatform::CreateFolders(folder_ + ".cache/");
    WriteClickWav(folder_ + "hall.wav", 4800, 2400);
    WriteClickWav(folder_ + "Rooms/small.WAV", 2000, 100);
    KPlatform::WriteFileAtomically(folder_ + "Plate.FLAC", "not really");
    KPlatform::WriteFileAtomically(folder_ + "notes.txt", "");
    KPlatform::WriteFileAtomically(folder_ + ".hidden.wav", "");
    // The chooser starts in the loaded file's folder.
    reverb_.SetImpulseResponseFile(KString::FromUtf8(folder_ + "Rooms/small.WAV"));
    editor_ = KMakePluginEditor(reverb_, nullptr);
    editor_->Tree().Tick();
  }
  void TearDown() override { KPlatform::RemoveFolderTree(folder_); }

  KButton& Button(const char* help) {
    KButton* button = KFindControl<KButton>(editor_->Tree().Root(), [help](KButton& b) { return b.HelpKey().ToUtf8() == help; });
    EXPECT_NE(button, nullptr) << help;
    return *button;
  }
  KFileChooser* Chooser() { return KFindControl<KFileChooser>(editor_->Tree().Root(), [](KFileChooser&) { return true; }); }
  void Click(KPoint at, uint64_t ms) {
    editor_->Tree().MouseDown({at}, ms);
    editor_->Tree().MouseUp({at});
  }
  void Key(int32_t key) { editor_->Tree().Key({key}); }

  const std::unique_ptr<KAudioPlugin> plugin_ = KMakeCataloguePlugin("KConvolutionReverbPlugin");
  R& reverb_ = static_cast<R&>(*plugin_);
  const std::string folder_ = KPlatform::CreateTemporaryFolder();
  std::unique_ptr<KEditor> editor_;
};

}  // namespace

TEST_F(ImpulseFileChoice, ListsFoldersAndSoundFilesNavigatesAndLoadsTheChosenFile) {
  Click(KCentreOf(Button("impulsefile")), 1000);
  KFileChooser* chooser = Chooser();
  ASSERT_NE(chooser, nullptr);
  EXPECT_EQ(chooser->Folder(), folder_ + "Rooms/");
  EXPECT_EQ(Names(*chooser), (std::vector<std::string>{"../", "small.WAV"}));

  // Backspace goes up: folders first, then the sound files in any case; no hidden entries, no text.
  Key(kKeyBackspace);
  EXPECT_EQ(chooser->Folder(), folder_);
  EXPECT_EQ(Names(*chooser), (std::vector<std::string>{"../", "Rooms/", "Plate.FLAC", "hall.wav"}));
  KPlatform::WriteFileAtomically(KPicturePath("file-chooser.png"), editor_->Render().EncodePNG());
  // A double click opens a folder; ".." comes back.
  const KPoint rooms = KCentreOf(chooser->RowArea(IndexOf(*chooser, "Rooms")));
  Click(rooms, 2000);
  Click(rooms, 2100);
  EXPECT_EQ(chooser->Folder(), KPlatform::SubfolderPath(folder_, "Rooms"));
  const KPoint up = KCentreOf(chooser->RowArea(0));
  Click(up, 3000);
  Click(up, 3100);
  ASSERT_EQ(chooser->Folder(), folder_);

  // Selecting with the keys and Return chooses the file: the chooser closes and the file plays.
  Key(kKeyEnd);
  ASSERT_EQ(chooser->Selected(), IndexOf(*chooser, "hall.wav"));
  Key(kKeyReturn);
  EXPECT_EQ(Chooser(), nullptr);
  EXPECT_EQ(reverb_.ImpulseResponseFile().ToUtf8(), folder_ + "hall.wav");
  ASSERT_NE(reverb_.PlayingEnvelope(), nullptr);
  EXPECT_NEAR(reverb_.PlayingEnvelope()->seconds, 0.1, 1e-9);
  EXPECT_NE(reverb_.WriteState().find(folder_ + "hall.wav"), std::string::npos);

  // The graph shows the new response: a span of 100 ms, loudest where the click is (50 ms).
  editor_->Tree().Tick();
  editor_->Render();
  KTimeGraph* graph = KFindControl<KTimeGraph>(editor_->Tree().Root(), [](KTimeGraph&) { return true; });
  ASSERT_NE(graph, nullptr);
  EXPECT_DOUBLE_EQ(graph->Span(), 0.1);
  const std::vector<double>& curve = graph->Curve();
  const auto loudest = std::max_element(curve.begin(), curve.end()) - curve.begin();
  EXPECT_NEAR((-KGraph::kLead + (1 + KGraph::kLead) * double(loudest) / double(curve.size() - 1)) * 0.1, 0.05, 0.001);

  // The built-in space again: the file is forgotten, in the state too.
  Click(KCentreOf(Button("builtinspace")), 5000);
  EXPECT_TRUE(reverb_.ImpulseResponseFile().IsEmpty());
  EXPECT_EQ(reverb_.WriteState().find("hall.wav"), std::string::npos);
  editor_->Tree().Tick();
  EXPECT_FALSE(Button("builtinspace").IsEnabled());
}

TEST_F(ImpulseFileChoice, TypedPathsCancelAndFoldersThatCannotBeListed) {
  Click(KCentreOf(Button("impulsefile")), 1000);
  KFileChooser* chooser = Chooser();
  ASSERT_NE(chooser, nullptr);
  // A click on the path types another: a folder is shown...
  const auto type = [&](const std::string& path) {
    Click(KCentreOf(chooser->PathArea()), 2000);
    KTextField* field = KFindControl<KTextField>(editor_->Tree().Root(), [](KTextField&) { return true; });
    ASSERT_NE(field, nullptr);
    for (int32_t i = field->Text().Length(); i > 0; --i) Key(kKeyBackspace);
    for (char c : path) Key(c);
    Key(kKeyReturn);
  };
  type(folder_ + "Rooms");
  EXPECT_EQ(chooser->Folder(), KPlatform::SubfolderPath(folder_, "Rooms"));
  // ...a file that is none shows the reason in place of the entries, with the way up...
  type(folder_ + "notes.txt");
  EXPECT_EQ(Names(*chooser), std::vector<std::string>{"../"});
  EXPECT_NE(chooser->Problem().ToUtf8().find("Could not list the folder"), std::string::npos);
  // ...and Cancel closes without a choice.
  Click(KCentreOf(chooser->CancelButton()), 3000);
  EXPECT_EQ(Chooser(), nullptr);
  EXPECT_EQ(reverb_.ImpulseResponseFile().ToUtf8(), folder_ + "Rooms/small.WAV");

  // A typed sound file is chosen at once; one that cannot be read says why and keeps the file
  // that plays.
  Click(KCentreOf(Button("impulsefile")), 4000);
  chooser = Chooser();
  ASSERT_NE(chooser, nullptr);
  gMessages.clear();
  const KUserMessageHook previous = KSetUserMessageHook(&Record);
  type(folder_ + "Plate.FLAC");
  KSetUserMessageHook(previous);
  EXPECT_EQ(Chooser(), nullptr);
  ASSERT_EQ(gMessages.size(), 1u);
  EXPECT_NE(gMessages[0].find("Plate.FLAC"), std::string::npos);
  EXPECT_EQ(reverb_.ImpulseResponseFile().ToUtf8(), folder_ + "Rooms/small.WAV");

  // F1 over the load button explains it.
  editor_->ShowHelp(Button("impulsefile").HelpKey());
  KHelpPanel* help = KFindControl<KHelpPanel>(editor_->Tree().Root(), [](KHelpPanel&) { return true; });
  ASSERT_NE(help, nullptr);
  EXPECT_NE(help->Markup().ToUtf8().find("WAV and FLAC"), std::string::npos);
}
