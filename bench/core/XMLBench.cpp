#include <benchmark/benchmark.h>

#include <string>
#include <vector>

#include "core/Element.h"
#include "core/KXMLReader.h"
#include "core/KXMLWriter.h"

// Writing and reading a plug-in state of realistic size, each beside a reference that moves the
// same bytes without any XML work: concatenating the finished text from its pieces, and a byte
// scan that copies the text.
namespace {

KString Number(double value) { return KString::FromUtf8(std::to_string(value)); }

// A root with 50 global and parameter attributes and the usual sections below it.
Element StateTree() {
  Element root(KString("KPlugin"));
  const char* globals[] = {"Version", "ChannelMode", "SurroundChannelsEnable", "AmbisonicsOrder", "SurroundVolume",
                           "MIDIProgramChangeEnable", "Bypass", "SmartBypass", "Limiter", "Upsampling",
                           "UpsamplingOffline", "HQUpsampling", "PresetIndex", "Preset", "EditorSize", "EditorSizeEasy"};
  for (const char* name : globals) root.SetAttribute(KString::Static(name), KString("1"));
  root.SetAttribute("Preset", KString::FromUtf8("Drums & Bass <Live> \xE2\x80\x93 wide"));
  root.SetAttribute("EditorSize", KString("900,600"));
  for (int i = 0; i < 34; ++i) root.SetAttribute(KString::FromUtf8("Parameter" + std::to_string(i)), Number(i * 0.37 - 4));

  Element& multi = root.AddChild(KString("MultiParameters"));
  for (int i = 0; i < 4; ++i) {
    Element& parameter = multi.AddChild(KString("MultiParameter"));
    parameter.SetAttribute("Name", KString::FromUtf8("Macro " + std::to_string(i)));
    parameter.SetAttribute("Targets", KString("3;7;12;19"));
    parameter.SetAttribute("Range", KString("0.000000,1.000000"));
  }
  Element& lfos = root.AddChild(KString("LFOs"));
  for (int i = 0; i < 2; ++i) lfos.AddChild(KString("LFO")).SetAttribute("Rate", Number(0.25 * (i + 1)));
  Element& controllers = root.AddChild(KString("Controllers"));
  controllers.SetAttribute("ControllersEnabled", KString("1"));
  for (int i = 0; i < 8; ++i) {
    Element& controller = controllers.AddChild(KString("Controller"));
    controller.SetAttribute("CC", Number(i + 20));
    controller.SetAttribute("Parameter", Number(i));
  }
  Element& preset = root.AddChild(KString("ActivePreset"));
  preset.SetAttribute("Name", KString("Factory default"));
  preset.SetAttribute("Current", KString("1"));
  return root;
}

const std::string& StateText() {
  static const std::string text = KXMLWriter::Write(StateTree());
  return text;
}

void Report(benchmark::State& state, size_t bytes) {
  state.SetBytesProcessed(static_cast<int64_t>(state.iterations() * bytes));
  state.counters["bytes"] = static_cast<double>(bytes);
}

void BM_XMLWrite(benchmark::State& state, KXMLWriter::Layout layout) {
  const Element tree = StateTree();
  size_t bytes = 0;
  for (auto _ : state) {
    std::string text = KXMLWriter::Write(tree, "utf-8", layout);
    bytes = text.size();
    benchmark::DoNotOptimize(text);
  }
  Report(state, bytes);
}

// The same text assembled from its pieces, cut before every '<' and '"'.
void BM_Reference_StringConcat(benchmark::State& state) {
  const std::string& text = StateText();
  std::vector<std::string> pieces(1);
  for (const char c : text) {
    if (c == '<' || c == '"') pieces.emplace_back();
    pieces.back() += c;
  }
  for (auto _ : state) {
    std::string out;
    for (const auto& piece : pieces) out += piece;
    benchmark::DoNotOptimize(out);
  }
  Report(state, text.size());
}

void BM_XMLRead(benchmark::State& state) {
  const std::string& text = StateText();
  for (auto _ : state) {
    Element tree = KXMLReader::Read(text);
    benchmark::DoNotOptimize(tree);
  }
  Report(state, text.size());
}

// One pass over the text that copies it and counts the tags.
void BM_Reference_ByteScan(benchmark::State& state) {
  const std::string& text = StateText();
  for (auto _ : state) {
    std::string copy;
    int tags = 0;
    for (const char c : text) {
      tags += c == '<';
      copy += c;
    }
    benchmark::DoNotOptimize(copy);
    benchmark::DoNotOptimize(tags);
  }
  Report(state, text.size());
}

}  // namespace

BENCHMARK_CAPTURE(BM_XMLWrite, Indented, KXMLWriter::kIndented)->Unit(benchmark::kMicrosecond);
BENCHMARK_CAPTURE(BM_XMLWrite, Compact, KXMLWriter::kCompact)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Reference_StringConcat)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_XMLRead)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_Reference_ByteScan)->Unit(benchmark::kMicrosecond);
