#include <gmock/gmock.h>

#include <stdexcept>
#include <tuple>

#include "core/KMIDIProcessor.h"
#include "core/KMIDIQueue.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/TraceCapture.h"

namespace {
enum KHandlerId { kNone, kNote, kAllNotesOff, kSustain, kController };

// Records every handler call; room is reserved so that recording does not allocate.
class KRecordingProcessor : public KMIDIProcessor {
public:
  explicit KRecordingProcessor(const KTransport& transport) : KMIDIProcessor(transport) { calls.reserve(4096); }
  void ProcessNotePerformCore(const KMIDIEvent& e) override { calls.push_back({kNote, e}); }
  void ProcessAllNotesOff(const KMIDIEvent& e) override { calls.push_back({kAllNotesOff, e}); }
  void ProcessSustain(const KMIDIEvent& e) override { calls.push_back({kSustain, e}); }
  void ProcessMIDIController(const KMIDIEvent& e) override { calls.push_back({kController, e}); }
  std::vector<std::pair<KHandlerId, KMIDIEvent>> calls;
};
}  // namespace

// In order through one processor: a pending coarse controller carries over to later rows.
TEST(KMIDIProcessor, DecodesEveryKindOfChannelMessageAndAnswersZeroForOthers) {
  using E = KMIDIEvent;
  constexpr uint8_t kCC = E::kController;
  struct Row { KMIDIBytes bytes; KHandlerId handler; uint8_t channel, number, kind; double value; };
  const Row rows[] = {
      {{0x93, 60, 100}, kNote, 3, 60, E::kNoteOn, 100 / 127.0},
      {{0x8F, 61, 64}, kNote, 15, 61, E::kNoteOff, 64 / 127.0},    // release velocity kept
      {{0x90, 62, 0}, kNote, 0, 62, E::kNoteOff, 0.0},             // velocity 0 is a note off
      {{0xA1, 60, 127}, kNote, 1, 60, E::kPressure, 126 / 127.0},  // offset by one, deliberately
      {{0xD2, 64, 0}, kNote, 2, E::kChannelPressure, E::kPressure, 63 / 127.0},
      {{0xB4, 74, 64}, kController, 4, 74, kCC, 63 / 126.0},
      {{0xB4, 74, 0}, kController, 4, 74, kCC, 0.0},  // so does 1
      // A fine controller (32-63) combines once with its pending coarse partner, under its number;
      // controllers from 64 up leave the partner pending, another coarse one replaces it.
      {{0xB0, 7, 100}, kController, 0, 7, kCC, 99 / 126.0},
      {{0xB0, 74, 3}, kController, 0, 74, kCC, 2 / 126.0},
      {{0xB0, 39, 0}, kController, 0, 7, kCC, (100 * 128 - 1) / 16382.0},
      {{0xB0, 39, 5}, kController, 0, 39, kCC, 4 / 126.0},
      {{0xB0, 7, 50}, kController, 0, 7, kCC, 49 / 126.0},
      {{0xB0, 1, 50}, kController, 0, 1, kCC, 49 / 126.0},
      {{0xB0, 39, 2}, kController, 0, 39, kCC, 1 / 126.0},
      {{0xB0, 33, 2}, kController, 0, 1, kCC, (50 * 128 + 1) / 16382.0},
      // The pedal and the channel-mode messages reach only their own handler.
      {{0xB5, 64, 64}, kSustain, 5, 64, kCC, 0.5},
      {{0xB0, 123, 0}, kAllNotesOff, 0, 123, kCC, 0.0},
      {{0xE6, 0x00, 0x40}, kController, 6, E::kPitchBend, kCC, 0.0},  // byte 2 holds the high bits
      {{0xE6, 0x00, 0x00}, kController, 6, E::kPitchBend, kCC, -1.0},
      {{0xC3, 5}, kNone, 0, 0, 0, 0.0},  // program changes are left to the plug-in
  };
  KTransport transport;
  KRecordingProcessor processor(transport);
  for (const auto& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << int{row.bytes[0]} << ' ' << int{row.bytes[1]} << ' ' << int{row.bytes[2]});
    processor.calls.clear();
    EXPECT_EQ(processor.ProcessMIDIEvent(0, row.bytes), row.handler == kNone ? 0 : 1);
    ASSERT_EQ(processor.calls.size(), row.handler == kNone ? 0u : 1u);
    if (row.handler == kNone) continue;
    const auto& [handler, e] = processor.calls[0];
    EXPECT_EQ(std::tuple(handler, e.channel, e.number, e.kind), std::tuple(row.handler, row.channel, row.number, row.kind));
    EXPECT_DOUBLE_EQ(e.value, row.value);
  }
}

