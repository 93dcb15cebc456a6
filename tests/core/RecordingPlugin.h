#pragma once

#include <atomic>
#include <cstdint>
#include <cstdio>
#include <string>
#include <utility>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KClock.h"
#include "core/KParameter.h"
#include "hosts/KAudioPluginInterface.h"
#include "tests/core/BlockBuffers.h"

#if defined(__SSE__)
#include <xmmintrin.h>
#endif

// A plug-in that logs every ProcessUpdate, Process call (with each parameter's value at its start)
// and note, in order; reserved up front, so that recording does not allocate.
class KRecordingPlugin : public KAudioPlugin {
public:
  // What Process writes: the input, or the constant c + 1 into output channel c.
  enum Output { kPassThrough, kChannelNumber };
  struct Entry {
    enum Kind { kUpdate, kProcess, kNote } kind;
    int32_t length;       // kProcess: samples; kNote: the message's sample offset
    int32_t note;         // kNote only
    int32_t firstValue;   // kProcess: index of its first parameter value in the value log
    uint32_t fpuControl;  // kProcess: MXCSR inside the call (0 where there is none)
  };
  static constexpr Shape kEffect{1, 1, true, false, true};

  explicit KRecordingPlugin(int32_t parameterCount = 4, const Shape& shape = kEffect, Output output = kPassThrough)
      : KAudioPlugin(Table(parameterCount), shape), output_(output) {
    entries_.reserve(4096);
    values_.reserve(4096 * static_cast<size_t>(parameterCount));
  }

  const std::vector<Entry>& Log() const noexcept { return entries_; }
  void ClearLog() noexcept {
    entries_.clear();
    values_.clear();
  }
  // One host block over `buffers`; the log then holds this block only. Answers its Trace().
  std::string Run(KBlockBuffers& buffers, int32_t length) {
    ClearLog();
    ProcessHostBlock(buffers.Inputs(), buffers.Outputs(), length);
    return Trace();
  }
  // The log in one line: "U" for ProcessUpdate, "P<length>" for Process, "N<note>@<offset>".
  std::string Trace() const {
    std::string trace;
    for (const Entry& e : entries_) {
      if (e.kind == Entry::kUpdate) trace += " U";
      if (e.kind == Entry::kProcess) trace += " P" + std::to_string(e.length);
      if (e.kind == Entry::kNote) trace += " N" + std::to_string(e.note) + "@" + std::to_string(e.length);
    }
    return trace.substr(trace.empty() ? 0 : 1);
  }
  // Each Process call as "<length>@<value of `parameter` at its start>", space-separated.
  std::string Pieces(int32_t parameter) const {
    std::string pieces;
    for (const Entry& e : entries_) {
      if (e.kind != Entry::kProcess) continue;
      char piece[48];
      std::snprintf(piece, sizeof piece, " %d@%.6g", e.length, values_[e.firstValue + parameter]);
      pieces += piece;
    }
    return pieces.substr(pieces.empty() ? 0 : 1);
  }
  // The value of `parameter` at the start of Process call number `call` (from 0).
  double Seen(int32_t call, int32_t parameter) const {
    for (const Entry& e : entries_)
      if (e.kind == Entry::kProcess && call-- == 0) return values_[static_cast<size_t>(e.firstValue + parameter)];
    return -1.0;
  }

protected:
  void ProcessUpdate() override { entries_.push_back({Entry::kUpdate, 0, 0, 0, 0}); }
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override {
    entries_.push_back({Entry::kProcess, sampleCount, 0, static_cast<int32_t>(values_.size()), 0});
#if defined(__SSE__)
    entries_.back().fpuControl = _mm_getcsr();
#endif
    for (int32_t p = 0; p < ParameterCount(); ++p) values_.push_back(GetParameter(p).Normalized());
    for (int32_t c = 0; c < OutputChannelCount(); ++c)
      for (int32_t i = 0; i < sampleCount; ++i) outputs[c][i] = output_ == kPassThrough ? inputs[c][i] : static_cast<float>(c + 1);
  }
  void ProcessNotePerformCore(const KMIDIEvent& event) override {
    entries_.push_back({Entry::kNote, event.sampleOffset, event.number, 0, 0});
  }

private:
  static std::span<const KParameterInfo> Table(int32_t count) {
    static const KNumberKind kind(0.0, 1.0, "", "{0.000}");
    static const std::vector<KParameterInfo> table(160, {"p", "Parameter", &kind, 0.0, KParameterInfo::kAutomatable});
    return {table.data(), static_cast<size_t>(count)};
  }

  Output output_;
  std::vector<Entry> entries_;
  std::vector<double> values_;
};

// A clock driven by hand, so that time-outs pass without sleeping; any thread may move it.
class KHandDrivenClock final : public KClock {
public:
  uint64_t Milliseconds() const noexcept override { return now.load(std::memory_order_relaxed); }
  std::atomic<uint64_t> now{1000};
};

// A host that counts every call, from any thread, and while `logging` logs them in one line: "B<i>"
// begin, "E<i>" end, "L<samples>" latency, "S<i>=<value>/<sending counter during the call>".
class KRecordingHost final : public KAudioPluginInterface {
public:
  using KAudioPluginInterface::KAudioPluginInterface;
  void BeginGesture(int32_t index) override { Record(begun, "B%d", index); }
  void SendAutomationValue(int32_t index, double v) override { Record(sent, "S%d=%g/%d", index, v, Plugin().AutomationSending().load()); }
  void EndGesture(int32_t index) override { Record(ended, "E%d", index); }
  void ReportLatency(int32_t samples) override { Record(reported, "L%d", samples); }
  void SendMIDIEvent(int32_t, const uint8_t[4]) override {}
  void UpdateParameterNames() override {}
  void NotifyPresetChanged() override {}
  bool ResizeEditor(int32_t, int32_t) override { return false; }
  // The calls logged since the last look.
  std::string Take() { return std::exchange(calls_, {}); }

  std::atomic<int32_t> begun{0}, sent{0}, ended{0}, reported{0};
  bool logging = true;

private:
  template <class... Values>
  void Record(std::atomic<int32_t>& count, const char* format, Values... values) {
    ++count;
    if (!logging) return;
    char call[64];
    std::snprintf(call, sizeof call, format, values...);
    calls_ += (calls_.empty() ? "" : " ") + std::string(call);
  }
  std::string calls_;
};
