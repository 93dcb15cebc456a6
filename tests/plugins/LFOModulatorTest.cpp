// The "LFOs" section of a plug-in's state acting through the dsp oscillator: synced to the host
// tempo, on the plug-in's parameters, without allocating, and kept exactly as found.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include "core/KParameter.h"
#include "plugins/KLFOModulator.h"
#include "plugins/utility/KUtilityPlugin.h"
#include "tests/core/AllocationCounter.h"

namespace {
constexpr double kRate = 48000.0;

// A constant 0.5 through the utility in blocks of 512 (or `block`), `beforeBlock(at)` called
// ahead of the block starting at `at`: the left output.
std::vector<float> Through(KUtilityPlugin& plugin, size_t length, size_t block = 512,
                           const std::function<void(size_t)>& beforeBlock = [](size_t) {}) {
  std::vector<float> in(length, 0.5f), left(length), right(length);
  for (size_t at = 0; at < length; at += block) {
    const float* i[] = {in.data() + at, in.data() + at};
    float* o[] = {left.data() + at, right.data() + at};
    beforeBlock(at);
    plugin.ProcessHostBlock(i, o, static_cast<int32_t>(std::min(block, length - at)));
  }
  return left;
}

float Loudest(const std::vector<float>& s, size_t from, size_t to) {
  float peak = 0.0f;
  for (size_t i = from; i < to; ++i) peak = std::max(peak, std::abs(s[i]));
  return peak;
}

const char* kSquareOnMute =
    "<TorvaneState><LFOs Editor=\"open\"><LFO Shape=\"Square\" Note=\"1/4\" Depth=\"ignored\" Future=\"1\">"
    "<Target Parameter=\"mute\" Depth=\"1\"/><Target Parameter=\"nosuch\"/></LFO><Later/></LFOs></TorvaneState>";
}  // namespace

// A square LFO on a quarter note moves the utility's mute up for the first half of each cycle:
// at 120 BPM the cycle is 24000 samples at 48 kHz, at 60 BPM twice that. The switch's own value,
// and so the state, stays off.
TEST(KLFOModulator, SyncedSquareMutesHalfOfEachBeat) {
  ASSERT_NE(KGetModulatorMaker(), nullptr);
  for (double tempo : {120.0, 60.0}) {
    KUtilityPlugin plugin;
    ASSERT_TRUE(plugin.SetSampleRate(kRate));
    plugin.ReadState(kSquareOnMute);
    plugin.Transport().tempo = tempo;
    const size_t beat = static_cast<size_t>(kRate * 60.0 / tempo);
    const std::vector<float> out = Through(plugin, 2 * beat);
    for (size_t cycle = 0; cycle < 2; ++cycle) {
      const size_t start = cycle * beat, settled = 1000;  // past the utility's 5 ms glide
      // The ramp between the corners either side of the switch leaves the mute a corner early.
      EXPECT_LT(Loudest(out, start + settled, start + beat / 2 - KLFOModulator::kCornerSpacing), 1e-6f) << tempo << " BPM, cycle " << cycle;
      EXPECT_GT(Loudest(out, start + beat / 2 + settled, start + beat), 0.49f) << tempo << " BPM, cycle " << cycle;
      EXPECT_LT(Loudest(out, start + beat / 2 + settled, start + beat), 0.51f);
    }
    EXPECT_EQ(plugin.GetParameter(KUtilityPlugin::kMute).Normalized(), 0.0);
  }
}

// While the host plays (120 BPM, 24000 samples a beat) the quarter-note square takes its cycle
// from the song position: from 2.75 the mute holds from the beat at 6000 to 18000 and from 30000;
// looped back to 1.1 at sample 36000 it holds on until 45600 and comes again at 57600.
TEST(KLFOModulator, SyncedLFOFollowsTheSongPositionWhilePlaying) {
  KUtilityPlugin plugin;
  ASSERT_TRUE(plugin.SetSampleRate(kRate));
  plugin.ReadState(kSquareOnMute);
  KTransport& transport = plugin.Transport();
  transport.tempo = 120.0;
  transport.flags = KTransport::kPlaying;
  const std::vector<float> out = Through(plugin, 66000, 500, [&](size_t at) {
    transport.songPosition = at < 36000 ? 2.75 + at / 24000.0 : 1.1 + (at - 36000) / 24000.0;
  });
  // Each stretch from its start (plus the corners' spacing and the utility's glide) to shortly
  // before the next: muted or sounding.
  const std::pair<size_t, bool> stretches[] = {{0, false}, {6000, true}, {18000, false}, {30000, true}, {45600, false}, {57600, true}, {66000, false}};
  for (size_t k = 0; k + 1 < std::size(stretches); ++k) {
    const size_t from = stretches[k].first + 500, to = stretches[k + 1].first - 200;
    if (stretches[k].second) EXPECT_LT(Loudest(out, from, to), 1e-6f) << "muted from " << stretches[k].first;
    else EXPECT_GT(*std::min_element(out.begin() + from, out.begin() + to), 0.49f) << "sounding from " << stretches[k].first;
  }
}

// The section goes back out as it came in, unknown attributes and children included, and the
// oscillator runs without allocating at any block size.
TEST(KLFOModulator, SectionKeptExactlyAndProcessingAllocatesNothing) {
  KUtilityPlugin plugin;
  ASSERT_TRUE(plugin.SetSampleRate(kRate));
  plugin.ReadState(kSquareOnMute);
  const std::string state = plugin.WriteState();
  EXPECT_NE(state.find("<LFOs Editor=\"open\"><LFO Depth=\"ignored\" Future=\"1\" Note=\"1/4\" Shape=\"Square\">"), std::string::npos) << state;
  EXPECT_NE(state.find("<Later/>"), std::string::npos);
  KUtilityPlugin restored;
  restored.ReadState(state);
  EXPECT_EQ(restored.WriteState(), state);

  std::vector<float> in(4096, 0.25f), out(4096);
  for (int32_t block : {1, 37, 4096}) {
    KAllocationCounter counter;
    for (int32_t at = 0; at + block <= 4096; at += block) {
      const float* i[] = {in.data() + at, in.data() + at};
      float* o[] = {out.data() + at, out.data() + at};
      plugin.ProcessHostBlock(i, o, block);
    }
    EXPECT_EQ(counter.Count(), 0) << block;
  }
  EXPECT_NE(KLFOModulator::Make(plugin, plugin.LFOs()), nullptr);
  EXPECT_EQ(KLFOModulator::Make(plugin, Element(KString::Static("LFOs"))), nullptr);
}
