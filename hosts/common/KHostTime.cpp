#include "hosts/common/KHostTime.h"

#include <algorithm>
#include <cmath>

#include "core/KTransport.h"

namespace {
constexpr double kEpsilon = 1e-10;
}  // namespace

void KAcceptTransport(const KHostTime* time, bool offline, KTransport& transport) noexcept {
  transport.Reset();
  if (!time) return;
  const uint32_t valid = time->valid;
  if (!offline || time->samplePosition > kEpsilon) transport.samplePosition = std::llround(time->samplePosition);
  if ((valid & KHostTime::kTempoValid) && time->tempo > 1.0) transport.tempo = time->tempo;
  if ((valid & KHostTime::kSongPositionValid) && (!offline || time->songPosition > kEpsilon)) transport.songPosition = time->songPosition;
  if ((valid & KHostTime::kSignatureValid) && time->numerator != 0) {
    transport.numerator = time->numerator;
    transport.denominator = time->denominator;
  }
  if (valid & KHostTime::kBarStartValid) {
    const double beat = std::max(1, transport.denominator / 4);
    transport.barStart = std::round(beat * time->barStart) / beat;
  }
  if ((valid & KHostTime::kCycleValid) && time->cycleEnd - time->cycleStart > kEpsilon) {
    transport.cycleStart = time->cycleStart;
    transport.cycleEnd = time->cycleEnd;
  }
  if (offline || (valid & KHostTime::kPlaying)) transport.flags |= KTransport::kPlaying;
}
