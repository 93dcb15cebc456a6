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

  // Decodes one message that must reach exactly one handler, and answers that call.
  KHandled DecodeOne(KMIDIBytes bytes, int32_t offset = 0) {
    calls.clear();
    EXPECT_EQ(ProcessMIDIEvent(offset, bytes), 1);
    EXPECT_EQ(calls.size(), 1u);
    return calls.empty() ? KHandled{} : calls.back();
  }
  double Value(KMIDIBytes bytes) { return DecodeOne(bytes).event.value; }

  std::vector<KHandled> calls;
};

class MIDIProcessorTest : public testing::Test {
protected:
  MIDIProcessorTest() {
    transport.tempo = 120.0;
    transport.songPosition = 8.0;
    processor.SetSampleRate(48000.0);
  }
  KTransport transport;
  KRecordingProcessor processor{transport};
};
}  // namespace

TEST_F(MIDIProcessorTest, NotesOnAndOff) {
  KHandled on = processor.DecodeOne({0x93, 60, 100, 0});
  EXPECT_EQ(on.handler, kNote);
  EXPECT_EQ(on.event.channel, 3);
  EXPECT_EQ(on.event.number, 60);
  EXPECT_EQ(on.event.kind, KMIDIEvent::kNoteOn);
  EXPECT_DOUBLE_EQ(on.event.value, 100 / 127.0);

  KHandled off = processor.DecodeOne({0x8F, 61, 64, 0});  // release velocity is kept
  EXPECT_EQ(off.event.channel, 15);
  EXPECT_EQ(off.event.kind, KMIDIEvent::kNoteOff);
  EXPECT_DOUBLE_EQ(off.event.value, 64 / 127.0);

  KHandled silent = processor.DecodeOne({0x90, 62, 0, 0});  // velocity 0 is a note off
  EXPECT_EQ(silent.event.kind, KMIDIEvent::kNoteOff);
  EXPECT_EQ(silent.event.value, 0.0);

  KHandled masked = processor.DecodeOne({0x90, 0x80 | 60, 0xFF, 0});  // data bytes count 7 bits
  EXPECT_EQ(masked.event.number, 60);
  EXPECT_EQ(masked.event.value, 1.0);
}

TEST_F(MIDIProcessorTest, PressureKeepsItsOffsetByOne) {
  KHandled poly = processor.DecodeOne({0xA1, 60, 127, 0});
  EXPECT_EQ(poly.handler, kNote);
  EXPECT_EQ(poly.event.number, 60);
  EXPECT_EQ(poly.event.kind, KMIDIEvent::kPressure);
  EXPECT_DOUBLE_EQ(poly.event.value, 126 / 127.0);
  EXPECT_EQ(processor.Value({0xA1, 60, 1, 0}), 0.0);
  EXPECT_EQ(processor.Value({0xA1, 60, 0, 0}), 0.0);

  KHandled channel = processor.DecodeOne({0xD2, 64, 0, 0});
  EXPECT_EQ(channel.handler, kNote);
  EXPECT_EQ(channel.event.channel, 2);
  EXPECT_EQ(channel.event.number, KMIDIEvent::kChannelPressure);
  EXPECT_EQ(channel.event.kind, KMIDIEvent::kPressure);
  EXPECT_DOUBLE_EQ(channel.event.value, 63 / 127.0);
  EXPECT_EQ(processor.Value({0xD2, 0, 0, 0}), 0.0);
}

TEST_F(MIDIProcessorTest, SevenBitControllers) {
  KHandled cc = processor.DecodeOne({0xB4, 74, 64, 0});
  EXPECT_EQ(cc.handler, kController);
  EXPECT_EQ(cc.event.channel, 4);
  EXPECT_EQ(cc.event.number, 74);
  EXPECT_EQ(cc.event.kind, KMIDIEvent::kController);
  EXPECT_DOUBLE_EQ(cc.event.value, 63 / 126.0);
  EXPECT_EQ(processor.Value({0xB0, 74, 0, 0}), 0.0);
  EXPECT_EQ(processor.Value({0xB0, 74, 1, 0}), 0.0);
  EXPECT_EQ(processor.Value({0xB0, 74, 127, 0}), 1.0);
}

