#pragma once

#include "ui/KDrawer.h"

// Shapes the controls share, built from the drawer's primitives.
namespace KControlPaint {
// An arc of `width` round `centre`, from `from` to `to` (radians clockwise from 12 o'clock).
void Arc(KDrawer& drawer, KPointF centre, double radius, double from, double to, double width, KColor color);
// The point at `angle` (as above) and `radius` from `centre`.
KPointF Polar(KPointF centre, double radius, double angle) noexcept;
// A rectangle's top / bottom part of `height`.
KRect Top(const KRect& r, int32_t height) noexcept;
KRect Bottom(const KRect& r, int32_t height) noexcept;
// `text` as it fits a rectangle's width in `font` at the drawer's scale: whole, or cut short
// with an ellipsis so that a long label never reaches its neighbour's.
KString Fitted(const KDrawer& drawer, const KString& text, const KFont& font, const KRect& r);
}  // namespace KControlPaint
