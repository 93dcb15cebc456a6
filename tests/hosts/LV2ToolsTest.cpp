// The built bundles in Debian's own LV2 tools: the validator, lilv's lv2info and lv2apply, and
// lv2file at two block lengths. What the tools render equals `torvane render` bit for bit.
#include <gtest/gtest.h>
#include <sndfile.h>

#include <cmath>
#include <cstring>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <map>
#include <fstream>
#include <sstream>
#include <string>
#include <vector>

#include <unistd.h>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "hosts/lv2/KLV2Dispatch.h"
#include "kernel/KCatalogue.h"
#include "kernel/KPluginIdentifiers.h"
#include "kernel/KEntryPoints.h"

namespace fs = std::filesystem;

namespace {
const std::string kLV2Path = "LV2_PATH=" TORVANE_LV2_DIR " ";

struct KAudio {
  std::vector<float> samples;  // interleaved
  int channels = 0;
  int64_t Frames() const { return channels ? static_cast<int64_t>(samples.size()) / channels : 0; }
};

KAudio Read(const fs::path& path) {
  SF_INFO info{};
  SNDFILE* file = sf_open(path.c_str(), SFM_READ, &info);
  EXPECT_TRUE(file) << path << ": " << sf_strerror(nullptr);
  if (!file) return {};
  KAudio audio{std::vector<float>(static_cast<size_t>(info.frames * info.channels)), info.channels};
  sf_readf_float(file, audio.samples.data(), info.frames);
  sf_close(file);
  return audio;
}

// Two seconds at 48 kHz, float: a rising tone with a swell, and another tone beside it; channels
// past the first two (a side-chain) are silent.
void WriteInput(const fs::path& path, int channels) {
  SF_INFO info{0, 48000, channels, SF_FORMAT_WAV | SF_FORMAT_FLOAT, 0, 0};
  SNDFILE* file = sf_open(path.c_str(), SFM_WRITE, &info);
  ASSERT_TRUE(file);
  std::vector<float> samples(static_cast<size_t>(channels) * 96000);
  for (size_t i = 0; i < 96000; ++i) {
    const double t = static_cast<double>(i) / 48000.0, swell = 0.1 + 0.8 * std::sin(3.14159 * t / 2.0);
    samples[static_cast<size_t>(channels) * i] = static_cast<float>(swell * std::sin(6.283185 * (200.0 + 400.0 * t) * t));
    samples[static_cast<size_t>(channels) * i + 1] = static_cast<float>(0.6 * std::sin(6.283185 * 1300.0 * t));
  }
  sf_writef_float(file, samples.data(), 96000);
  sf_close(file);
}

// Runs a command line; its output (both streams) and whether it succeeded.
std::pair<bool, std::string> RunTool(const std::string& command) {
  const fs::path log = fs::temp_directory_path() / ("torvane-lv2-tool-" + std::to_string(::getpid()) + ".log");
  const int status = std::system((command + " > '" + log.string() + "' 2>&1").c_str());
  std::ifstream in(log);
  std::stringstream text;
  text << in.rdbuf();
  fs::remove(log);
  return {status == 0, text.str()};
}

bool Have(const char* tool) { return RunTool(std::string("command -v ") + tool).first; }

struct KSetting {
  const char* key;
  const char* value;
};
struct KCase {
  const char* key;
  std::vector<KSetting> settings;
};

// The three plug-ins with settings that floats carry exactly, as control ports do.
const std::vector<KCase> kCases = {
    {"KCompressorPlugin", {{"threshold", "0.125"}, {"ratio", "4"}, {"gain", "6"}, {"kneemode", "2"}}},
    {"KEqualizerPlugin", {{"band3gain", "9"}, {"band3freq", "1000"}, {"band6gain", "-6"}, {"band1type", "1"}}},
    {"KSampleWarmer", {{"drive", "18"}, {"mix", "75"}, {"shape", "1"}}},
};

class LV2Tools : public ::testing::Test {
protected:
  void SetUp() override {
#if defined(TORVANE_SANITIZED)
    GTEST_SKIP() << "the tools cannot load a sanitized kernel";
#endif
    for (const char* tool : {"lv2_validate", "sord_validate", "lv2info", "lv2apply", "lv2file"})
      if (!Have(tool)) GTEST_SKIP() << tool << " is not installed (scripts/install-deps.sh)";
    dir_ = fs::temp_directory_path() / ("torvane-lv2-tools-" + std::to_string(::getpid()));
    fs::create_directories(dir_);
  }
  void TearDown() override {
    if (!dir_.empty()) fs::remove_all(dir_);
  }
  fs::path dir_;
};

// Output `lv2` of a tool against the command line's `reference`: the tool's first `latency`
// frames are the plug-in's delay, which `torvane render` removes; the rest is equal bit for bit.
void ExpectSameAfterLatency(const KAudio& reference, const KAudio& lv2, int64_t latency, const std::string& what) {
  ASSERT_EQ(lv2.channels, reference.channels) << what;
  ASSERT_EQ(lv2.Frames(), reference.Frames()) << what;
  const auto skip = static_cast<size_t>(latency * lv2.channels);
  ASSERT_GT(lv2.samples.size(), skip) << what;
  const size_t length = lv2.samples.size() - skip;
  size_t differ = 0;
  for (size_t i = 0; i < length; ++i) differ += std::memcmp(&lv2.samples[skip + i], &reference.samples[i], sizeof(float)) != 0;
  EXPECT_EQ(differ, 0u) << what << ": samples that differ from torvane render";
}

// The triples of a Turtle file as sordi writes them in N-Triples: subject, predicate, object;
// a literal object as its unescaped text.
struct KTriple {
  std::string subject, predicate, object;
};
std::vector<KTriple> Triples(const std::string& ntriples) {
  std::vector<KTriple> triples;
  std::istringstream lines(ntriples);
  for (std::string line; std::getline(lines, line);) {
    const size_t first = line.find(' '), second = line.find(' ', first + 1);
    if (second == std::string::npos || !line.ends_with(" .")) continue;
    std::string object = line.substr(second + 1, line.size() - second - 3);
    if (object.starts_with('"')) {
      const std::string quoted = object.substr(1, object.rfind('"') - 1);
      object.clear();
      for (size_t i = 0; i < quoted.size(); ++i) {
        if (quoted[i] != '\\' || i + 1 == quoted.size()) {
          object += quoted[i];
          continue;
        }
        const char escaped = quoted[++i];
        object += escaped == 'n' ? '\n' : escaped == 't' ? '\t' : escaped == 'r' ? '\r' : escaped;
      }
    }
    triples.push_back({line.substr(0, first), line.substr(first + 1, second - first - 1), object});
  }
  return triples;
}
}  // namespace

