// `torvane render` on pipes, interrupted, run twice at once, and on inputs and outputs that fail.
#include <fcntl.h>
#include <gmock/gmock.h>
#include <signal.h>
#include <sys/stat.h>
#include <unistd.h>

#include <chrono>
#include <cstring>
#include <thread>

#include "tests/tools/CliFixture.h"

namespace {

// The hidden partial files in `folder`.
std::vector<fs::path> PartialFiles(const fs::path& folder) {
  std::vector<fs::path> found;
  for (const auto& entry : fs::directory_iterator(folder))
    if (entry.path().filename().string().starts_with(".")) found.push_back(entry.path());
  return found;
}

std::string Bytes(const fs::path& path) { return (std::ostringstream() << std::ifstream(path, std::ios::binary).rdbuf()).str(); }

}  // namespace

class CliStreamTest : public CliTest {
protected:
  // Bytes fed before a render is known to be under way: past the start a stream's header may be
  // read from (1 MiB), so that the output file has been opened.
  static constexpr size_t kFed = 1200000;

  // The bytes of a 4-second float WAV written as `name`.
  std::string LongInput(const std::string& name) const {
    Audio audio = AudioFile(Work() / "in.wav");
    audio.samples.insert(audio.samples.end(), audio.samples.begin(), audio.samples.end());
    AudioFile(Work() / name, audio);
    return Bytes(Work() / name);
  }

  // `torvane WORDS...` started in the work folder, its standard input a pipe the test writes.
  struct Child {
    pid_t pid;
    int input;
  };
  Child Start(const Words& words) const {
    int pipeEnds[2];
    EXPECT_EQ(pipe2(pipeEnds, O_CLOEXEC), 0);  // a second child must not hold the first one's input open
    const pid_t pid = fork();
    if (pid == 0) {
      dup2(pipeEnds[0], 0);
      close(pipeEnds[0]), close(pipeEnds[1]);
      const int quiet = open("/dev/null", O_WRONLY);
      dup2(quiet, 1), dup2(quiet, 2);
      if (chdir(Work().c_str()) != 0) _exit(126);
      setenv("XDG_DATA_HOME", (root_ / "data").c_str(), 1);
      std::vector<char*> argv{const_cast<char*>(TORVANE_CLI)};
      for (const std::string& word : words) argv.push_back(const_cast<char*>(word.c_str()));
      argv.push_back(nullptr);
      execv(TORVANE_CLI, argv.data());
      _exit(127);
    }
    close(pipeEnds[0]);
    return {pid, pipeEnds[1]};
  }
  static void Feed(const Child& child, std::string_view bytes) {
    while (!bytes.empty()) {
      const ssize_t written = write(child.input, bytes.data(), bytes.size());
      ASSERT_GT(written, 0);
      bytes.remove_prefix(static_cast<size_t>(written));
    }
  }
  // Waits until `count` partial files exist in the work folder (at most 10 s).
  std::vector<fs::path> AwaitPartials(size_t count) const {
    for (int i = 0; i < 1000 && PartialFiles(Work()).size() < count; ++i) std::this_thread::sleep_for(std::chrono::milliseconds(10));
    return PartialFiles(Work());
  }
  static int Wait(const Child& child) {
    close(child.input);
    int status = 0;
    waitpid(child.pid, &status, 0);
    return status;
  }
};

