#pragma once

#include <functional>

#include "ui/controls/KControl.h"

// A vertical level meter of one or two channels in dBFS, read on every tick from `source` (a
// lock-free read of what the audio thread published). The bar falls smoothly; the peak mark
// holds for kHoldTicks and then falls too. A gain-reduction meter grows downwards from the top.
class KLevelMeterControl final : public KControl {
public:
  // Levels in dB (0 dBFS full scale; gain reduction as a negative number).
  using Source = std::function<void(double& left, double& right)>;
  enum Kind { kLevel, kGainReduction };
  static constexpr double kFloorDb = -60;
  static constexpr double kReductionRangeDb = 24;
  static constexpr int32_t kHoldTicks = 45;
  static constexpr double kFallPerTick = 1.5;  // dB

  KLevelMeterControl(const KRect& bounds, KString caption, Kind kind, int32_t channels, Source source);
  double Shown(int32_t channel) const noexcept { return shown_[channel]; }
  double Peak(int32_t channel) const noexcept { return peak_[channel]; }

  void Paint(KDrawer& drawer, const KStyle& style) override;
  void OnTimer() override;
  // A click clears the peak marks.
  bool OnMouseDown(const KMouseEvent& event) override;

private:
  // The y of a level on the bar's scale.
  int32_t LevelY(const KRect& bar, double db) const noexcept;
  KRect Bar(int32_t channel) const noexcept;

  KString caption_;
  Kind kind_;
  int32_t channels_;
  Source source_;
  double shown_[2];
  double peak_[2];
  int32_t hold_[2] = {0, 0};
  // What was last painted, in pixels of the scale, so a tick that changes nothing paints nothing.
  int32_t paintedLevel_[2] = {-1, -1};
  int32_t paintedPeak_[2] = {-1, -1};
};
