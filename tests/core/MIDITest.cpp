#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <stdexcept>
#include <vector>

#include "core/KMIDIProcessor.h"
#include "core/KMIDIQueue.h"
#include "kernel/KArray.h"
#include "kernel/KException.h"
#include "tests/core/AllocationCounter.h"
#include "tests/core/TraceCapture.h"

using testing::ElementsAre;

namespace {
enum KHandlerId { kNote, kAllNotesOff, kSustain, kController };

struct KHandled {
  KHandlerId handler;
  KMIDIEvent event;
};

// Records every handler call; room is reserved so that recording does not allocate.
class KRecordingProcessor : public KMIDIProcessor {
public:
  explicit KRecordingProcessor(const KTransport& transport) : KMIDIProcessor(transport) { calls.reserve(4096); }
  void ProcessNotePerformCore(const KMIDIEvent& e) override { calls.push_back({kNote, e}); }
  void ProcessAllNotesOff(const KMIDIEvent& e) override { calls.push_back({kAllNotesOff, e}); }
  void ProcessSustain(const KMIDIEvent& e) override { calls.push_back({kSustain, e}); }
  void ProcessMIDIController(const KMIDIEvent& e) override { calls.push_back({kController, e}); }
  std::vector<KHandled> calls;
};

// One message and the one handler call it must produce.
struct KRow {
  KMIDIBytes bytes;
  KHandlerId handler;
  uint8_t channel, number, kind;
  double value;
};
}  // namespace

TEST(KMIDIProcessor, DecodesEveryKindOfChannelMessage) {
  using E = KMIDIEvent;
  constexpr auto kCC = E::kController;
  // In order through one processor: a pending coarse controller carries over to later rows.
  const KRow rows[] = {
      {{0x93, 60, 100}, kNote, 3, 60, E::kNoteOn, 100 / 127.0},
      {{0x8F, 61, 64}, kNote, 15, 61, E::kNoteOff, 64 / 127.0},  // release velocity kept
      {{0x90, 62, 0}, kNote, 0, 62, E::kNoteOff, 0.0},           // velocity 0 is a note off
      {{0x90, 0xBC, 0xFF}, kNote, 0, 60, E::kNoteOn, 1.0},       // data bytes count 7 bits
      {{0xA1, 60, 127}, kNote, 1, 60, E::kPressure, 126 / 127.0},  // offset by one, deliberately
      {{0xA1, 60, 0}, kNote, 1, 60, E::kPressure, 0.0},
      {{0xD2, 64, 0}, kNote, 2, E::kChannelPressure, E::kPressure, 63 / 127.0},
      {{0xB4, 74, 64}, kController, 4, 74, kCC, 63 / 126.0},
      {{0xB4, 74, 1}, kController, 4, 74, kCC, 0.0},
      {{0xB4, 74, 0}, kController, 4, 74, kCC, 0.0},
      {{0xB4, 74, 127}, kController, 4, 74, kCC, 1.0},
      // A fine controller (32-63) combines once with its pending coarse partner, under its number.
      {{0xB0, 7, 100}, kController, 0, 7, kCC, 99 / 126.0},
      {{0xB0, 39, 0}, kController, 0, 7, kCC, (100 * 128 - 1) / 16382.0},
      {{0xB0, 39, 0}, kController, 0, 39, kCC, 0.0},
      {{0xB0, 39, 5}, kController, 0, 39, kCC, 4 / 126.0},
      {{0xB0, 7, 127}, kController, 0, 7, kCC, 1.0},
      {{0xB0, 74, 3}, kController, 0, 74, kCC, 2 / 126.0},  // from 64 up: the partner stays pending
      {{0xB0, 39, 127}, kController, 0, 7, kCC, 1.0},
      {{0xB0, 7, 0}, kController, 0, 7, kCC, 0.0},
      {{0xB0, 39, 0}, kController, 0, 7, kCC, 0.0},  // raw 0
      {{0xB0, 7, 50}, kController, 0, 7, kCC, 49 / 126.0},
      {{0xB0, 1, 50}, kController, 0, 1, kCC, 49 / 126.0},  // replaces 7 as the pending partner
      {{0xB0, 39, 2}, kController, 0, 39, kCC, 1 / 126.0},
      {{0xB0, 33, 2}, kController, 0, 1, kCC, (50 * 128 + 1) / 16382.0},
      // The pedal and the channel-mode messages reach only their own handler.
      {{0xB5, 64, 64}, kSustain, 5, 64, kCC, 0.5},
      {{0xB5, 64, 63}, kSustain, 5, 64, kCC, 62 / 126.0},
      {{0xB0, 123, 0}, kAllNotesOff, 0, 123, kCC, 0.0},
      {{0xB0, 120, 0}, kAllNotesOff, 0, 120, kCC, 0.0},
      {{0xB0, 121, 0}, kController, 0, 121, kCC, 0.0},
      {{0xE6, 0x00, 0x40}, kController, 6, E::kPitchBend, kCC, 0.0},  // byte 2 is the high part
      {{0xE6, 0x00, 0x00}, kController, 6, E::kPitchBend, kCC, -1.0},
      {{0xE6, 0x7F, 0x7F}, kController, 6, E::kPitchBend, kCC, 8191 / 8192.0},
  };
  KTransport transport;
  KRecordingProcessor processor(transport);
  for (const KRow& row : rows) {
    SCOPED_TRACE(testing::Message() << std::hex << int{row.bytes[0]} << ' ' << int{row.bytes[1]} << ' '
                                    << int{row.bytes[2]});
    processor.calls.clear();
    EXPECT_EQ(processor.ProcessMIDIEvent(0, row.bytes), 1);
    ASSERT_EQ(processor.calls.size(), 1u);
    const KHandled& got = processor.calls[0];
    EXPECT_EQ(got.handler, row.handler);
    EXPECT_EQ(got.event.channel, row.channel);
    EXPECT_EQ(got.event.number, row.number);
    EXPECT_EQ(got.event.kind, row.kind);
    EXPECT_DOUBLE_EQ(got.event.value, row.value);
  }

  processor.calls.clear();
  for (KMIDIBytes ignored : {KMIDIBytes{0xC3, 5}, KMIDIBytes{0xF0, 0x7E}, KMIDIBytes{0xF8}, KMIDIBytes{0x45, 60, 100}})
    EXPECT_EQ(processor.ProcessMIDIEvent(0, ignored), 0) << int{ignored[0]};
  EXPECT_TRUE(processor.calls.empty());
}