// Every format libsndfile reads, piped into standard input, renders as the file itself does and
// ends with it: a WAV whose header gives no length (as streaming tools write it) included,
// which once produced output without end; FLAC failed with "lost sync".
TEST_F(CliStreamTest, StandardInputIsReadAsAStreamInEveryFormat) {
  const Audio input = AudioFile(Work() / "in.wav");
  WriteAudio(Work() / "in.flac", input, SF_FORMAT_FLAC | SF_FORMAT_PCM_16);
  WriteAudio(Work() / "in.ogg", input, SF_FORMAT_OGG | SF_FORMAT_VORBIS);
  WriteAudio(Work() / "in.aiff", input, SF_FORMAT_AIFF | SF_FORMAT_PCM_24);
  std::string unsized = Bytes(Work() / "in.wav");  // lengths all ones, as ffmpeg writes to a pipe
  std::memset(unsized.data() + 4, 0xFF, 4);
  std::memset(unsized.data() + unsized.find("data") + 4, 0xFF, 4);
  std::ofstream(Work() / "unsized.wav", std::ios::binary) << unsized;
  for (const char* file : {"in.wav", "unsized.wav", "in.flac", "in.ogg", "in.aiff"}) {
    const CliRun direct = Run({"render", "KCompressorPlugin", file, "direct.wav", "--set", "threshold=0.2", "--format", "f32"});
    const CliRun piped = Shell(std::string("cat ") + file + " | \"$TORVANE\" render KCompressorPlugin - piped.wav --set threshold=0.2 --format f32");
    ASSERT_EQ(piped.exit, 0) << file << ": " << piped.err;
    ASSERT_EQ(direct.exit, 0) << file << ": " << direct.err;
    EXPECT_TRUE(Same(AudioFile(Work() / "piped.wav"), AudioFile(Work() / "direct.wav"))) << file;
    EXPECT_EQ(AudioFile(Work() / "piped.wav").samples.size(), input.samples.size()) << file;
  }
  const CliRun garbage = Shell("echo 'not audio at all' | \"$TORVANE\" render KUtilityPlugin - out.wav");
  EXPECT_EQ(garbage.exit, 1);
  EXPECT_THAT(garbage.err, testing::HasSubstr("Cannot read the audio of standard input: unknown audio cannot be read as a stream"));
}

// Standard output takes the type given by -t; the summary goes to standard error (nothing with
// --quiet); two renders joined by pipes equal the two renders through files.
TEST_F(CliStreamTest, StandardOutputCarriesTheTypeGiven) {
  ASSERT_EQ(Run({"render", "KCompressorPlugin", "in.wav", "file.wav", "--set", "ratio=6"}).exit, 0);
  const CliRun piped = Shell("\"$TORVANE\" render KCompressorPlugin in.wav -t wav - --set ratio=6 | cat > piped.wav");
  EXPECT_EQ(piped.exit, 0) << piped.err;
  EXPECT_THAT(piped.err, testing::StartsWith("standard output: 2.00 s; input peak"));
  EXPECT_TRUE(Same(ReadAudio(Work() / "piped.wav"), AudioFile(Work() / "file.wav")));
  ASSERT_EQ(Shell("\"$TORVANE\" render KCompressorPlugin in.wav -t wav - --set ratio=6 > redirected.wav").exit, 0);
  EXPECT_TRUE(Same(AudioFile(Work() / "redirected.wav"), AudioFile(Work() / "file.wav")));  // a file: lengths in the header

  ASSERT_EQ(Run({"render", "KEqualizerPlugin", "file.wav", "chain.flac", "--set", "band2gain=-6", "--quiet"}).err, "");
  const CliRun chained = Shell("cat in.wav | \"$TORVANE\" render KCompressorPlugin - --type wav - --set ratio=6 -q | "
                               "\"$TORVANE\" render KEqualizerPlugin - -t flac - --set band2gain=-6 -q | cat > piped.flac");
  EXPECT_EQ(chained.exit, 0);
  EXPECT_EQ(chained.err, "");
  EXPECT_TRUE(Same(ReadAudio(Work() / "piped.flac"), ReadAudio(Work() / "chain.flac")));

  const CliRun untyped = Run({"render", "KUtilityPlugin", "in.wav", "-"});
  EXPECT_EQ(untyped.exit, 1);
  EXPECT_THAT(untyped.err, testing::HasSubstr("Standard output needs an audio type: give --type (for example -t wav)."));
}

// SIGINT and SIGTERM in the middle of a render remove the partial file and end the process as
// the signal does; before, a hidden partial file of the full size stayed behind.
TEST_F(CliStreamTest, InterruptionLeavesNothingBehind) {
  const std::string bytes = LongInput("long.wav");
  for (const int signal : {SIGINT, SIGTERM}) {
    const Child child = Start({"render", "KUtilityPlugin", "-", "out.wav"});
    Feed(child, std::string_view(bytes).substr(0, kFed));
    ASSERT_EQ(AwaitPartials(1).size(), 1u);
    kill(child.pid, signal);
    const int status = Wait(child);
    EXPECT_TRUE(WIFSIGNALED(status) && WTERMSIG(status) == signal) << status;
    EXPECT_EQ(std::distance(fs::directory_iterator(Work()), {}), 2) << "only in.wav and long.wav stay";
  }
}

