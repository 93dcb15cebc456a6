#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <string>
#include <vector>

#include "dsp/KLFO.h"
#include "dsp/KNoteValues.h"

namespace {

KLFOSettings Free(int32_t shape, double rate, double rateOfSamples = 48000.0) {
  KLFOSettings s;
  s.shape = shape;
  s.rate = rate;
  s.sampleRate = rateOfSamples;
  return s;
}

KLFOSettings Synced(int32_t shape, int32_t note, double tempo) {
  KLFOSettings s = Free(shape, 1.0);
  s.note = note;
  s.tempo = tempo;
  return s;
}

std::vector<double> Values(KLFO& lfo, int32_t n) {
  std::vector<double> out(static_cast<size_t>(n));
  lfo.Fill(out.data(), n);
  return out;
}

int32_t NoteIndex(const char* name) {
  for (int32_t i = 0; i < kNoteValueCount; ++i)
    if (std::string(kNoteValues[i].name) == name) return i;
  return -1;
}

}  // namespace

// A quarter note at 120 BPM and 48 kHz is 24000 samples: the saw restarts exactly on every beat
// and each cycle repeats the one before bit for bit, however many have passed.
TEST(KLFO, SyncedCycleEndsExactlyOnTheBeat) {
  ASSERT_EQ(NoteIndex("1/4"), kNoteValueQuarter);
  for (int32_t shape : {KLFO::kSawUp, KLFO::kSine}) {
    KLFO lfo;
    lfo.Update(Synced(shape, kNoteValueQuarter, 120.0));
    lfo.Reset();
    EXPECT_EQ(lfo.CycleSamples(), 24000.0);
    const std::vector<double> out = Values(lfo, 24000 * 5 + 1);
    for (size_t i = 0; i + 24000 < out.size(); ++i) ASSERT_EQ(out[i + 24000], out[i]) << i;
    if (shape == KLFO::kSawUp) {
      for (int32_t beat = 0; beat <= 5; ++beat) EXPECT_EQ(out[beat * 24000], -1.0) << beat;
      EXPECT_GT(out[23999], 0.9999);
      EXPECT_EQ(std::max_element(out.begin(), out.begin() + 24000) - out.begin(), 23999);
    } else {
      EXPECT_NEAR(out[6000], 1.0, 1e-12);
      EXPECT_NEAR(out[18000], -1.0, 1e-12);
    }
  }
  // Dotted and triplet values: an eighth triplet at 100 BPM is 0.2 s.
  KLFO triplet;
  triplet.Update(Synced(KLFO::kSine, NoteIndex("1/8T"), 100.0));
  EXPECT_NEAR(triplet.CycleSamples(), 9600.0, 1e-9);
}

// The shapes at the quarters of an eight-sample cycle, from the start phase.
TEST(KLFO, ShapesAndStartPhase) {
  const double expected[KLFO::kShapeCount - 2][4] = {
      {0.0, 1.0, 0.0, -1.0},   // sine
      {0.0, 1.0, 0.0, -1.0},   // triangle
      {-1.0, -0.5, 0.0, 0.5},  // saw up
      {1.0, 0.5, 0.0, -0.5},   // saw down
      {1.0, 1.0, -1.0, -1.0},  // square
  };
  for (int32_t shape = 0; shape < KLFO::kShapeCount - 2; ++shape) {
    KLFO lfo;
    lfo.Update(Free(shape, 6000.0));
    lfo.Reset();
    const std::vector<double> out = Values(lfo, 16);
    for (int32_t q = 0; q < 4; ++q) {
      EXPECT_NEAR(out[2 * q], expected[shape][q], 1e-12) << KLFO::kShapeNames[shape] << " " << q;
      EXPECT_NEAR(out[2 * q + 8], expected[shape][q], 1e-12) << KLFO::kShapeNames[shape] << " " << q;
      EXPECT_NEAR(KLFO::Value(shape, 0.25 * q), expected[shape][q], 1e-12);
    }
  }
  // A start phase of a quarter begins the sine at its crest; phases wrap.
  KLFOSettings s = Free(KLFO::kSine, 1.0);
  s.phase = 1.25;
  KLFO lfo;
  lfo.Update(s);
  lfo.Reset();
  EXPECT_NEAR(Values(lfo, 1)[0], 1.0, 1e-12);
  EXPECT_NEAR(lfo.Phase(), 0.25 + 1.0 / 48000.0, 1e-12);
}