TEST(KMIDIProcessor, MusicalTimeCountsFromTheBlockStartAtTheTransportTempo) {
  KTransport transport;
  transport.tempo = 120.0;
  transport.songPosition = 8.0;
  KRecordingProcessor processor(transport);
  processor.SetSampleRate(48000.0);
  processor.ProcessMIDIEvent(0, {0x90, 60, 1});
  processor.ProcessMIDIEvent(24000, {0x90, 60, 1});  // half a second: one beat
  transport.songPosition = 16.0;  // the processor reads its owner's transport as it is now
  transport.tempo = 90.0;
  processor.SetSampleRate(96000.0);
  processor.ProcessMIDIEvent(64000, {0xB0, 1, 1});
  ASSERT_EQ(processor.calls.size(), 3u);
  EXPECT_EQ(processor.calls[0].event.musicalTime, 8.0);
  EXPECT_EQ(processor.calls[1].event.sampleOffset, 24000);
  EXPECT_DOUBLE_EQ(processor.calls[1].event.musicalTime, 9.0);
  EXPECT_DOUBLE_EQ(processor.calls[2].event.musicalTime, 17.0);
}

namespace {
class KFailingProcessor : public KMIDIProcessor {
public:
  using KMIDIProcessor::KMIDIProcessor;
  bool userError = false;
  void ProcessNotePerformCore(const KMIDIEvent&) override { Fail(); }
  void ProcessAllNotesOff(const KMIDIEvent&) override { Fail(); }
  void ProcessSustain(const KMIDIEvent&) override { Fail(); }
  void ProcessMIDIController(const KMIDIEvent&) override { Fail(); }

private:
  void Fail() const {
    if (userError) throw KException("Cannot play this note.");
    throw std::logic_error("handler fault");
  }
};
}  // namespace

TEST(KMIDIProcessor, HandlerFailuresStayInsideTheDecoder) {
  KTraceCapture trace;
  KTransport transport;
  KFailingProcessor processor(transport);
  processor.userError = true;
  EXPECT_EQ(processor.ProcessMIDIEvent(0, {0x90, 60, 100}), 1);
  EXPECT_TRUE(trace.Lines().empty());  // a KException is swallowed silently

  processor.userError = false;
  for (KMIDIBytes bytes : {KMIDIBytes{0x90, 60, 100}, KMIDIBytes{0xB0, 123}, KMIDIBytes{0xB0, 64}, KMIDIBytes{0xE0}})
    EXPECT_EQ(processor.ProcessMIDIEvent(0, bytes), 1);
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessNotePerformCore",
                                         "SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessAllNotesOff",
                                         "SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessSustain",
                                         "SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessMIDIController"));
}

namespace {
struct KTestMonitor : KMIDIMonitor {
  enum Mode { kPass, kVeto, kFault } mode = kPass;
  std::vector<int32_t> offsets;
  void MonitorMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) override {
    offsets.push_back(sampleOffset * 1000 + bytes[1]);
    if (mode == kVeto) throw KException("Filtered.");
    if (mode == kFault) throw std::runtime_error("monitor fault");
  }
};
}  // namespace

