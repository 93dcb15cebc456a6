// Runs the built `torvane` in a fresh folder per test, its user data there too.
#pragma once

#include <gtest/gtest.h>
#include <sndfile.h>
#include <stdlib.h>
#include <sys/wait.h>

#include <cmath>
#include <filesystem>
#include <fstream>
#include <sstream>

namespace fs = std::filesystem;
using Words = std::vector<std::string>;
struct CliRun { int exit; std::string out, err; };
struct Audio { int channels = 0, rate = 0; std::vector<float> samples; };  // samples interleaved

inline Words Sets(Words words, const Words& assignments) {  // `words`, then "--set ASSIGNMENT" for each
  for (const std::string& assignment : assignments) words.insert(words.end(), {"--set", assignment});
  return words;
}

inline Audio AudioFile(const fs::path& path, const Audio& write = {}) {  // reads a 32-bit float WAV, or writes one
  SF_INFO info{0, write.rate, write.channels, write.channels ? SF_FORMAT_WAV | SF_FORMAT_FLOAT : 0, 0, 0};
  SNDFILE* file = sf_open(path.c_str(), write.channels ? SFM_WRITE : SFM_READ, &info);
  Audio audio{info.channels, info.samplerate, std::vector<float>(file ? static_cast<size_t>(info.frames * info.channels) : 0)};
  EXPECT_TRUE(file && info.format == (SF_FORMAT_WAV | SF_FORMAT_FLOAT)) << path;
  if (file && write.channels) sf_write_float(file, write.samples.data(), static_cast<sf_count_t>(write.samples.size()));
  if (file && !write.channels) sf_read_float(file, audio.samples.data(), static_cast<sf_count_t>(audio.samples.size()));
  if (file) sf_close(file);
  return audio;
}

// Any file libsndfile reads, as floats (full scale 1), or with `steps` as the integers an
// integer file holds (libsndfile's scaling off); `format` receives the file's format word.
inline Audio ReadAudio(const fs::path& path, int* format = nullptr, bool steps = false) {
  SF_INFO info{};
  SNDFILE* file = sf_open(path.c_str(), SFM_READ, &info);
  EXPECT_NE(file, nullptr) << path << ": " << sf_strerror(nullptr);
  if (!file) return {};
  Audio audio{info.channels, info.samplerate, {}};
  sf_command(file, SFC_SET_NORM_DOUBLE, nullptr, steps ? SF_FALSE : SF_TRUE);
  std::vector<double> block(static_cast<size_t>(65536 * info.channels));  // to the end: a streamed header gives no length
  for (sf_count_t got; (got = sf_read_double(file, block.data(), static_cast<sf_count_t>(block.size()))) > 0;)
    audio.samples.insert(audio.samples.end(), block.begin(), block.begin() + got);
  if (format) *format = info.format;
  sf_close(file);
  return audio;
}

// Writes `audio` in any format libsndfile writes, with text tags (libsndfile's string kinds).
inline void WriteAudio(const fs::path& path, const Audio& audio, int format, const std::vector<std::pair<int, const char*>>& tags = {}) {
  SF_INFO info{0, audio.rate, audio.channels, format, 0, 0};
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  ASSERT_NE(file, nullptr) << path << ": " << sf_strerror(nullptr);
  for (const auto& [kind, text] : tags) sf_set_string(file, kind, text);
  sf_write_float(file, audio.samples.data(), static_cast<sf_count_t>(audio.samples.size()));
  sf_close(file);
}

inline testing::AssertionResult Same(const Audio& a, const Audio& b) {  // same shape, every sample bit for bit
  if (a.channels != b.channels || a.rate != b.rate || a.samples.size() != b.samples.size() || a.samples.empty())
    return testing::AssertionFailure() << "shapes differ: " << a.samples.size() << " vs " << b.samples.size() << " samples";
  for (size_t i = 0; i < a.samples.size(); ++i)
    if (a.samples[i] != b.samples[i]) return testing::AssertionFailure() << "sample " << i << ": " << a.samples[i] << " vs " << b.samples[i];
  return testing::AssertionSuccess();
}

class CliTest : public testing::Test {
protected:
  // A work folder holding "in.wav": two seconds of stereo noise, loud for 0.1 s in every 0.3 s.
  void SetUp() override {
    std::string name = (fs::temp_directory_path() / "torvane-cli-XXXXXX").string();
    ASSERT_NE(mkdtemp(name.data()), nullptr);
    fs::create_directory((root_ = name) / "work");
    Audio input{2, 48000, std::vector<float>(192000)};
    for (uint32_t i = 0, noise = 12345u; i < input.samples.size(); ++i, noise = noise * 1664525u + 1013904223u)
      input.samples[i] = ((i / 9600) % 3 ? 0.05f : 0.9f) * (static_cast<float>(noise >> 8) / 8388608.0f - 1.0f);
    AudioFile(Work() / "in.wav", input);
  }
  void TearDown() override { fs::remove_all(root_); }
  fs::path Work() const { return root_ / "work"; }

  CliRun Run(const Words& words) const {  // `torvane WORDS...` in the work folder
    std::string line = "\"$TORVANE\"";
    for (const std::string& word : words) line += " '" + word + "'";
    return Shell(line);
  }

  // A shell command line run in the work folder, "$TORVANE" naming the program.
  CliRun Shell(const std::string& line) const {
    std::ofstream(root_ / "command.sh") << "cd '" << Work().string() << "' && XDG_DATA_HOME='" << (root_ / "data").string() << "' TORVANE='"
                                        << TORVANE_CLI << "' && export XDG_DATA_HOME TORVANE && " << line << "\n";
    const int status = std::system(("sh '" + (root_ / "command.sh").string() + "' >'" + (root_ / "stdout").string() + "' 2>'" +
                                    (root_ / "stderr").string() + "'").c_str());
    auto read = [&](const char* name) { return (std::ostringstream() << std::ifstream(root_ / name).rdbuf()).str(); };
    return {WIFEXITED(status) ? WEXITSTATUS(status) : -1, read("stdout"), read("stderr")};
  }

  // `torvane render WORDS... OUTPUT` (no input file among the words: the demo), and what it wrote.
  Audio Render(Words words) {
    const std::string output = "render" + std::to_string(++renders_) + ".wav";
    words.insert(words.begin(), "render"), words.push_back(output);
    const CliRun run = Run(words);
    EXPECT_EQ(run.exit, 0) << run.err;
    return AudioFile(Work() / output);
  }

  fs::path root_;
  int renders_ = 0;
};