// Changing the rate mid-cycle keeps the phase (no jump in the output), a non-integer cycle does not
// drift over many cycles, and very fast or zero rates stay within bounds.
TEST(KLFO, RateChangesKeepThePhaseAndLongRunsDoNotDrift) {
  KLFO lfo;
  lfo.Update(Free(KLFO::kSine, 2.0));
  lfo.Reset();
  const double before = Values(lfo, 3000).back();
  lfo.Update(Free(KLFO::kSine, 3.0));
  EXPECT_NEAR(lfo.Phase(), 3000.0 / 24000.0, 1e-12);
  const double after = Values(lfo, 1)[0];
  EXPECT_NEAR(after, before, 2.0 * 6.283185307179586 * 3.0 / 48000.0);

  // 1/16 at 130 BPM and 48 kHz: 5538.46… samples per cycle.
  KLFO odd;
  odd.Update(Synced(KLFO::kSawUp, NoteIndex("1/16"), 130.0));
  odd.Reset();
  const int32_t n = 48000 * 20;
  Values(odd, n);
  const double cycles = n / odd.CycleSamples();
  EXPECT_NEAR(odd.Phase(), cycles - std::floor(cycles), 1e-9);

  KLFO fast, stopped;
  fast.Update(Free(KLFO::kSawUp, 1e6));
  stopped.Update(Free(KLFO::kSawUp, 0.0));
  EXPECT_EQ(fast.CycleSamples(), 2.0);
  for (double v : Values(fast, 8)) EXPECT_TRUE(v == -1.0 || v == 0.0);
  stopped.Reset();
  EXPECT_NEAR(Values(stopped, 48000).back(), -1.0, 1e-4);
}

// A synced LFO takes its place from the song position; a host that plays on steadily, however it
// cuts its blocks, never moves it and leaves the output exactly as without following; a jump is
// followed at once, and Follow says when it moved.
TEST(KLFO, FollowsTheSongPositionOnlyWhenItJumps) {
  KLFO lfo;
  lfo.Update(Synced(KLFO::kSawUp, kNoteValueQuarter, 120.0));
  lfo.Reset();
  EXPECT_TRUE(lfo.Follow(2.5));
  EXPECT_DOUBLE_EQ(lfo.Phase(), 0.5);
  EXPECT_FALSE(lfo.Follow(2.5));  // already there
  lfo.Update(Synced(KLFO::kSawUp, NoteIndex("1/1"), 120.0));
  lfo.Reset();
  lfo.Follow(2.5);
  EXPECT_DOUBLE_EQ(lfo.Phase(), 0.625);

  KLFO steady, plain;
  for (KLFO* l : {&steady, &plain}) {
    l->Update(Synced(KLFO::kSine, NoteIndex("1/8T"), 133.0));
    l->Reset();
  }
  std::vector<double> a(20000), b(20000);
  plain.Fill(b.data(), 20000);
  const double samplesPerQuarter = 48000.0 * 60.0 / 133.0;
  const int32_t blocks[] = {1, 77, 500, 4096, 13, 999};
  for (int32_t at = 0, k = 0; at < 20000; k = (k + 1) % 6) {
    const int32_t block = std::min(blocks[k], 20000 - at);
    EXPECT_FALSE(steady.Follow(at / samplesPerQuarter)) << at;
    steady.Fill(a.data() + at, block);
    at += block;
  }
  EXPECT_EQ(a, b);
  steady.Follow(0.0);
  EXPECT_EQ(steady.Phase(), 0.0);

  KLFO free;  // a free LFO ignores the song position
  free.Update(Free(KLFO::kSine, 1.0));
  free.Reset();
  EXPECT_FALSE(free.Follow(3.3));
  EXPECT_EQ(free.Phase(), 0.0);
}

// Smoothing rounds the square's steps with the set time constant; the random shapes hold (or
// glide) within a cycle, change at its end, stay in [-1, 1] and repeat after Reset.
TEST(KLFO, SmoothingAndRandomShapes) {
  KLFOSettings s = Free(KLFO::kSquare, 10.0);
  s.smoothing = 0.001;
  KLFO lfo;
  lfo.Update(s);
  lfo.Reset();
  const std::vector<double> sq = Values(lfo, 4800);
  EXPECT_NEAR(sq[0], 1.0, 1e-12);
  // From +1 towards -1: after 48 samples (one time constant) 1 - 2(1 - 1/e) is left.
  EXPECT_NEAR(sq[2400 + 47], 1.0 - 2.0 * (1.0 - std::exp(-1.0)), 1e-9);
  EXPECT_NEAR(sq[4799], -1.0, 1e-9);

  for (int32_t shape : {KLFO::kSampleAndHold, KLFO::kRandomSmooth}) {
    KLFO r;
    r.Update(Free(shape, 480.0));  // 100-sample cycles
    r.Reset();
    const std::vector<double> out = Values(r, 2000);
    r.Reset();
    EXPECT_EQ(Values(r, 2000), out);
    double lo = 1.0, hi = -1.0, biggestStep = 0.0;
    int32_t changes = 0;
    for (size_t i = 1; i < out.size(); ++i) {
      lo = std::min(lo, out[i]);
      hi = std::max(hi, out[i]);
      biggestStep = std::max(biggestStep, std::abs(out[i] - out[i - 1]));
      if (shape == KLFO::kSampleAndHold && out[i] != out[i - 1]) {
        ++changes;
        EXPECT_EQ(i % 100, 0u) << i;
      }
    }
    EXPECT_GE(lo, -1.0);
    EXPECT_LE(hi, 1.0);
    EXPECT_GT(hi - lo, 0.5);  // the values do wander
    if (shape == KLFO::kSampleAndHold) EXPECT_GE(changes, 17);
    else EXPECT_LT(biggestStep, 2.0 * 3.2 / 100.0);  // no steps: at most the cosine's steepest slope
  }
}
