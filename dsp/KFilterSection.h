#pragma once

#include <cstddef>
#include <cstdint>

// One first- or second-order filter section: the request it was designed from and its five
// coefficients, normalised by a0. The section's output is
//   y[n] = b0·x[n] + b1·x[n−1] + b2·x[n−2] + (−a1)·y[n−1] + (−a2)·y[n−2].
// Owners keep their own running state; the record holds only the design.
struct KFilterSection {
  enum Type : int32_t {
    kPeak = 0,
    kMatchedPeak = 1,  // a peak that follows the analog bell up to the Nyquist frequency
    kLowShelf = 2,
    kHighShelf = 3,
    kLowPass = 4,
    kHighPass = 5,
    kOnePoleLowPass = 6,
    kOnePoleHighPass = 7,
    kBandPass = 8,  // 0 dB at the centre
    kNotch = 9,
    kAllPass = 10,
    kFirstOrderAllPass = 11,
    kFixedZeroLowPass = 12,   // one pole and a zero at z = −0.13015964383300485, unity at DC
    kFixedZeroHighPass = 13,  // exactly one minus kFixedZeroLowPass
    kBilinearLowPass = 14,
    kBilinearHighPass = 15,
    kTypeCount = 16
  };

  double gain = 0.0;  // dB
  double frequency = 0.0;
  double sampleRate = 0.0;
  double quality = 0.0;
  // Interleaved so that a feed-forward and a feedback product can share one two-lane operation.
  double b0 = 1.0;
  double minusA1 = 0.0;
  double b1 = 0.0;
  double minusA2 = 0.0;
  double b2 = 0.0;
  uint8_t changed = 0;  // set by every design; owners clear it once they took the coefficients
  int32_t type = kPeak;
  double cosW = 1.0;   // of the last second-order design
  double alpha = 0.0;  // sin w / (2Q) of the last second-order design
  double w = 0.0;      // 2π·frequency / sample rate

  // Fills the coefficients for a type code. First-order types leave gain, cos w and alpha as
  // they were. Throws KException "Invalid filter type." for an unknown code, after every field
  // but the five coefficients has been overwritten. Frequencies above 0.499·sample rate are
  // the caller's to refuse.
  void Design(int32_t code, double gainDb, double frequencyHz, double sampleRateHz, double q);
  // The magnitude of the response at `hz` in dB (at the rate it was designed for), at least
  // −180 dB: for the editors' graphs.
  double Decibels(double hz) const noexcept;
};

static_assert(offsetof(KFilterSection, minusA1) == offsetof(KFilterSection, b0) + sizeof(double) &&
                  offsetof(KFilterSection, minusA2) == offsetof(KFilterSection, b1) + sizeof(double),
              "feed-forward and feedback coefficients of one delay sit side by side");
