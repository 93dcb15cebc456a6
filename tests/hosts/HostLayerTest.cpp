// What every host adapter shares, through its own interfaces: the rules each format's adapter
// relies on without restating them.
#include <gtest/gtest.h>

#include <stdexcept>
#include <thread>

#include "core/KTransport.h"
#include "hosts/common/KHostChannelMap.h"
#include "hosts/common/KHostEcho.h"
#include "hosts/common/KHostEntry.h"
#include "hosts/common/KHostGuard.h"
#include "hosts/common/KHostMIDIList.h"
#include "hosts/common/KHostRamp.h"
#include "hosts/common/KHostState.h"
#include "hosts/common/KHostTime.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/RecordingPlugin.h"
#include "tests/core/TraceCapture.h"
#include "kernel/KUserMessage.h"

namespace {
auto Fields(const KTransport& t) {
  return std::tuple(t.tempo, t.songPosition, t.barStart, t.samplePosition, t.numerator, t.denominator, t.cycleStart, t.cycleEnd, t.flags);
}
}  // namespace

// One host report per row; everything a row does not name stays at its unknown marker.
TEST(HostTransport, OnlyWhatPassesTheRulesReachesTheSnapshot) {
  using H = KHostTime;
  constexpr uint32_t kAll = H::kTempoValid | H::kSongPositionValid | H::kBarStartValid | H::kSignatureValid | H::kCycleValid;
  struct Row { const char* what; H time; bool offline; KTransport expected; };
  const Row rows[] = {
      {"all valid, 3/4, playing", {kAll | H::kPlaying, 100.6, 120.0, 8.0, 7.4, 3, 4, 2.0, 6.0}, false, {120.0, 8.0, 7.0, 101, 3, 4, 2.0, 6.0, 1}},
      {"6/8 snaps to halves", {H::kBarStartValid | H::kSignatureValid, 0.0, 0, 0, 7.4, 6, 8, 0, 0}, false, {-1.0, -1.0, 7.5, 0, 6, 8, -1.0, -1.0, 0}},
      {"tempo 1.0, numerator 0, an empty cycle", {kAll, 5.0, 1.0, 2.0, 3.0, 0, 8, 4.0, 4.0 + 1e-11}, false, {-1.0, 2.0, 3.0, 5, 4, 4, -1.0, -1.0, 0}},
      {"flags unset: values ignored", {0, 5.0, 120.0, 2.0, 3.0, 3, 4, 1.0, 2.0}, false, {-1.0, -1.0, -1.0, 5, 4, 4, -1.0, -1.0, 0}},
      {"offline at 0: no position, playing", {kAll, 0.0, 90.0, 0.0, 0.0, 4, 4, 0.0, 0.0}, true, {90.0, -1.0, 0.0, -1, 4, 4, -1.0, -1.0, 1}},
      {"offline later", {kAll, 48000.0, 90.0, 4.0, 4.0, 4, 4, 0.0, 0.0}, true, {90.0, 4.0, 4.0, 48000, 4, 4, -1.0, -1.0, 1}},
  };
  KTransport transport;
  for (const Row& row : rows) {
    KAcceptTransport(&row.time, row.offline, transport);
    EXPECT_EQ(Fields(transport), Fields(row.expected)) << row.what;
  }
  KAcceptTransport(nullptr, true, transport);  // a host without time information: all unknown
  EXPECT_EQ(Fields(transport), Fields(KTransport{}));
}

