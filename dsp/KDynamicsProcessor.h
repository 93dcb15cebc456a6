#pragma once

#include <cstdint>
#include <vector>

#include "dsp/KFilterSection.h"
#include "dsp/KSectionRunner.h"
#include "dsp/KTransferCurve.h"

// Everything the compressor engine is set from, in the units its plug-in holds them.
struct KDynamicsSettings {
  double gainDb = 0.0;        // input gain, before detection and on the output path
  double outputGainDb = 0.0;
  double attack = 0.01;       // seconds
  double release = 0.05;      // seconds
  double rmsLength = 0.001;   // mean-square smoothing, seconds
  double threshold = 0.5;     // linear; the curve works with its square
  double ratio = 1.8;
  int32_t kneeMode = KTransferCurve::kHardKnee;
  double kneeSize = 0.25;
  bool linkChannels = true;   // one detector for all channels
  bool maximize = false;      // make-up so that full scale maps to full scale
  bool customShape = false;
  const KTransferShape* shape = nullptr;  // kept alive and unchanged by its owner until the next Update
  bool sideChain = false;                 // detect from the side-chain channels given to Process
  bool sideChainFilters = false;          // the plug-in offers the detector band limits below
  double sideChainMinFrequency = 20.0;    // Hz; 20 leaves the high-pass off
  double sideChainMaxFrequency = 20000.0; // Hz; 20000 leaves the low-pass off
  double sampleRate = 44100.0;
};

// The compressor engine: a level detector (mean-square smoothing, square root, attack/release
// envelope) driving a transfer curve, over any number of float channels, in double precision.
// Prepare sizes the buffers; Update, Process, Decay and Reset then run on the audio thread
// without allocating, locking or throwing.
class KDynamicsProcessor {
public:
  // A one-pole smoother: next = coefficient · previous + complement · input.
  struct Pole {
    double coefficient = 0.0;
    double complement = 1.0;
  };

  KDynamicsProcessor() noexcept;

  // Sizes the buffers for blocks of up to maxChannels × maxFrames (longer blocks run in pieces,
  // extra channels are left alone) and clears the detector. Not for the audio thread.
  void Prepare(int32_t maxChannels, int32_t maxFrames);

  // Derives every coefficient, chooses the transfer law and re-designs the band limits.
  void Update(const KDynamicsSettings& settings) noexcept;

  // Writes gain · input to every output channel; an output may be its own input's buffer. The
  // detector reads `sideChain` instead of `in` (same channel count) when the settings ask for it
  // and it is given.
  void Process(int32_t n, const float* const* in, float* const* out, const float* const* sideChain,
               int32_t channels) noexcept;
  // Advances the detector through n samples of silence.
  void Decay(int32_t n) noexcept;
  void Reset() noexcept;
  // Samples of silence after which a detector that stood at full scale (times the input gain)
  // has released to the law's rest, where the gain no longer depends on the past: how long the
  // engine must go on running after its input stops before the next sound finds it at rest.
  // 0 when idle.
  uint32_t ReleaseSamples() const noexcept;

  // The chosen law, for the editor's graph and meters.
  double Gain(double d) noexcept { return curve_.Gain(d); }
  double Curve(double d) const noexcept { return curve_.Curve(d); }
  const KTransferCurve& Transfer() const noexcept { return curve_; }

  bool IsIdle() const noexcept { return idle_; }
  double InputGain() const noexcept { return gIn_; }
  double OutputGain() const noexcept { return gOut_; }
  double Attack() const noexcept { return attack_; }
  double Release() const noexcept { return release_; }
  const Pole& MeanSquare() const noexcept { return meanSquare_; }
  // Two slow averages, over 0.1 s and 2.5 s, for the plug-in's own use.
  const Pole& ShortAverage() const noexcept { return shortAverage_; }
  const Pole& LongAverage() const noexcept { return longAverage_; }

  bool HighPassActive() const noexcept { return highPassOn_; }
  bool LowPassActive() const noexcept { return lowPassOn_; }
  const KFilterSection& HighPass() const noexcept { return highPass_; }
  const KFilterSection& LowPass() const noexcept { return lowPass_; }

