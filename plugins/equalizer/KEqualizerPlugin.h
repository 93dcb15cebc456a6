#pragma once

#include "core/KAudioPlugin.h"
#include "dsp/KFilterSection.h"
#include "dsp/KSectionRunner.h"
#include "kernel/KPluginDescription.h"

// An 8-band parametric equalizer: each band one filter section of any designer type, in series,
// then an output gain.
//
// No setting clicks. Every change is designed once, in ProcessUpdate, and the section runner's
// coefficients then glide in a straight line to the new design over kGlideSeconds; a change that
// arrives mid-way turns from wherever they are. Frequency, gain, Q and type changes (and
// switching a band on and off, which glides to or from a pass-through) all take the same path.
//
// Bands whose response is exactly flat (a peak or shelf at 0 dB, a switched-off band) leave the
// cascade once their last ringing has died away, so a default instance costs almost nothing and
// passes audio through bit for bit.
class KEqualizerPlugin final : public KAudioPlugin {
public:
  static constexpr int32_t kBandCount = 8;
  // The parameters of band b (0-based) are kFieldCount rows from Index(b, kEnable) on.
  enum BandField : int32_t { kEnable, kType, kFrequency, kGain, kQ, kFieldCount };
  static constexpr int32_t kOutputGain = kBandCount * kFieldCount;
  static constexpr int32_t kParameterCount = kOutputGain + 1;
  static constexpr int32_t Index(int32_t band, BandField field) noexcept { return band * kFieldCount + field; }
  static constexpr double kGlideSeconds = 0.01;

  KEqualizerPlugin();
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // The design a band is heading for (switched off or not), for the editor's response graph.
  // Frequencies above 0.499 of the sample rate are designed at that limit.
  const KFilterSection& BandDesign(int32_t band) const noexcept { return designs_[band]; }

  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  // Every band's design from the parameters, and the coefficients it runs with (a pass-through
  // when switched off).
  void Design(KSectionRunner::Row (&targets)[kBandCount], KFilterSection (&designs)[kBandCount]) const noexcept;

  KFilterSection designs_[kBandCount];
  KSectionRunner bands_;  // band b at position b, then the output gain
  bool jump_ = true;      // the next update lands at once (first block, reset)
};

// What hosts and the catalogue know of the plug-in (listed in plugins/KCatalogue.cpp), its help
// and its editor (beside it in this folder).
extern const KPluginDescription kEqualizerDescription;
const KPluginHelp& KEqualizerHelp();
KEditorDescription KEqualizerEditor();