TEST_F(LV2Tools, TheValidatorFindsNoErrorInAnyBundle) {
  std::string files;
  for (const fs::directory_entry& entry : fs::recursive_directory_iterator(TORVANE_LV2_DIR))
    if (entry.path().extension() == ".ttl") files += " '" + entry.path().string() + "'";
  ASSERT_FALSE(files.empty());
  const auto [ok, output] = RunTool("lv2_validate" + files);
  EXPECT_TRUE(ok) << output;
  EXPECT_NE(output.find("Found 0 errors"), std::string::npos) << output;
  EXPECT_EQ(output.find("error:"), std::string::npos) << output;
}

// lv2info lists every port of every bundle, each control with its range.
TEST_F(LV2Tools, LV2InfoListsEveryPortWithItsRange) {
  for (const KString& key : GetTorvanePluginList()) {
    const std::string uri = KPluginIds::LV2URI(key.ToUtf8().c_str());
    const auto [ok, output] = RunTool(kLV2Path + "lv2info " + uri);
    ASSERT_TRUE(ok) << output;
    std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(key));
    for (int32_t p = 0; p < plugin->ParameterCount(); ++p)
      EXPECT_NE(output.find("Symbol:      " + plugin->GetParameter(p).Key().ToUtf8() + "\n"), std::string::npos) << uri << " " << p;
    size_t ports = 0, ranges = 0;
    for (size_t at = output.find("\n\tPort "); at != std::string::npos; at = output.find("\n\tPort ", at + 1)) ++ports;
    for (size_t at = output.find("Minimum:"); at != std::string::npos; at = output.find("Minimum:", at + 1)) ++ranges;
    // Inputs, outputs, parameters, four meters and the latency; every control has a range.
    const size_t audio = 2 * static_cast<size_t>(plugin->GetShape().inputBuses + plugin->GetShape().outputBuses);
    EXPECT_EQ(ports, audio + static_cast<size_t>(plugin->ParameterCount()) + 5) << output;
    EXPECT_EQ(ranges, static_cast<size_t>(plugin->ParameterCount()) + 5) << output;
  }
}

