#pragma once

#include <cstdint>

#include "core/KAudioPluginBase.h"
#include "core/KParameterRamp.h"
#include "kernel/KExport.h"

class KAudioPlugin;

// A host's automation points for one parameter and one block, turned into the plug-in's
// sample-accurate ramp. Every host (each adapter, and the command line) goes through this one
// translation, so the same points sound the same whatever carried them.
//
// Points come in the host's order with offsets relative to the block start. A host that knows
// its automation ahead (the command line) may give the corner before the block (an offset
// below 0) and the first one after it, so that the ramp's segments, and with them every value
// on the way, do not depend on where blocks begin. Audio thread: nothing allocates.
class TORVANE_API KHostRamp {
public:
  KHostRamp(KAudioPlugin& plugin, int32_t parameter) noexcept : plugin_(plugin), parameter_(parameter) {}

  // Offsets never run backwards (an earlier one is taken as the previous). When the first
  // point lies after the block start, the ramp starts from the parameter's present value.
  // Beyond the ramp's room of ParameterRamp::kMaxPoints the last point still wins.
  void Add(int32_t offset, double normalized) noexcept;
  // Hands the ramp to the plug-in: in fine sub-blocks on the plug-in's grid, so that it sounds
  // the same whatever block size the host uses. A lone point lands at once.
  void Commit() noexcept;

private:
  KAudioPlugin& plugin_;
  int32_t parameter_;
  KAudioPluginBase::RampPoint points_[ParameterRamp::kMaxPoints];
  int32_t count_ = 0;
};