// Two renders into one output at once each write a partial file of their own; the output is
// then whole, one of the two, never a mixture.
TEST_F(CliStreamTest, ConcurrentRendersToOneOutputDoNotMix) {
  const std::string loudBytes = LongInput("loud.wav");
  Audio quiet = AudioFile(Work() / "loud.wav");
  for (float& sample : quiet.samples) sample *= 0.25f;
  AudioFile(Work() / "quiet.wav", quiet);
  const std::string softBytes = Bytes(Work() / "quiet.wav");
  const Child loud = Start({"render", "KUtilityPlugin", "-", "out.wav"});
  const Child soft = Start({"render", "KUtilityPlugin", "-", "out.wav"});
  Feed(loud, std::string_view(loudBytes).substr(0, kFed));
  Feed(soft, std::string_view(softBytes).substr(0, kFed));
  const std::vector<fs::path> partials = AwaitPartials(2);
  ASSERT_EQ(partials.size(), 2u);
  EXPECT_NE(partials[0], partials[1]);
  Feed(loud, std::string_view(loudBytes).substr(kFed));
  Feed(soft, std::string_view(softBytes).substr(kFed));
  for (const Child& child : {loud, soft}) {
    const int status = Wait(child);
    EXPECT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0) << status;
  }
  const Audio out = AudioFile(Work() / "out.wav");
  EXPECT_TRUE(Same(out, AudioFile(Work() / "loud.wav")) || Same(out, quiet));
  EXPECT_TRUE(PartialFiles(Work()).empty());
}

// A replaced output keeps its permissions; a new one gets the usual ones.
TEST_F(CliStreamTest, ReplacedOutputKeepsItsPermissions) {
  ASSERT_EQ(Run({"render", "KUtilityPlugin", "in.wav", "out.wav"}).exit, 0);
  const mode_t mask = umask(0);
  umask(mask);
  EXPECT_EQ(fs::status(Work() / "out.wav").permissions(), static_cast<fs::perms>(0666 & ~mask));
  fs::permissions(Work() / "out.wav", static_cast<fs::perms>(0640));
  ASSERT_EQ(Run({"render", "KUtilityPlugin", "in.wav", "out.wav"}).exit, 0);
  EXPECT_EQ(fs::status(Work() / "out.wav").permissions(), static_cast<fs::perms>(0640));
}

// Inputs without audio or cut short, and standard output that cannot take what is written,
// fail with a message, leaving no file; before, each exited with 0.
TEST_F(CliStreamTest, EmptyAndTruncatedInputsAndFullOutputsFail) {
  WriteAudio(Work() / "empty.wav", Audio{2, 48000, {}}, SF_FORMAT_WAV | SF_FORMAT_PCM_16);
  const std::string whole = Bytes(Work() / "in.wav");
  std::ofstream(Work() / "cut.wav", std::ios::binary) << whole.substr(0, whole.size() / 2);
  const std::pair<std::string, std::string> failures[] = {
      {"\"$TORVANE\" render KUtilityPlugin empty.wav out.wav", "Cannot read the audio of 'empty.wav': it holds no audio."},
      {"\"$TORVANE\" render KUtilityPlugin empty.wav out.flac", "Cannot read the audio of 'empty.wav': it holds no audio."},
      {"cat empty.wav | \"$TORVANE\" render KUtilityPlugin - out.wav", "Cannot read the audio of standard input: it holds no audio."},
      {"\"$TORVANE\" render KUtilityPlugin cut.wav out.wav", "Cannot read the audio of 'cut.wav': the file is truncated"},
      {"\"$TORVANE\" state KUtilityPlugin > /dev/full", "Cannot write to standard output: No space left on device."},
      {"\"$TORVANE\" list > /dev/full", "Cannot write to standard output: No space left on device."},
      {"\"$TORVANE\" render KUtilityPlugin in.wav -t wav - > /dev/full", "Cannot write standard output"},
      {"\"$TORVANE\" render KUtilityPlugin in.wav -t flac - > /dev/full", "Cannot write standard output"},
  };
  const std::set<fs::path> before(fs::directory_iterator(Work()), {});
  for (const auto& [line, message] : failures) {
    const CliRun run = Shell(line);
    EXPECT_EQ(run.exit, 1) << line;
    EXPECT_THAT(run.err, testing::HasSubstr(message)) << line;
    EXPECT_EQ(std::set<fs::path>(fs::directory_iterator(Work()), {}), before) << line;
  }
}