TEST_F(MIDIProcessorTest, FineControllerCombinesWithItsPendingCoarsePartner) {
  EXPECT_DOUBLE_EQ(processor.Value({0xB0, 7, 100, 0}), 99 / 126.0);
  KHandled fine = processor.DecodeOne({0xB0, 39, 0, 0});
  EXPECT_EQ(fine.event.number, 7);  // the pair reports under the coarse number
  EXPECT_DOUBLE_EQ(fine.event.value, (100 * 128 - 1) / 16382.0);

  KHandled again = processor.DecodeOne({0xB0, 39, 0, 0});  // the partner was used up
  EXPECT_EQ(again.event.number, 39);
  EXPECT_EQ(again.event.value, 0.0);
  EXPECT_DOUBLE_EQ(processor.Value({0xB0, 39, 5, 0}), 4 / 126.0);

  processor.DecodeOne({0xB0, 7, 127, 0});
  processor.DecodeOne({0xB0, 74, 3, 0});  // controllers from 64 up leave the partner pending
  EXPECT_EQ(processor.Value({0xB0, 39, 127, 0}), 1.0);

  processor.DecodeOne({0xB0, 7, 0, 0});
  EXPECT_EQ(processor.Value({0xB0, 39, 0, 0}), 0.0);  // raw 0
  processor.DecodeOne({0xB0, 7, 0, 0});
  EXPECT_DOUBLE_EQ(processor.Value({0xB0, 39, 2, 0}), 1 / 16382.0);

  processor.DecodeOne({0xB0, 7, 50, 0});
  processor.DecodeOne({0xB0, 1, 50, 0});  // a newer coarse controller replaces the pending one
  EXPECT_EQ(processor.DecodeOne({0xB0, 39, 2, 0}).event.number, 39);
  EXPECT_EQ(processor.DecodeOne({0xB0, 33, 2, 0}).event.number, 1);
}

TEST_F(MIDIProcessorTest, SustainAndChannelModeMessagesReachOnlyTheirHandlers) {
  KHandled down = processor.DecodeOne({0xB5, 64, 64, 0});
  EXPECT_EQ(down.handler, kSustain);
  EXPECT_EQ(down.event.channel, 5);
  EXPECT_EQ(down.event.value, 0.5);  // MIDI's threshold: 64 and up is down
  EXPECT_LT(processor.Value({0xB0, 64, 63, 0}), 0.5);

  KHandled allNotesOff = processor.DecodeOne({0xB0, 123, 0, 0});
  EXPECT_EQ(allNotesOff.handler, kAllNotesOff);
  EXPECT_EQ(allNotesOff.event.number, 123);
  KHandled allSoundOff = processor.DecodeOne({0xB0, 120, 0, 0});
  EXPECT_EQ(allSoundOff.handler, kAllNotesOff);
  EXPECT_EQ(allSoundOff.event.number, 120);
  EXPECT_EQ(processor.DecodeOne({0xB0, 121, 0, 0}).handler, kController);
}

TEST_F(MIDIProcessorTest, PitchBendIsCentredOn8192) {
  KHandled centre = processor.DecodeOne({0xE6, 0x00, 0x40, 0});
  EXPECT_EQ(centre.handler, kController);
  EXPECT_EQ(centre.event.channel, 6);
  EXPECT_EQ(centre.event.number, KMIDIEvent::kPitchBend);
  EXPECT_EQ(centre.event.value, 0.0);
  EXPECT_EQ(processor.Value({0xE0, 0x00, 0x00, 0}), -1.0);
  EXPECT_EQ(processor.Value({0xE0, 0x7F, 0x7F, 0}), 8191 / 8192.0);
  EXPECT_EQ(processor.Value({0xE0, 0x01, 0x40, 0}), 1 / 8192.0);  // byte 1 is the low part
}

