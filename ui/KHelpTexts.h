#pragma once

#include <span>

#include "kernel/KExport.h"
#include "kernel/KString.h"

// The help window's fixed texts and the mark-up it composes, and the definitions of the semantic
// tags (name, value, control, ...) that every help text may use.
struct TORVANE_API KHelpTexts {
  static constexpr const char* kSectionHeader = "<center invert=1 singleline=1><l2>";
  static constexpr const char* kActionItem = "<li>{0}</li>";
  static constexpr const char* kNoHelp = "Sorry, no help is defined for this control.";
  static constexpr const char* kControlMeaning = "Control meaning";
  static constexpr const char* kMouseAndKeys = "Mouse and keys";
  static constexpr const char* kF1Hint =
      "Move mouse cursor on a control and press F1 to get detailed info about it. If the F1 key is captured by another "
      "application, try using Ctrl+F1 or Ctrl+H.";

  // What the mouse and keys do on a knob or slider, on a switch or list, and on a button.
  static std::span<const char* const> KnobActions() noexcept;
  static std::span<const char* const> SwitchActions() noexcept;
  static std::span<const char* const> ButtonActions() noexcept;

  // The tag sets of the semantic tags, in the colours of the HTML export; render them first.
  static const KString& SemanticTagSets();

  // A section header: an inverted, centred, single-line title in large text; what follows is
  // left-aligned again, a blank line below the title.
  static KString Section(const KString& title);
  // One list item per action.
  static KString ActionItems(std::span<const char* const> actions);
  // The F1 window of a control: its meaning (or the apology for a control without help), what
  // the mouse and keys do, and the general hint.
  static KString ControlHelp(const KString& helpText, std::span<const char* const> actions);
  // Text with "&", "<" and ">" written as entities, so that it reads as itself in mark-up.
  static KString Escape(const KString& text);
};
