#pragma once

#include <atomic>
#include <iterator>
#include <memory>
#include <mutex>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameterInfo.h"
#include "dsp/KConvolver.h"
#include "dsp/KImpulseResponse.h"
#include "kernel/KPluginDescription.h"

// A reverb that convolves with a recorded space: an impulse response read from a WAV or FLAC
// file, or one of the built-in synthetic spaces, so it sounds without any file. Dry and wet are
// mixed after the convolution; the wet signal's width is set in mid/side.
//
// Threads: a file is read, resampled and transformed on the thread that asks for it (editor,
// state load, sample-rate change), never on the audio thread, which only takes the finished
// space through an atomic hand-over and gives the old one back the same way: no allocation, no
// lock and no wait while processing.
class KConvolutionReverbPlugin final : public KAudioPlugin {
  static constexpr const char* kImpulseNames[] = {"Small room", "Hall", "Plate"};
  static inline const KListKind kImpulseKind{kImpulseNames};
  static inline const KNumberKind kPercentKind{0.0, 100.0, "%", "{0.0}"};
  static inline const KDecibelKind kLevelKind{-24.0, 12.0};
  static inline const KNumberKind kWidthKind{0.0, 200.0, "%", "{0.0}"};
  static constexpr uint32_t kAutomatable = KParameterInfo::kAutomatable;

public:
  static constexpr KParameterInfo kParameters[] = {
      {"impulse", "Space", &kImpulseKind, 1.0, kAutomatable},
      {"mix", "Mix", &kPercentKind, 30.0, kAutomatable},
      {"wetlevel", "Wet level", &kLevelKind, 0.0, kAutomatable},
      {"width", "Width", &kWidthKind, 100.0, kAutomatable},
  };
  static constexpr int32_t kImpulse = KParameterRow(kParameters, "impulse");
  static constexpr int32_t kMix = KParameterRow(kParameters, "mix");
  static constexpr int32_t kWetLevel = KParameterRow(kParameters, "wetlevel");
  static constexpr int32_t kWidth = KParameterRow(kParameters, "width");
  static constexpr int32_t kSpaceCount = static_cast<int32_t>(std::size(kImpulseNames));

  KConvolutionReverbPlugin();
  ~KConvolutionReverbPlugin() override;
  static KAudioPlugin* Create(KModule* context, const KPluginRecord* record);

  // Convolves with the file at `path` (one channel for both sides, or the first two) instead of
  // the built-in space; an empty path goes back to the built-in spaces. Reads the file: never on
  // the audio thread. KException when the file cannot be used; the space playing stays then.
  void SetImpulseResponseFile(const KString& path);
  KString ImpulseResponseFile() const;

  // What plays, for the editor's picture: the envelope of the file's response or else of the
  // chosen built-in space (kEnvelopeSlices slices, see KImpulseEnvelope), and its length.
  struct Envelope {
    double seconds = 0.0;
    std::vector<double> decibels;
  };
  static constexpr int32_t kEnvelopeSlices = 240;
  std::shared_ptr<const Envelope> PlayingEnvelope() const;

  // The built-in space `index` at `sampleRate`: two decorrelated channels.
  static KImpulseResponse SyntheticSpace(int32_t index, double sampleRate);

  bool SetSampleRate(double sampleRate) override;
  // The file's path as the attribute "ImpulseResponse" of the plug-in's section.
  void StorePluginSettings(Element& section, uint32_t flags) override;
  uint32_t TailSamples() const noexcept override;

protected:
  void ProcessUpdate() override;
  void Process(const float* const* inputs, float* const* outputs, int32_t sampleCount) override;
  void ResetState() override;

private:
  // One space ready to play: a convolver per output side.
  struct Space {
    KConvolver sides[2];
    int32_t Settle() const noexcept;
  };
  static std::unique_ptr<Space> Prepare(const KImpulseResponse& response);
  static std::shared_ptr<const Envelope> EnvelopeOf(const KImpulseResponse& response);
  static Space* NoFile() noexcept;
  void BuildSyntheticSpaces();
  // Offers the file's space (null: the built-in spaces) with its picture.
  void Publish(std::unique_ptr<Space> file, std::shared_ptr<const Envelope> envelope = nullptr);
  void CollectRetired() noexcept;
  void TakePublished() noexcept;

  std::vector<std::unique_ptr<Space>> synthetic_;  // built on set-up, read by the audio thread
  // The file's space: handed to the audio thread through `offered_`, given back through
  // `retired_`; an offer of kNoFile means "back to the built-in spaces".
  std::atomic<Space*> offered_{nullptr};
  std::atomic<Space*> retired_{nullptr};
  std::atomic<int32_t> fileSettle_{-1};  // the file's settle, −1 without a file
  Space* file_ = nullptr;                // audio thread
  Space* playing_ = nullptr;             // audio thread
  std::vector<float> wet_;               // two sides of one chunk
  double dry_ = 1.0, wetSame_ = 0.0, wetOther_ = 0.0;  // wet: own side and the other side

  // The path and the pictures, shared by the editor, state loads and set-up.
  mutable std::mutex pathMutex_;
  KString path_;
  std::shared_ptr<const Envelope> fileEnvelope_;                 // null without a file
  std::vector<std::shared_ptr<const Envelope>> spaceEnvelopes_;  // one per built-in space
};

extern const KPluginDescription kConvolutionReverbDescription;
const KPluginHelp& KConvolutionReverbHelp();
KEditorDescription KConvolutionReverbEditor();
