#include "plugins/KLFOAmountPlugin.h"

#include <algorithm>

#include "core/KParameter.h"

void KLFOAmountPlugin::UpdateEffect(bool jump) noexcept {
  const double amount = GetParameter(amountRow_).Working() / 100.0;
  amount_.Aim(&amount, static_cast<int32_t>(0.02 * SampleRate()), jump);
}

void KLFOAmountPlugin::ProcessEffect(const float* const* inputs, float* const* outputs, int32_t channels, int32_t n) noexcept {
  for (int32_t done = 0; done < n; done += kPiece) {
    const int32_t m = std::min(kPiece, n - done);
    amount_.Fill(0, amountLane_, m);
    amount_.Passed(m);
    ProcessPiece(inputs, outputs, channels, done, m, amountLane_);
  }
}
