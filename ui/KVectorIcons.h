#pragma once

#include <span>
#include <string>

#include "kernel/KExport.h"
#include "kernel/KString.h"
#include "ui/KDrawer.h"

// The toolkit's built-in button icons, drawn as vector shapes so that they are sharp at any
// scale. Each is a few strokes and filled shapes on a 16 × 16 grid, scaled to the rectangle.
struct TORVANE_API KVectorIcons {
  // The names of every icon, in alphabetical order.
  static std::span<const char* const> Names() noexcept;
  static bool Has(const KString& name) noexcept;
  // Paints the icon into `rect` (square: the smaller side, centred); false for an unknown name.
  static bool Paint(KDrawer& drawer, const KString& name, const KRect& rect, KColor colour, uint8_t opacity);
  // The same icon as an inline SVG element in the current text colour, or empty for an unknown
  // name.
  static std::string Svg(const KString& name);
};