TEST(KMIDIProcessor, MusicalTimeCountsFromTheBlockStartAtTheTransportTempo) {
  KTransport transport{.tempo = 120.0, .songPosition = 8.0};
  KRecordingProcessor processor(transport);
  processor.SetSampleRate(48000.0);
  processor.ProcessMIDIEvent(24000, {0x90, 60, 1});  // half a second: one beat
  transport = {.tempo = 90.0, .songPosition = 16.0};  // read as it is at each message
  processor.SetSampleRate(96000.0);
  processor.ProcessMIDIEvent(64000, {0xB0, 1, 1});
  ASSERT_EQ(processor.calls.size(), 2u);
  EXPECT_DOUBLE_EQ(processor.calls[0].second.musicalTime, 9.0);
  EXPECT_DOUBLE_EQ(processor.calls[1].second.musicalTime, 17.0);
}

// The input switch and the monitor decide what is queued. 1025 messages in reverse order are
// queued and decoded in time order without touching the heap; the 1026th empties the queue.
TEST(KMIDIQueue, TheSwitchAndTheMonitorDecideAndRunawayInputStartsOverWithoutAllocating) {
  struct KTestMonitor : KMIDIMonitor {
    enum { kPass, kVeto, kFault } mode = kPass;
    std::vector<int32_t> seen;  // the offsets it saw
    void MonitorMIDIEvent(int32_t sampleOffset, KMIDIBytes) override {
      seen.push_back(sampleOffset);
      if (mode == kVeto) throw KException("Filtered.");
      if (mode == kFault) throw std::runtime_error("monitor fault");
    }
  } monitor;
  KTraceCapture trace;
  KMIDIQueue queue;
  queue.SetMonitor(&monitor);
  queue.SetInputEnabled(false);
  queue.ScheduleMIDIEvent(1, {0x90, 1});  // dropped before the monitor sees it
  queue.SetInputEnabled(true);
  for (auto mode : {KTestMonitor::kVeto, KTestMonitor::kFault, KTestMonitor::kPass}) {
    monitor.mode = mode;
    queue.ScheduleMIDIEvent(2 + mode, {0x90, 2});
  }
  EXPECT_THAT(trace.Lines(), testing::ElementsAre("SYSTEM EXCEPTION! ScheduleMIDIEvent"));  // a veto is silent
  EXPECT_THAT(monitor.seen, testing::ElementsAre(3, 4, 2));
  ASSERT_EQ(queue.Count(), 1);
  queue.SetMonitor(nullptr);

  KTransport transport;
  KRecordingProcessor processor(transport);
  int64_t allocationCount = -1;
  {
    KAllocationCounter allocations;
    for (int32_t i = 1; i < KMIDIQueue::kResetCount; ++i) queue.ScheduleMIDIEvent(2000 - i, {0xB0, 1, 1});
    processor.ProcessMIDIQueue(queue, 4096);
    allocationCount = allocations.Count();
  }
  EXPECT_EQ(allocationCount, 0);
  ASSERT_EQ(processor.calls.size(), 1025u);
  for (size_t i = 1; i < processor.calls.size(); ++i)
    ASSERT_LT(processor.calls[i - 1].second.sampleOffset, processor.calls[i].second.sampleOffset);
  queue.ScheduleMIDIEvent(7, {0x80, 61, 2, 3});
  ASSERT_EQ(queue.Count(), 1);
  EXPECT_EQ(queue[0], KMIDIQueue::Pack(7, {0x80, 61, 2, 3}));
}