// Host points become the plug-in's ramp: from the present value up to a late first point, time
// never running backwards, the last point winning beyond the ramp's room, a lone point at once.
TEST(HostRamp, PointsBecomeOneRampWhateverTheHostGives) {
  KRecordingPlugin plugin(1);
  KBlockBuffers buffers(2, 2, 256);
  plugin.Run(buffers, 32);  // the start-up update is behind us
  KHostRamp late(plugin, 0);
  late.Add(64, 1.0), late.Add(32, 0.25), late.Commit();  // 32 runs backwards: taken at 64, after 1.0
  plugin.Run(buffers, 128);
  EXPECT_EQ(plugin.Pieces(0), "32@0 32@0.5 32@0.25 32@0.25");
  KHostRamp crowded(plugin, 0);
  for (int32_t i = 0; i < 70; ++i) crowded.Add(i, i / 100.0);
  crowded.Commit();
  plugin.Run(buffers, 128);
  EXPECT_DOUBLE_EQ(plugin.GetParameter(0).Normalized(), 0.69);
  KHostRamp lone(plugin, 0);
  lone.Add(10, 0.3), lone.Commit();  // from the present value: a ramp of two points
  lone.Add(0, 0.4), lone.Commit();   // one point at the start: lands at once
  EXPECT_EQ(std::pair(plugin.GetParameter(0).Normalized(), plugin.ActiveRampCount()), std::pair(0.4, 0));
}

TEST(HostEcho, AValueComingBackWhileThePluginSendsIsTheHostsEcho) {
  KRecordingPlugin plugin(2);
  KTakeHostValue(plugin, 1, 0.25);
  plugin.AutomationSending().store(1);
  KTakeHostValue(plugin, 1, 0.75);  // the echo
  plugin.AutomationSending().store(0);
  KTakeHostValue(plugin, 2, 0.5);  // no such parameter
  EXPECT_EQ(plugin.GetParameter(1).Normalized(), 0.25);
}

// A mono host feeding a stereo plug-in, a bus the host left out, and a block longer than prepared.
TEST(HostChannelMap, ClampedInputsZeroedSilenceAndADiscardedOutputWithoutAllocating) {
  KHostChannelMap map;
  map.Prepare(64);
  float left[64] = {}, other[64] = {};
  const float* hostIn[] = {left};
  float* hostOut[] = {other};
  const float* in[4] = {};
  float* out[2] = {};
  KAllocationCounter allocations;
  map.MapInputs(hostIn, 1, 2, 64, in);
  map.MapInputs(nullptr, 0, 2, 64, in + 2);
  EXPECT_TRUE(map.MapOutputs(hostOut, 1, 2, 64, out));
  EXPECT_EQ(allocations.Count(), 0);
  EXPECT_EQ((std::tuple{in[0], in[1], in[2] == in[3], out[0]}), (std::tuple{left, left, true, other}));
  EXPECT_TRUE(in[2] && std::all_of(in[2], in[2] + 64, [](float s) { return s == 0.0f; }));
  EXPECT_TRUE(out[1] && out[1] != other && out[1] != in[2]);
  map.MapInputs(nullptr, 0, 1, 65, in);  // past the prepared length: null, which the cycle reads as silence
  EXPECT_EQ((std::pair{in[0], map.MapOutputs(hostOut, 1, 2, 65, out)}), (std::pair{static_cast<const float*>(nullptr), false}));
  EXPECT_TRUE(map.MapOutputs(hostOut, 1, 1, 65, out));  // nothing to discard
}

