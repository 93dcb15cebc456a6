#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

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

// The index of the row with `key` in a parameter table, found while compiling, so that a
// plug-in's parameter indices come from its table and cannot drift from it. A key that is not
// in the table stops the compilation.
consteval int32_t KParameterRow(std::span<const KParameterInfo> table, std::string_view key) {
  for (size_t row = 0; row < table.size(); ++row)
    if (key == table[row].key) return static_cast<int32_t>(row);
  throw "no parameter of this key in the table";
}
