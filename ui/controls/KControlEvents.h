#pragma once

#include <cstdint>

#include "ui/KGeometry.h"

// Modifier keys held during an event, or-ed.
inline constexpr uint32_t kModShift = 1u << 0;
inline constexpr uint32_t kModControl = 1u << 1;
inline constexpr uint32_t kModAlt = 1u << 2;

// Keys the controls understand besides printable characters (which arrive as their code point).
enum KKey : int32_t {
  kKeyNone = 0,
  kKeyBackspace = 8,
  kKeyTab = 9,
  kKeyReturn = 13,
  kKeyEscape = 27,
  kKeyDelete = 127,
  kKeyLeft = 0x10000,
  kKeyRight,
  kKeyUp,
  kKeyDown,
  kKeyHome,
  kKeyEnd,
  kKeyF1,
};

// A mouse event in logical editor coordinates (the editor's scale already taken out).
struct KMouseEvent {
  KPoint at;
  uint32_t modifiers = 0;
  double wheel = 0;  // wheel steps, positive away from the user
};

struct KKeyEvent {
  int32_t key = kKeyNone;  // a KKey or a character's code point
  uint32_t modifiers = 0;
};

inline bool KContains(const KRect& r, KPoint p) noexcept { return p.x >= r.left && p.x <= r.right && p.y >= r.top && p.y <= r.bottom; }
inline bool KIntersects(const KRect& a, const KRect& b) noexcept {
  return !a.IsEmpty() && !b.IsEmpty() && a.left <= b.right && b.left <= a.right && a.top <= b.bottom && b.top <= a.bottom;
}
inline KRect KUnion(const KRect& a, const KRect& b) noexcept {
  if (a.IsEmpty()) return b;
  if (b.IsEmpty()) return a;
  return {a.left < b.left ? a.left : b.left, a.top < b.top ? a.top : b.top, a.right > b.right ? a.right : b.right,
          a.bottom > b.bottom ? a.bottom : b.bottom};
}
inline KRect KInset(const KRect& r, int32_t by) noexcept { return {r.left + by, r.top + by, r.right - by, r.bottom - by}; }