  // Detector state of a channel (channel 0 when linked): mean square p and envelope e.
  double Power(int32_t channel) const noexcept { return p_[static_cast<size_t>(channel)]; }
  double Level(int32_t channel) const noexcept { return e_[static_cast<size_t>(channel)]; }
  // Envelope and gain of every sample of the last piece processed (row 0 when linked).
  const float* EnvelopeBuffer(int32_t channel) const noexcept { return Row(envelope_, channel); }
  const float* GainBuffer(int32_t channel) const noexcept { return Row(gains_, channel); }
  // The lowest gain of the last Process over every sample and channel, in single precision as
  // the gain rows hold it; the total gain G when the engine is idle.
  float LowestGain() const noexcept { return lowestGain_; }

  // Whether Process also finds, as it writes each channel, the largest magnitudes of that
  // channel's input and output (for level meters, which then need no pass of their own). Off
  // until set; the outputs are the same either way.
  void MeasurePeaks(bool on) noexcept;
  // Of the last Process with measuring on, for channels 0 and 1: the largest magnitude of the
  // input and of the output. A NaN sample is left out, as level meters leave it out.
  static constexpr int32_t kMeasuredChannels = 2;
  float InputPeak(int32_t channel) const noexcept { return peaks_[channel][0]; }
  float OutputPeak(int32_t channel) const noexcept { return peaks_[channel][1]; }
  // Both, row by row: [channel][0] the input, [channel][1] the output.
  const float (*Peaks() const noexcept)[2] { return peaks_; }

private:
  using Detector = void (*)(KDynamicsProcessor& self, int32_t channels, int32_t frames) noexcept;
  // The passes around the envelope, chosen once for the processor: four samples at a time with
  // AVX, two without.
  using SquareSumPass = void (*)(const float* const* x, int32_t channels, int32_t from, int32_t frames, double gIn,
                                 double share, double* sums) noexcept;
  using StoreGainsPass = float (*)(const double* gains, float* stored, int32_t frames, float lowest) noexcept;
  // `peak` holds the output's largest magnitude so far; a variant that does not measure leaves
  // it alone.
  using ApplyGainsPass = void (*)(const double* gains, const float* in, float* out, int32_t frames, float* peak) noexcept;
  // The same for a linked pair of channels, into the second entry of each channel's row.
  using ApplyPairPass = void (*)(const double* gains, const float* const* in, float* const* out, int32_t frames,
                                 float (*peaks)[2]) noexcept;
  // The inputs' largest magnitudes, into the first entry of each channel's row.
  using MeasureInputsPass = void (*)(const float* const* in, int32_t channels, int32_t frames, float (*peaks)[2]) noexcept;

  static void DetectLinked(KDynamicsProcessor& self, int32_t channels, int32_t frames) noexcept;
  static void DetectUnlinked(KDynamicsProcessor& self, int32_t channels, int32_t frames) noexcept;
  void DesignBandLimits(const KDynamicsSettings& settings) noexcept;
  void Amplify(int32_t n, const float* const* in, float* const* out, int32_t channels) noexcept;
  // Where the passes measure channel `ch`: its own pair, or the row nobody reads.
  float* PeaksOf(size_t ch) noexcept { return peaks_[ch < kMeasuredChannels ? ch : kMeasuredChannels]; }
  void Settle(int32_t states) noexcept;
  const float* Row(const std::vector<float>& rows, int32_t channel) const noexcept {
    return rows.data() + static_cast<size_t>(channel) * static_cast<size_t>(maxFrames_);
  }

  double gIn_ = 1.0, gOut_ = 1.0;
  double attack_ = 0.0, release_ = 0.0;
  Pole meanSquare_, shortAverage_, longAverage_;
  KTransferCurve curve_;
  Detector detector_ = DetectLinked;
  SquareSumPass squareSum_;
  StoreGainsPass storeGains_;
  ApplyGainsPass applyGains_;
  ApplyPairPass applyPair_;
  MeasureInputsPass measureInputs_ = nullptr;
  bool measuring_ = false;
  bool idle_ = false;
  bool linked_ = true;
  bool sideChain_ = false;

  bool highPassOn_ = false, lowPassOn_ = false;
  KFilterSection highPass_, lowPass_;
  KSectionRunner bands_;

  int32_t maxChannels_ = 0, maxFrames_ = 0;
  int32_t channels_ = 0;  // of the last Process, for Decay
  std::vector<double> p_, e_;
  std::vector<float> envelope_, gains_, filtered_;
  std::vector<double> work_;  // one piece's detector values, then its gains
  float lowestGain_ = 1.0f;
  float peaks_[kMeasuredChannels + 1][2] = {};  // input and output of each measured channel; a last row for the rest
  std::vector<float*> filteredRows_, pieceOut_;
  std::vector<const float*> pieceIn_, pieceDetect_;
};