TEST_F(MIDIProcessorTest, ProgramChangesAndSystemMessagesAnswerZero) {
  for (KMIDIBytes ignored : {KMIDIBytes{0xC3, 5, 0, 0}, KMIDIBytes{0xF0, 0x7E, 0, 0}, KMIDIBytes{0xF8, 0, 0, 0},
                             KMIDIBytes{0xFF, 0, 0, 0}, KMIDIBytes{0x45, 60, 100, 0}}) {
    EXPECT_EQ(processor.ProcessMIDIEvent(0, ignored), 0) << int{ignored[0]};
  }
  EXPECT_TRUE(processor.calls.empty());
}

TEST_F(MIDIProcessorTest, MusicalTimeCountsFromTheBlockStartAtTheTransportTempo) {
  EXPECT_EQ(processor.DecodeOne({0x90, 60, 1, 0}, 0).event.musicalTime, 8.0);
  KHandled later = processor.DecodeOne({0x90, 60, 1, 0}, 24000);  // half a second at 120 bpm
  EXPECT_EQ(later.event.sampleOffset, 24000);
  EXPECT_DOUBLE_EQ(later.event.musicalTime, 9.0);

  transport.songPosition = 16.0;  // the processor reads the owner's current transport
  transport.tempo = 90.0;
  processor.SetSampleRate(96000.0);
  EXPECT_DOUBLE_EQ(processor.DecodeOne({0xB0, 1, 1, 0}, 64000).event.musicalTime, 17.0);
}

namespace {
// Fails in every handler, with a user-level exception or a fault.
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
  EXPECT_EQ(processor.ProcessMIDIEvent(0, {0x90, 60, 100, 0}), 1);
  EXPECT_TRUE(trace.Lines().empty());

  processor.userError = false;
  for (KMIDIBytes bytes : {KMIDIBytes{0x90, 60, 100, 0}, KMIDIBytes{0xB0, 123, 0, 0}, KMIDIBytes{0xB0, 64, 127, 0},
                           KMIDIBytes{0xE0, 0, 64, 0}}) {
    EXPECT_EQ(processor.ProcessMIDIEvent(0, bytes), 1);
  }
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessNotePerformCore",
                                         "SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessAllNotesOff",
                                         "SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessSustain",
                                         "SYSTEM EXCEPTION! KMIDIProcessorBase::ProcessMIDIController"));
}

namespace {
// Records what it sees; vetoes or faults on request.
class KTestMonitor : public KMIDIMonitor {
public:
  enum Mode { kPass, kVeto, kFault };
  Mode mode = kPass;
  std::vector<int32_t> offsets;
  void MonitorMIDIEvent(int32_t sampleOffset, KMIDIBytes bytes) override {
    offsets.push_back(sampleOffset);
    lastBytes = bytes;
    if (mode == kVeto) throw KException("Filtered.");
    if (mode == kFault) throw std::runtime_error("monitor fault");
  }
  KMIDIBytes lastBytes{};
};
}  // namespace

TEST(KMIDIQueue, PacksTheScaledTimeStampAndAllFourBytes) {
  KMIDIQueue queue;
  queue.SetTimeBase(2, 100);
  queue.ScheduleMIDIEvent(10, {0x90, 60, 100, 0x12});
  ASSERT_EQ(queue.Count(), 1);
  EXPECT_EQ(queue[0], 0x12643C9000000078ull);  // 0x78 = 10 x 2 + 100
  EXPECT_EQ(KMIDIQueue::Bytes(queue[0]), (KMIDIBytes{0x90, 60, 100, 0x12}));

  queue.SetTimeBase(1, -5);  // stamps before the block start survive the packing
  queue.ScheduleMIDIEvent(2, {0x80, 60, 0, 0});
  EXPECT_EQ(KMIDIQueue::TimeStamp(queue[1]), -3);
}

