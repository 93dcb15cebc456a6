#include "hosts/aax/KAAXPlaybackInfo.h"

#include "core/KTransport.h"
#include "hosts/common/KHostTime.h"

using namespace KAAX;

void GetPlaybackInfo(const ITransport* transport, bool offline, KTransport& snapshot) {
  if (!transport) return KAcceptTransport(nullptr, offline, snapshot);
  KHostTime time;
  int64_t samples = 0, ticks = 0, barTicks = 0, loopStart = 0, loopEnd = 0;
  bool playing = false, looping = false;
  if (transport->GetCurrentNativeSampleLocation(&samples) == kSuccess) time.samplePosition = static_cast<double>(samples);
  if (transport->GetCurrentTempo(&time.tempo) == kSuccess) time.valid |= KHostTime::kTempoValid;
  if (transport->GetCurrentTickPosition(&ticks) == kSuccess) {
    time.songPosition = static_cast<double>(ticks) / kTicksPerQuarter;
    time.valid |= KHostTime::kSongPositionValid;
  }
  if (transport->GetCurrentMeter(&time.numerator, &time.denominator) == kSuccess) time.valid |= KHostTime::kSignatureValid;
  if (transport->GetBarStartTickPosition(&barTicks) == kSuccess) {
    time.barStart = static_cast<double>(barTicks) / kTicksPerQuarter;
    time.valid |= KHostTime::kBarStartValid;
  }
  if (transport->GetCurrentLoopPosition(&looping, &loopStart, &loopEnd) == kSuccess && looping) {
    time.cycleStart = static_cast<double>(loopStart) / kTicksPerQuarter;
    time.cycleEnd = static_cast<double>(loopEnd) / kTicksPerQuarter;
    time.valid |= KHostTime::kCycleValid;
  }
  if (transport->IsTransportPlaying(&playing) == kSuccess && playing) time.valid |= KHostTime::kPlaying;
  KAcceptTransport(&time, offline, snapshot);
}