TEST(KMIDIQueue, PacksScaledStampsAndLetsSwitchAndMonitorDecide) {
  KTraceCapture trace;
  KMIDIQueue queue;
  KTestMonitor monitor;
  queue.SetTimeBase(2, 100);
  queue.ScheduleMIDIEvent(10, {0x90, 60, 100, 0x12});
  queue.SetTimeBase(1, -5);  // stamps before the block start survive the packing
  queue.ScheduleMIDIEvent(2, {0x80, 60});
  ASSERT_EQ(queue.Count(), 2);
  EXPECT_EQ(queue[0], 0x12643C9000000078ull);  // 0x78 = 10 x 2 + 100
  EXPECT_EQ(KMIDIQueue::Bytes(queue[0]), (KMIDIBytes{0x90, 60, 100, 0x12}));
  EXPECT_EQ(KMIDIQueue::TimeStamp(queue[1]), -3);

  queue.Clear();
  queue.SetMonitor(&monitor);
  queue.SetInputEnabled(false);
  queue.ScheduleMIDIEvent(1, {0x90, 1});  // dropped before the monitor sees it
  queue.SetInputEnabled(true);
  queue.ScheduleMIDIEvent(2, {0x90, 2});
  monitor.mode = KTestMonitor::kVeto;
  queue.ScheduleMIDIEvent(3, {0x90, 3});
  EXPECT_TRUE(trace.Lines().empty());  // a veto is silent
  monitor.mode = KTestMonitor::kFault;
  queue.ScheduleMIDIEvent(4, {0x90, 4});
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! ScheduleMIDIEvent"));
  queue.SetMonitor(nullptr);
  queue.ScheduleMIDIEvent(5, {0x90, 5});
  EXPECT_THAT(monitor.offsets, ElementsAre(2002, 3003, 4004));  // the host's offsets, unscaled
  ASSERT_EQ(queue.Count(), 2);
  EXPECT_EQ(KMIDIQueue::Bytes(queue[1])[1], 5);
}

TEST(KAllocationCounter, SeesOperatorNewAndTheMallocFamilyInNestedScopes) {
  int64_t afterRealloc = 0, afterNew = 0, outerCount = 0;
  {
    KAllocationCounter outer;
    {
      KAllocationCounter inner;
      KArray<int> grown;
      grown.Append(1);
      grown.Append(2);  // realloc of a live block, not only a first allocation
      afterRealloc = inner.Count();
      std::vector<int> v(3);
      afterNew = inner.Count();
    }
    outerCount = outer.Count();
  }
  EXPECT_EQ(afterRealloc, 2);
  EXPECT_EQ(afterNew, 3);
  EXPECT_EQ(outerCount, 3);
}

TEST(KMIDIQueue, RunawayBlockStartsOverWithoutAllocating) {
  KMIDIQueue queue;
  EXPECT_EQ(queue.Capacity(), 2048);  // 1025 rounded up to a power of two
  int32_t fullCount = 0;
  int64_t allocationCount = -1;
  {
    KAllocationCounter allocations;
    for (int32_t i = 0; i < KMIDIQueue::kResetCount; ++i) queue.ScheduleMIDIEvent(i, {0x90, 60, 1});
    fullCount = queue.Count();
    queue.ScheduleMIDIEvent(7, {0x80, 61, 2, 3});  // the 1026th empties the queue first
    allocationCount = allocations.Count();
  }
  EXPECT_EQ(fullCount, 1025);
  EXPECT_EQ(allocationCount, 0);
  ASSERT_EQ(queue.Count(), 1);
  EXPECT_EQ(queue[0], KMIDIQueue::Pack(7, {0x80, 61, 2, 3}));
}

TEST(KMIDIProcessor, QueueIsDecodedPerSubBlockInTimeOrderWithoutAllocating) {
  KTransport transport;
  KRecordingProcessor processor(transport);
  KMIDIQueue queue;
  const int32_t stamps[] = {5, 2, 8, 2, 0};
  for (uint8_t note = 0; note < 5; ++note) queue.ScheduleMIDIEvent(stamps[note], {0x90, note, 100});
  auto decoded = [&] {  // note x 100 + sample offset of each call since the last look
    std::vector<int> out;
    for (const KHandled& call : processor.calls) out.push_back(call.event.number * 100 + call.event.sampleOffset);
    processor.calls.clear();
    return out;
  };
  processor.ProcessMIDIQueue(queue, 0);
  EXPECT_TRUE(decoded().empty());
  processor.ProcessMIDIQueue(queue, 6);
  EXPECT_THAT(decoded(), ElementsAre(400, 102, 302, 5));  // equal stamps keep their arrival order
  queue.ScheduleMIDIEvent(6, {0x90, 9, 100});             // late, but before the waiting stamp 8
  processor.ProcessMIDIQueue(queue, 64);
  processor.ProcessMIDIQueue(queue, 64);
  EXPECT_THAT(decoded(), ElementsAre(906, 208));

  queue.Clear();
  for (int32_t i = 0; i < KMIDIQueue::kResetCount; ++i) queue.ScheduleMIDIEvent(2000 - i, {0xB0, 1, 1});
  int64_t allocationCount = -1;
  {
    KAllocationCounter allocations;
    processor.ProcessMIDIQueue(queue, 4096);
    allocationCount = allocations.Count();
  }
  EXPECT_EQ(allocationCount, 0);
  ASSERT_EQ(processor.calls.size(), 1025u);
  for (size_t i = 1; i < processor.calls.size(); ++i)
    ASSERT_LT(processor.calls[i - 1].event.sampleOffset, processor.calls[i].event.sampleOffset);
}