// lv2apply and lv2file at blocks of 64 and 1000 render what `torvane render` renders.
TEST_F(LV2Tools, RendersEqualTorvaneRenderBitForBit) {
  const fs::path input = dir_ / "input.wav", withSideChain = dir_ / "input-sidechain.wav";
  WriteInput(input, 2);
  WriteInput(withSideChain, 4);
  for (const KCase& test : kCases) {
    const std::string uri = KPluginIds::LV2URI(test.key);
    std::string set, file, apply;
    for (const KSetting& setting : test.settings) {
      set += std::string(" --set ") + setting.key + "=" + setting.value;
      file += std::string(" -p ") + setting.key + ":" + setting.value;
      apply += std::string(" -c ") + setting.key + " " + setting.value;
    }
    const fs::path reference = dir_ / (std::string(test.key) + "-torvane.wav");
    const auto rendered = RunTool(std::string(TORVANE_CLI) + " render " + test.key + " '" + input.string() + "' '" + reference.string() + "' --format f32" + set);
    ASSERT_TRUE(rendered.first) << rendered.second;
    const KAudio expected = Read(reference);
    std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::Static(test.key)));
    plugin->SetSampleRate(48000.0);
    const int64_t latency = plugin->TotalLatency();
    // The main inputs by name: lv2file would otherwise ask which file channel feeds the
    // side-chain. It clips to full scale unless told not to; the float files need no clipping.
    const std::string connect = " --ignore-clipping -c 1:in_1 -c 2:in_2";
    for (const int block : {64, 1000}) {
      const fs::path output = dir_ / (std::string(test.key) + "-lv2file-" + std::to_string(block) + ".wav");
      const auto [ok, log] = RunTool(kLV2Path + "lv2file -i '" + input.string() + "' -o '" + output.string() + "' -b " + std::to_string(block) +
                                 connect + file + " " + uri);
      ASSERT_TRUE(ok) << log;
      ExpectSameAfterLatency(expected, Read(output), latency, std::string(test.key) + " lv2file -b " + std::to_string(block));
    }
    const fs::path output = dir_ / (std::string(test.key) + "-lv2apply.wav");
    // lv2apply feeds every audio input from a channel of the file: a side-chain gets silence.
    const fs::path applied = plugin->GetShape().inputBuses > 1 ? withSideChain : input;
    const auto [ok, log] = RunTool(kLV2Path + "lv2apply -i '" + applied.string() + "' -o '" + output.string() + "'" + apply + " " + uri);
    ASSERT_TRUE(ok) << log;
    ExpectSameAfterLatency(expected, Read(output), latency, std::string(test.key) + " lv2apply");
    if (std::string(test.key) == "KSampleWarmer") {
      EXPECT_GT(latency, 0);
    }
  }
}

// Hosts list each factory preset by its name; its resource holds every control port's value as
// the preset loads it, and a preset with settings beyond the ports the state that brings them.
TEST_F(LV2Tools, FactoryPresetsAreListedAndHoldWhatTheyLoad) {
  const std::string lv2 = "<http://lv2plug.in/ns/lv2core#", pset = "<http://lv2plug.in/ns/ext/presets#";
  const std::string label = "<http://www.w3.org/2000/01/rdf-schema#label>", state = "<urn:torvane:state>";
  for (const char* key : {"KGatePlugin", "KCompressorPlugin", "KEffectPipeline"}) {
    const KPluginDescription* description = KFindDescription(KProductCatalogue(), key);
    ASSERT_NE(description, nullptr);
    const std::string uri = KPluginIds::LV2URI(description->identity);
    const auto [listed, info] = RunTool(kLV2Path + "lv2info " + uri);
    ASSERT_TRUE(listed) << info;
    const fs::path file = fs::path(TORVANE_LV2_DIR) / (KPluginIds::BundleName(key) + ".lv2") / "presets.ttl";
    const auto [read, ntriples] = RunTool("sordi -o ntriples '" + file.string() + "' file://" + file.string());
    ASSERT_TRUE(read) << ntriples;
    const std::vector<KTriple> triples = Triples(ntriples);
    for (const KFactoryPreset& preset : description->presets) {
      EXPECT_NE(info.find(preset.name), std::string::npos) << key << ": lv2info lists no " << preset.name;
      std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::Static(key)));
      plugin->LoadFactoryPreset(preset);
      std::string subject;
      for (const KTriple& t : triples)
        if (t.predicate == label && t.object == preset.name) subject = t.subject;
      ASSERT_FALSE(subject.empty()) << key << " " << preset.name;
      std::map<std::string, std::pair<std::string, std::string>> ports;  // node: symbol, value
      std::string stateNode;
      for (const KTriple& t : triples) {
        if (t.subject == subject && t.predicate == lv2 + "port>") ports[t.object];
        if (t.subject == subject && t.predicate == "<http://lv2plug.in/ns/ext/state#state>") stateNode = t.object;
      }
      for (const KTriple& t : triples) {
        if (!ports.contains(t.subject)) continue;
        if (t.predicate == lv2 + "symbol>") ports[t.subject].first = t.object;
        if (t.predicate == pset + "value>") ports[t.subject].second = t.object;
      }
      EXPECT_EQ(ports.size(), static_cast<size_t>(plugin->ParameterCount())) << key << " " << preset.name;
      for (const auto& [node, port] : ports) {
        const KAudioPluginBase::Parameter* parameter = plugin->FindParameter(KString::FromUtf8(port.first));
        ASSERT_NE(parameter, nullptr) << port.first;
        EXPECT_EQ(std::strtod(port.second.c_str(), nullptr), parameter->Working()) << key << " " << preset.name << " " << port.first;
      }
      std::string text;
      for (const KTriple& t : triples)
        if (t.subject == stateNode && t.predicate == state) text = t.object;
      EXPECT_EQ(text.empty(), preset.settings == nullptr) << key << " " << preset.name;
      if (text.empty()) continue;
      std::unique_ptr<KAudioPlugin> restored(CreateTorvanePlugin(KString::Static(key)));
      restored->ReadState(text);
      EXPECT_EQ(std::pair(restored->ActivePresetName().ToUtf8(), restored->WriteState()), std::pair(std::string(preset.name), plugin->WriteState()));
    }
  }
}