TEST(KMIDIQueue, InputSwitchAndMonitorDecideWhatIsQueued) {
  KTraceCapture trace;
  KMIDIQueue queue;
  KTestMonitor monitor;
  queue.SetMonitor(&monitor);
  queue.SetTimeBase(4, 1);

  queue.SetInputEnabled(false);
  queue.ScheduleMIDIEvent(3, {0x90, 60, 100, 0});
  EXPECT_EQ(queue.Count(), 0);
  EXPECT_TRUE(monitor.offsets.empty());  // dropped before the monitor

  queue.SetInputEnabled(true);
  queue.ScheduleMIDIEvent(3, {0x90, 61, 100, 0});
  EXPECT_EQ(queue.Count(), 1);
  EXPECT_EQ(monitor.lastBytes, (KMIDIBytes{0x90, 61, 100, 0}));

  monitor.mode = KTestMonitor::kVeto;
  queue.ScheduleMIDIEvent(5, {0x90, 62, 100, 0});
  EXPECT_EQ(queue.Count(), 1);
  EXPECT_TRUE(trace.Lines().empty());  // a veto is silent

  monitor.mode = KTestMonitor::kFault;
  queue.ScheduleMIDIEvent(6, {0x90, 63, 100, 0});
  EXPECT_EQ(queue.Count(), 1);
  EXPECT_THAT(trace.Lines(), ElementsAre("SYSTEM EXCEPTION! ScheduleMIDIEvent"));
  EXPECT_THAT(monitor.offsets, ElementsAre(3, 5, 6));  // the host's offsets, before scaling

  queue.SetMonitor(nullptr);
  queue.ScheduleMIDIEvent(7, {0x90, 64, 100, 0});
  EXPECT_EQ(queue.Count(), 2);
  EXPECT_EQ(monitor.offsets.size(), 3u);
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
    for (int32_t i = 0; i < KMIDIQueue::kResetCount; ++i) queue.ScheduleMIDIEvent(i, {0x90, 60, 1, 0});
    fullCount = queue.Count();
    queue.ScheduleMIDIEvent(7, {0x80, 61, 2, 3});  // the 1026th empties the queue first
    allocationCount = allocations.Count();
  }
  EXPECT_EQ(fullCount, 1025);
  EXPECT_EQ(allocationCount, 0);
  ASSERT_EQ(queue.Count(), 1);
  EXPECT_EQ(queue[0], KMIDIQueue::Pack(7, {0x80, 61, 2, 3}));
  EXPECT_EQ(queue.Capacity(), 2048);
}

TEST_F(MIDIProcessorTest, QueueIsDecodedPerSubBlockInTimeOrder) {
  KMIDIQueue queue;
  const int32_t stamps[] = {5, 2, 8, 2, 0};
  for (uint8_t note = 0; note < 5; ++note) queue.ScheduleMIDIEvent(stamps[note], {0x90, note, 100, 0});

  auto notes = [&] {
    std::vector<int> out;
    for (const KHandled& call : processor.calls) out.push_back(call.event.number * 100 + call.event.sampleOffset);
    processor.calls.clear();
    return out;
  };
  processor.ProcessMIDIQueue(queue, 0);
  EXPECT_TRUE(notes().empty());
  processor.ProcessMIDIQueue(queue, 6);
  EXPECT_THAT(notes(), ElementsAre(400, 102, 302, 5));  // equal stamps keep their arrival order
  queue.ScheduleMIDIEvent(6, {0x90, 9, 100, 0});  // arrives late, still before stamp 8
  processor.ProcessMIDIQueue(queue, 64);
  EXPECT_THAT(notes(), ElementsAre(906, 208));
  processor.ProcessMIDIQueue(queue, 64);
  EXPECT_TRUE(notes().empty());

  // A full block in reverse order is sorted and decoded without allocating.
  queue.Clear();
  for (int32_t i = 0; i < KMIDIQueue::kResetCount; ++i) queue.ScheduleMIDIEvent(2000 - i, {0xB0, 1, 1, 0});
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
