#pragma once

#include <cstdint>
#include <functional>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"

class KEditorHost;

// A control's hold on one plug-in parameter: every change the user makes goes to the parameter,
// into the plug-in's undo history and, inside a begin / end pair, to the host. The link also
// tells the control when the value moved by other means (host automation, undo, a preset).
class KParameterLink {
public:
  KParameterLink(KAudioPlugin& plugin, int32_t index, KEditorHost* host) noexcept
      : plugin_(plugin), index_(index), host_(host), shown_(Parameter().Normalized()) {}

  KAudioPlugin& Plugin() const noexcept { return plugin_; }
  int32_t Index() const noexcept { return index_; }
  KAudioPluginBase::Parameter& Parameter() const noexcept { return plugin_.GetParameter(index_); }
  double Value() const noexcept { return Parameter().Normalized(); }
  // Snaps a normalised value to the parameter's steps (unchanged for a continuous parameter).
  double Snap(double normalized) const noexcept;

  // A gesture: Begin, any number of Set, End. Nested begins are counted, so a control may wrap
  // a one-off change (a click, a wheel step) in its own pair during a drag.
  void Begin();
  void Set(double normalized);
  void End();
  bool InGesture() const noexcept { return depth_ > 0; }
  // A whole gesture for one value.
  void Change(double normalized);

  // Answers whether the parameter's value differs from what the control last showed, and takes
  // the new value as shown.
  bool TakeOutsideChange() noexcept;

private:
  KAudioPlugin& plugin_;
  int32_t index_;
  KEditorHost* host_;
  double shown_;
  int32_t depth_ = 0;
};

// Runs a change of many parameters at once (undo, a preset, a new arrangement of a plug-in) and
// tells the host every parameter it moved, each in a gesture of its own. `host` may be null.
void KChangeParameters(KAudioPlugin& plugin, KEditorHost* host, const std::function<void()>& change);
