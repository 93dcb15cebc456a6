#pragma once

#include <cstdint>

// Stereo routing of a plug-in's channel pairs, chosen by the user and applied by the processing
// cycle around the plug-in's own processing, to every pair alike. Mid/side conversion is
// M = (L + R) / 2, S = (L - R) / 2 and back L = M + S, R = M - S, so that converting and
// converting back is exact (up to float rounding): a plug-in that does nothing passes audio
// through unchanged in every mode except the three that only route the input, kRight (the pair
// comes out exchanged), kLeftZeroRight and kRightZeroLeft (the second channel comes out silent).
struct KChannelMode {
  enum : int32_t {
    kLeftRight,         // as it comes
    kLeft,              // no routing here; the plug-in reads the mode itself
    kRight,             // the pair swapped
    kMono,              // mid in the first channel, side in the second
    kStereo,            // side in the first channel, mid in the second
    kMonoStereo,        // mid and side
    kLeftRightNegated,  // right channel polarity-inverted while processed
    kLeftZeroRight,     // left, with silence in the second channel
    kRightZeroLeft,     // right, with silence in the second channel
    kMonoZeroStereo,    // mid and side, like kMono
    kStereoZeroMono,    // side and mid, like kStereo
    kSurround,
    kAmbisonics,
    kCount
  };

  // The texts under which state documents store the mode.
  static constexpr const char* kNames[kCount] = {"Left + Right",
                                                 "Left",
                                                 "Right",
                                                 "Mono",
                                                 "Stereo",
                                                 "Mono + Stereo",
                                                 "Left + Right (neg)",
                                                 "Left & zero Right",
                                                 "Right & zero Left",
                                                 "Mono & zero Stereo",
                                                 "Stereo & zero Mono",
                                                 "Surround",
                                                 "Ambisonics"};

  // Modes that rewrite samples (and so work on a copy, never on the host's buffers).
  static bool TransformsInput(int32_t mode) noexcept { return mode >= kMono && mode <= kStereoZeroMono; }
  // Modes whose two output channels are exchanged, so that results land where they belong.
  static bool SwapsOutputs(int32_t mode) noexcept { return mode == kStereo || mode == kStereoZeroMono; }

  // Routes the input pair: may exchange the pointers, or write transformed copies into
  // `scratch0` / `scratch1` (n samples each) and point there.
  static void RouteInputs(int32_t mode, const float*& first, const float*& second, float* scratch0, float* scratch1,
                          int32_t n) noexcept;
  // After processing, turns the output pair (as the host sees it) back into left and right.
  static void RestoreOutputs(int32_t mode, float* left, float* right, int32_t n) noexcept;
};
