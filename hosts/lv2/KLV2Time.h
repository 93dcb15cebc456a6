#pragma once

#include <lv2/atom/atom.h>
#include <lv2/urid/urid.h>

#include <cstdint>

#include "hosts/common/KHostTime.h"

namespace KLV2 {

// The host's transport as LV2 reports it: a time:Position object in the atom input whenever it
// changes (a host need not send one every block), carried forward between them at the reported
// speed. Frame, speed, tempo, signature and bar with beat are taken as far as the object has
// them; what it lacks keeps its last value. The host's beats per minute count beats of the
// signature's unit; positions are turned into quarter notes. Nothing here allocates.
class KTimeReader {
public:
  // Null `map`: nothing is ever read and the transport stays unknown.
  explicit KTimeReader(const LV2_URID_Map* map) noexcept;

  // Takes `atom` when it is a time:Position object; answers whether it was one.
  bool Read(const LV2_Atom& atom) noexcept;
  // What the host reported, ready for KAcceptTransport; null before the first position.
  const KHostTime* Current() const noexcept { return known_ ? &time_ : nullptr; }
  // Moves the position on past a block of `samples` at `rate`.
  void Advance(int32_t samples, double rate) noexcept;

private:
  void Update() noexcept;

  struct URIDs {
    LV2_URID object = 0, blank = 0, position = 0;
    LV2_URID frame = 0, speed = 0, bpm = 0, bar = 0, barBeat = 0, beatsPerBar = 0, beatUnit = 0;
    LV2_URID intType = 0, longType = 0, floatType = 0, doubleType = 0;
  } urids_;
  bool known_ = false;
  double frame_ = 0, speed_ = 0, bpm_ = 0, bar_ = 0, barBeat_ = 0, beatsPerBar_ = 0, beatUnit_ = 0;
  KHostTime time_;
};

}  // namespace KLV2
