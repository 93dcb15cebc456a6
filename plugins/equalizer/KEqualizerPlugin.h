#pragma once

#include "core/KAudioPlugin.h"
#include "dsp/KFilterSection.h"
#include "kernel/KPluginDescription.h"

// An 8-band parametric equalizer: each band one filter section of any designer type, in series,
// then an output gain.
//
// No setting clicks. Every change is designed once, in ProcessUpdate, and the running sections'
// coefficients then travel in a straight line to the new design over kGlideSeconds, sample by
// sample; a change that arrives mid-way turns from wherever they are. Second-order sections are
// stable exactly when (a1, a2) lies in a triangle, which is convex, so every point on the way
// between two stable designs is stable too: frequency, gain, Q and type changes (and switching a
// band on and off, which glides to or from a pass-through) all take the same path.
//
// Bands whose response is exactly flat (a peak or shelf at 0 dB, a switched-off band) are left
// out of the cascade once their last ringing has died away, so a default instance costs almost
// nothing and passes audio through bit for bit.
class KEqualizerPlugin final : public KAudioPlugin {
public:
  static constexpr int32_t kBandCount = 8;
  // The parameters of band b (0-based) are kFieldCount rows from Index(b, kEnable) on.
  enum BandField : int32_t { kEnable, kType, kFrequency, kGain, kQ, kFieldCount };
  static constexpr int32_t kOutputGain = kBandCount * kFieldCount;
  static constexpr int32_t kParameterCount = kOutputGain + 1;
  static constexpr int32_t Index(int32_t band, BandField field) noexcept { return band * kFieldCount + field; }
  static constexpr double kGlideSeconds = 0.01;

  // Coefficients of every band in the designer's order (b0, −a1, b1, −a2, b2), and their state.
  struct Bands {
    static constexpr int32_t kChannels = 2;
    double current[kBandCount][5];
    double target[kBandCount][5];
    double step[kBandCount][5];
    double state[kBandCount][2][kChannels];  // transposed direct form II, channels side by side
    int32_t engaged[kBandCount];             // the bands in the cascade, in band order
    int32_t engagedCount;
    double gain, gainTarget, gainStep;  // output gain, linear
  };
  // Runs the engaged bands and the output gain over a block; the gliding kind also moves every
  // coefficient by its step before each sample.
  using Kernel = void (*)(Bands& bands, const float* const* inputs, float* const* outputs, int32_t frames) noexcept;

  KEqualizerPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The design a band is heading for (switched off or not), for the editor's response graph.
  // Frequencies above 0.499 of the sample rate are designed at that limit.
  const KFilterSection& BandDesign(int32_t band) const noexcept { return designs_[band]; }

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  void DesignTargets(double (&targets)[kBandCount][5]) noexcept;
  void Glide(const double (&targets)[kBandCount][5], double gain) noexcept;
  void Engage() noexcept;
  void Land() noexcept;
  void Settle() noexcept;

  KFilterSection designs_[kBandCount];
  Bands bands_{};
  Kernel steady_ = nullptr;
  Kernel gliding_ = nullptr;
  int32_t glideLeft_ = 0;  // samples until every coefficient reaches its target
  bool jump_ = true;       // the next update lands at once (first block, reset)
  bool tidy_ = false;      // a flat band still rings: look again at the next sub-block
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), and its
// help (beside it in this folder).
extern const KPluginDescription kEqualizerDescription;
const KPluginHelp& KEqualizerHelp();
