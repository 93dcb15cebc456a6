#pragma once

#include <cstdint>
#include <span>
#include <string_view>

#include "kernel/KExport.h"

// The help of one parameter, in help-text mark-up. A "#" in the key stands for a number, so that
// one entry serves every band of the same kind ("band#freq" answers "band3freq"). The formatter
// fills the text's placeholders before it is rendered: {0} the lowest, {1} the highest and {2} the
// default value as the parameter displays them, {3} the number the "#" matched.
struct KParameterHelp {
  const char* key;
  const char* text;
};

// The help of an editor control that is no parameter (a button), by its help key.
struct KButtonHelp {
  const char* key;
  const char* title;
  const char* text;
};

// A plug-in's help: what it is for, then every parameter, then its editor's own buttons.
// Texts are UTF-8.
struct KPluginHelp {
  const char* plugin;  // registry key
  const char* title;
  const char* overview;
  std::span<const KParameterHelp> parameters;
  std::span<const KButtonHelp> buttons = {};

  // The entry for a parameter key, or null; `number` receives what a "#" matched (else 0).
  TORVANE_API const KParameterHelp* Find(std::string_view key, int32_t& number) const noexcept;
};

// The help of a catalogue plug-in by its registry key (its description names it), or null.
TORVANE_API const KPluginHelp* KFindPluginHelp(std::string_view plugin) noexcept;
