#pragma once

#include <cstdint>

#include "core/KValueKind.h"

// One row of a plug-in's parameter table. Tables are static data: a plug-in declares its
// parameters as an array of these and never writes code per parameter.
struct KParameterInfo {
  static constexpr uint32_t kAutomatable = 1;

  const char* key;   // stable name used in presets, state documents and on the command line
  const char* name;  // shown to the user
  const KValueKind* kind;
  double defaultValue;  // working units
  uint32_t flags;
};
