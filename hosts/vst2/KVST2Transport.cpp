#include "hosts/vst2/KVST2Transport.h"

#include "hosts/common/KHostTime.h"

namespace KVST2 {
namespace {
struct FlagMap {
  int32_t vst;
  uint32_t host;
};
// Each flag of the time information and the validity it gives.
constexpr FlagMap kFlags[] = {
    {kVstTempoValid, KHostTime::kTempoValid},        {kVstPpqPosValid, KHostTime::kSongPositionValid},
    {kVstBarsValid, KHostTime::kBarStartValid},      {kVstTimeSigValid, KHostTime::kSignatureValid},
    {kVstCyclePosValid, KHostTime::kCycleValid},     {kVstTransportPlaying, KHostTime::kPlaying},
};
}  // namespace

void KReadTransport(const VstTimeInfo* info, bool offline, KTransport& transport) noexcept {
  if (!info) return KAcceptTransport(nullptr, offline, transport);
  KHostTime time;
  for (const FlagMap& flag : kFlags)
    if (info->flags & flag.vst) time.valid |= flag.host;
  time.samplePosition = info->samplePos;
  time.tempo = info->tempo;
  time.songPosition = info->ppqPos;
  time.barStart = info->barStartPos;
  time.numerator = info->timeSigNumerator;
  time.denominator = info->timeSigDenominator;
  time.cycleStart = info->cycleStartPos;
  time.cycleEnd = info->cycleEndPos;
  KAcceptTransport(&time, offline, transport);
}

}  // namespace KVST2