// Messages from another thread arrive in order, without allocating; a full list drops, and a
// drain hands over each message once.
TEST(HostMIDIList, AppendsFromAnyThreadDrainInOrderAndAFullListDrops) {
  KHostMIDIList list;
  std::vector<int32_t> offsets;
  offsets.reserve(2 * KHostMIDIList::kCapacity);
  std::thread([&] {
    for (int32_t i = 0; i < KHostMIDIList::kCapacity + 1; ++i) {
      const uint8_t bytes[4] = {0x90, static_cast<uint8_t>(i & 127), 100, 0};
      EXPECT_EQ(list.Append(i, bytes), i < KHostMIDIList::kCapacity) << i;
    }
  }).join();
  {
    KAllocationCounter allocations;
    list.BeginBlock();
    list.Drain([&](const KHostMIDIList::Message& m) {
      if (m.sampleOffset != static_cast<int32_t>(offsets.size()) || m.bytes[1] != (m.sampleOffset & 127)) offsets.push_back(-1);
      offsets.push_back(m.sampleOffset);
    });
    list.Drain([&](const KHostMIDIList::Message&) { offsets.push_back(-2); });
    list.EndBlock();
    EXPECT_EQ(allocations.Count(), 0);
  }
  ASSERT_EQ(offsets.size(), static_cast<size_t>(KHostMIDIList::kCapacity));
  EXPECT_EQ(offsets.back(), KHostMIDIList::kCapacity - 1);
  // Drains that found the list empty do not hide what is appended after them.
  const uint8_t late[4] = {0x80, 60, 0, 0};
  ASSERT_TRUE(list.Append(7, late));
  int32_t arrived = 0;
  list.Drain([&](const KHostMIDIList::Message& m) { arrived += m.sampleOffset == 7 && m.bytes[0] == 0x80 ? 1 : 100; });
  list.Drain([&](const KHostMIDIList::Message&) { arrived += 100; });
  EXPECT_EQ(arrived, 1);
}

// The state text stays valid until the next store, and a broken text changes nothing.
TEST(HostState, OneTextOutAndInAllOrNothing) {
  KRecordingPlugin plugin(2), copy(2);
  KHostState state;
  plugin.GetParameter(1).SetNormalized(0.75);
  const std::string_view text = state.Store(plugin);
  EXPECT_EQ(KFailureOf([&] { KHostState::Load(copy, text.substr(0, text.size() / 2)); }).empty(), false);
  EXPECT_EQ(copy.GetParameter(1).Normalized(), 0.0);
  KHostState::Load(copy, text);
  EXPECT_EQ(copy.GetParameter(1).Normalized(), 0.75);
  EXPECT_EQ(text, copy.WriteState());
}

TEST(HostGuard, AKExceptionIsSilentAnythingElseIsTracedWithTheOperation) {
  KTraceCapture trace;
  EXPECT_EQ(KHostGuarded("KAdapter::first", -1, [] { return 1; }), 1);
  EXPECT_EQ(KHostGuarded("KAdapter::second", -1, []() -> int { throw KException("for the user"); }), -1);
  EXPECT_EQ(KHostGuarded("KAdapter::third", -1, []() -> int { throw std::runtime_error("bug"); }), -1);
  EXPECT_EQ(KTraceCapture::Lines(), std::vector<std::string>{"SYSTEM EXCEPTION! KAdapter::third"});
}

// The creation entry: the loader's two names joined; an unknown name is a KException that the
// entry answers with null silently; anything else is shown with the format's caption.
TEST(HostEntry, NamesJoinUnknownOnesAreSilentAndOtherFailuresAreShown) {
  static std::vector<std::string> messages;
  const KUserMessageHook previous = KSetUserMessageHook([](const KString& text) { messages.push_back(text.ToUtf8()); });
  const std::unique_ptr<KAudioPlugin> made = KHostCreatePlugin("KUtility", "Plugin");
  EXPECT_EQ(made ? made->Identifier().ToUtf8() : "", "KUtilityPlugin");
  int built = 0;
  const auto make = [&](const char* name) { return KHostEntryGuarded<int>("VST9 Plugin main", "KEntry", [&] { return KHostCreatePlugin(name, "") ? &built : nullptr; }); };
  EXPECT_EQ(make("KUtilityPlugin"), &built);
  EXPECT_EQ(make("KNoSuchPlugin"), nullptr);
  EXPECT_EQ(KHostEntryGuarded<int>("VST9 Plugin main", "KEntry", []() -> int* { throw std::bad_alloc(); }), nullptr);
  KSetUserMessageHook(previous);
  EXPECT_EQ(messages, std::vector<std::string>{"VST9 Plugin main\n\nSYSTEM EXCEPTION! KEntry"});
}
