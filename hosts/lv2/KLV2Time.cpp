#include "hosts/lv2/KLV2Time.h"

#include <lv2/atom/util.h>
#include <lv2/time/time.h>

#include <cmath>

namespace KLV2 {

KTimeReader::KTimeReader(const LV2_URID_Map* map) noexcept {
  if (!map) return;
  const auto id = [map](const char* uri) { return map->map(map->handle, uri); };
  urids_ = {id(LV2_ATOM__Object), id(LV2_ATOM__Blank), id(LV2_TIME__Position), id(LV2_TIME__frame), id(LV2_TIME__speed),
            id(LV2_TIME__beatsPerMinute), id(LV2_TIME__bar), id(LV2_TIME__barBeat), id(LV2_TIME__beatsPerBar), id(LV2_TIME__beatUnit),
            id(LV2_ATOM__Int), id(LV2_ATOM__Long), id(LV2_ATOM__Float), id(LV2_ATOM__Double)};
}

bool KTimeReader::Read(const LV2_Atom& atom) noexcept {
  if (urids_.position == 0 || (atom.type != urids_.object && atom.type != urids_.blank)) return false;
  const auto& object = reinterpret_cast<const LV2_Atom_Object&>(atom);
  if (object.body.otype != urids_.position) return false;
  // Numbers come as whichever of the four numeric atoms the host chose.
  const auto number = [this](const LV2_Atom* value, double& into) {
    if (!value) return;
    const void* body = value + 1;
    if (value->type == urids_.intType) into = *static_cast<const int32_t*>(body);
    else if (value->type == urids_.longType) into = static_cast<double>(*static_cast<const int64_t*>(body));
    else if (value->type == urids_.floatType) into = *static_cast<const float*>(body);
    else if (value->type == urids_.doubleType) into = *static_cast<const double*>(body);
  };
  const LV2_Atom *frame = nullptr, *speed = nullptr, *bpm = nullptr, *bar = nullptr, *barBeat = nullptr, *beatsPerBar = nullptr,
                 *beatUnit = nullptr;
  lv2_atom_object_get(&object, urids_.frame, &frame, urids_.speed, &speed, urids_.bpm, &bpm, urids_.bar, &bar, urids_.barBeat, &barBeat,
                      urids_.beatsPerBar, &beatsPerBar, urids_.beatUnit, &beatUnit, 0);
  number(frame, frame_);
  number(speed, speed_);
  number(bpm, bpm_);
  number(bar, bar_);
  number(barBeat, barBeat_);
  number(beatsPerBar, beatsPerBar_);
  number(beatUnit, beatUnit_);
  known_ = true;
  Update();
  return true;
}

void KTimeReader::Advance(int32_t samples, double rate) noexcept {
  if (!known_ || speed_ == 0.0 || !(rate > 0.0)) return;
  frame_ += samples * speed_;
  if (bpm_ <= 0.0) return Update();
  barBeat_ += samples * speed_ * bpm_ / 60.0 / rate;
  if (beatsPerBar_ > 0.0) {
    const double bars = std::floor(barBeat_ / beatsPerBar_);
    bar_ += bars;
    barBeat_ -= bars * beatsPerBar_;
  }
  Update();
}

void KTimeReader::Update() noexcept {
  time_ = KHostTime{};
  time_.samplePosition = frame_;
  if (speed_ != 0.0) time_.valid |= KHostTime::kPlaying;
  if (bpm_ > 0.0) {
    time_.tempo = bpm_;
    time_.valid |= KHostTime::kTempoValid;
  }
  if (beatsPerBar_ > 0.0 && beatUnit_ > 0.0) {
    time_.numerator = static_cast<int32_t>(std::lround(beatsPerBar_));
    time_.denominator = static_cast<int32_t>(std::lround(beatUnit_));
    const double quartersPerBeat = 4.0 / beatUnit_;
    time_.barStart = bar_ * beatsPerBar_ * quartersPerBeat;
    time_.songPosition = time_.barStart + barBeat_ * quartersPerBeat;
    time_.valid |= KHostTime::kSignatureValid | KHostTime::kBarStartValid | KHostTime::kSongPositionValid;
  }
}

}  // namespace KLV2
