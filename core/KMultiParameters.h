#pragma once

#include <cstdint>
#include <vector>

#include "core/KAudioPluginBase.h"
#include "core/Element.h"
#include "kernel/KString.h"

// Multiparameters: one control that moves several parameters, each along its own curve between
// two values. Read from the state document's "MultiParameters" section:
//   <MultiParameters>
//     <MultiParameter Name="Brightness" Value="0.25">
//       <Target Parameter="tone" From="0.2" To="0.9" Curve="2"/>
//     </MultiParameter>
//   </MultiParameters>
// Value is the control's position (0..1); a target's normalised value at position v is
// From + (To - From) · v^Curve (From 0, To 1 and Curve 1 when absent). Targets naming no
// parameter of the plug-in are ignored; the section itself is kept as found.
class TORVANE_API KMultiParameters {
public:
  struct Target {
    int32_t parameter;
    double from, to, curve;
  };
  struct Control {
    KString name;
    double value;
    int32_t child;  // its element's place among the section's children
    std::vector<Target> targets;
  };
  // Corners of the path a target takes while its control glides.
  static constexpr int32_t kGlidePoints = 16;

  void Read(const Element& section, KAudioPluginBase& plugin);
  int32_t Count() const noexcept { return static_cast<int32_t>(controls_.size()); }
  const Control& Get(int32_t index) const noexcept { return controls_[index]; }

  // Moves control `index` to `value` (clamped to 0..1) over `glideSamples`: every target is
  // posted a ramp along its curve, which lands sample-accurately from the next block; the
  // section's Value follows, so that the state keeps the position.
  void Move(int32_t index, double value, int32_t glideSamples, KAudioPluginBase& plugin, Element& section);

  static double TargetValue(const Target& target, double position) noexcept;

private:
  std::vector<Control> controls_;
};
