#include "ui/controls/KLevelMeterControl.h"

#include <algorithm>
#include <cmath>

#include "ui/controls/KControlPaint.h"
#include "ui/controls/KStyle.h"

namespace {
constexpr int32_t kCaptionHeight = 16;
}

KLevelMeterControl::KLevelMeterControl(const KRect& bounds, KString caption, Kind kind, int32_t channels, Source source)
    : KControl(bounds), caption_(std::move(caption)), kind_(kind), channels_(std::clamp(channels, 1, 2)), source_(std::move(source)) {
  const double rest = kind_ == kLevel ? kFloorDb : 0;
  shown_[0] = shown_[1] = peak_[0] = peak_[1] = rest;
}

KRect KLevelMeterControl::Bar(int32_t channel) const noexcept {
  const KRect& r = Bounds();
  const int32_t gap = 3;
  const int32_t width = (static_cast<int32_t>(r.Width()) - gap * (channels_ - 1)) / channels_;
  const int32_t left = r.left + channel * (width + gap);
  return {left, r.top + kCaptionHeight + 2, left + width - 1, r.bottom};
}

int32_t KLevelMeterControl::LevelY(const KRect& bar, double db) const noexcept {
  const double t = kind_ == kLevel ? (db - kFloorDb) / -kFloorDb : -db / kReductionRangeDb;
  const double clamped = std::clamp(t, 0.0, 1.0);
  return kind_ == kLevel ? bar.bottom - static_cast<int32_t>(std::lround(clamped * (bar.Height() - 1)))
                         : bar.top + static_cast<int32_t>(std::lround(clamped * (bar.Height() - 1)));
}

void KLevelMeterControl::OnTimer() {
  double level[2] = {shown_[0], shown_[1]};
  if (source_) source_(level[0], level[1]);
  bool changed = false;
  for (int32_t c = 0; c < channels_; ++c) {
    const double floor = kind_ == kLevel ? kFloorDb : -kReductionRangeDb;
    const double now = std::isfinite(level[c]) ? std::max(level[c], floor) : floor;
    // Rises at once, falls at a steady rate; gain reduction the other way round.
    if (kind_ == kLevel) shown_[c] = std::max(now, shown_[c] - kFallPerTick);
    else shown_[c] = std::min(now, shown_[c] + kFallPerTick);
    const bool beyond = kind_ == kLevel ? shown_[c] >= peak_[c] : shown_[c] <= peak_[c];
    if (beyond) {
      peak_[c] = shown_[c];
      hold_[c] = kHoldTicks;
    } else if (hold_[c] > 0) {
      --hold_[c];
    } else {
      peak_[c] = kind_ == kLevel ? std::max(shown_[c], peak_[c] - kFallPerTick) : std::min(shown_[c], peak_[c] + kFallPerTick);
    }
    const KRect bar = Bar(c);
    changed |= LevelY(bar, shown_[c]) != paintedLevel_[c] || LevelY(bar, peak_[c]) != paintedPeak_[c];
  }
  if (changed) Invalidate();
}

bool KLevelMeterControl::OnMouseDown(const KMouseEvent&) {
  for (int32_t c = 0; c < channels_; ++c) {
    peak_[c] = shown_[c];
    hold_[c] = 0;
  }
  Invalidate();
  return true;
}

void KLevelMeterControl::Paint(KDrawer& drawer, const KStyle& style) {
  drawer.AlignedTextOut(KControlPaint::Top(Bounds(), kCaptionHeight), caption_, style.LabelFont(), style.Get(KStyle::kTextDim),
                        kAlignCentre | kAlignMiddle, 255, kDrawBlend);
  for (int32_t c = 0; c < channels_; ++c) {
    const KRect bar = Bar(c);
    drawer.FillRectangle(bar, style.Get(KStyle::kGraphBack), 255, kDrawCopy);
    // Scale marks every 6 dB near the top, wider apart below.
    for (double mark : {-3.0, -6.0, -12.0, -18.0, -24.0, -36.0, -48.0}) {
      const int32_t my = LevelY(bar, kind_ == kLevel ? mark : mark / 2);
      drawer.FillRectangle({bar.left, my, bar.right, my}, style.Get(KStyle::kGraphGrid), 255, kDrawCopy);
    }
    const int32_t y = LevelY(bar, shown_[c]);
    if (kind_ == kLevel) {
      // Three zones, each painted up to the level.
      const int32_t yMid = LevelY(bar, -12), yHigh = LevelY(bar, -3);
      const auto zone = [&](int32_t from, int32_t to, KColor color) {
        const int32_t top = std::max(y, to);
        if (top <= from) drawer.FillRectangle({bar.left, top, bar.right, from}, color, 255, kDrawCopy);
      };
      zone(bar.bottom, yMid + 1, style.Get(KStyle::kMeterLow));
      zone(yMid, yHigh + 1, style.Get(KStyle::kMeterMid));
      zone(yHigh, bar.top, style.Get(KStyle::kMeterHigh));
    } else if (y > bar.top) {
      drawer.FillRectangle({bar.left, bar.top, bar.right, y}, style.Get(KStyle::kMeterReduction), 255, kDrawCopy);
    }
    const int32_t peakY = LevelY(bar, peak_[c]);
    const bool resting = kind_ == kLevel ? peakY >= bar.bottom : peakY <= bar.top;
    if (!resting) drawer.FillRectangle({bar.left, peakY, bar.right, peakY + 1}, style.Get(KStyle::kValueText), 255, kDrawCopy);
    paintedLevel_[c] = y;
    paintedPeak_[c] = peakY;
  }
}
