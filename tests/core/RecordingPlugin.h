#pragma once

#include <cstdint>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

#if defined(__SSE__)
#include <xmmintrin.h>
#endif

// A plug-in for tests of the processing cycle: it logs, in order, every ProcessUpdate, every
// Process call (with its length and the normalised value of every parameter at its start) and
// every note message decoded. Room for the logs is reserved up front, so that recording does not
// allocate as long as a test clears the log before it fills.
class KRecordingPlugin : public KAudioPlugin {
public:
  // What Process writes: the input unchanged, or the constant c + 1 into output channel c (so
  // that a test sees where each channel lands), or nothing at all.
  enum Output { kPassThrough, kChannelNumber, kNothing };
  struct Entry {
    enum Kind { kUpdate, kProcess, kNote } kind;
    int32_t length;       // kProcess: samples; kNote: the message's sample offset
    int32_t note;         // kNote only
    int32_t firstValue;   // kProcess: index of its first parameter value in Values()
    int32_t activeRamps;  // kProcess: ramps alive at the sub-block's start
    uint32_t fpuControl;  // kProcess: MXCSR inside the call (0 where there is none)
  };
  static constexpr int32_t kMaxParameters = 160;
  static constexpr Shape kEffect{1, 1, true, false, true};
  static constexpr int32_t kReservedEntries = 4096;

  explicit KRecordingPlugin(int32_t parameterCount = 4, const Shape& shape = kEffect, Output output = kPassThrough)
      : KAudioPlugin(Table(parameterCount), shape), output_(output) {
    entries_.reserve(kReservedEntries);
    values_.reserve(static_cast<size_t>(kReservedEntries) * static_cast<size_t>(parameterCount));
  }

  const std::vector<Entry>& Log() const noexcept { return entries_; }
  void ClearLog() noexcept {
    entries_.clear();
    values_.clear();
  }
  // The Process entries alone, in order.
  std::vector<Entry> Calls() const { return Only(Entry::kProcess); }
  std::vector<int32_t> Lengths() const {
    std::vector<int32_t> lengths;
    for (const Entry& call : Calls()) lengths.push_back(call.length);
    return lengths;
  }
  // The value of `parameter` at the start of Process call number `call`.
  double Seen(int32_t call, int32_t parameter) const { return values_[Calls()[call].firstValue + parameter]; }
  int32_t UpdateCount() const { return static_cast<int32_t>(Only(Entry::kUpdate).size()); }

protected:
  void ProcessUpdate() override { entries_.push_back({Entry::kUpdate, 0, 0, 0, 0, 0}); }

  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override {
    const auto first = static_cast<int32_t>(values_.size());
    for (int32_t p = 0; p < ParameterCount(); ++p) values_.push_back(GetParameter(p).Normalized());
    entries_.push_back({Entry::kProcess, sampleCount, 0, first, ActiveRampCount(), FpuControl()});
    for (int32_t c = 0; c < OutputChannelCount(); ++c) {
      for (int32_t i = 0; i < sampleCount; ++i) {
        if (output_ == kPassThrough) outputs[c][i] = inputs[c][i];
        if (output_ == kChannelNumber) outputs[c][i] = static_cast<float>(c + 1);
      }
    }
  }

  void ProcessNotePerformCore(const KMIDIEvent& event) override {
    entries_.push_back({Entry::kNote, event.sampleOffset, event.number, 0, 0, 0});
  }

private:
  static std::span<const KParameterInfo> Table(int32_t count) {
    static const KLinearKind kind(0.0, 1.0, "", "{0.000}");
    static const auto table = [] {
      std::vector<KParameterInfo> rows;
      for (int32_t i = 0; i < kMaxParameters; ++i) rows.push_back({"p", "Parameter", &kind, 0.0, KParameterInfo::kAutomatable});
      return rows;
    }();
    return {table.data(), static_cast<size_t>(count)};
  }
  static uint32_t FpuControl() noexcept {
#if defined(__SSE__)
    return _mm_getcsr();
#else
    return 0;
#endif
  }
  std::vector<Entry> Only(Entry::Kind kind) const {
    std::vector<Entry> found;
    for (const Entry& entry : entries_)
      if (entry.kind == kind) found.push_back(entry);
    return found;
  }

  Output output_;
  std::vector<Entry> entries_;
  std::vector<double> values_;
};
