#pragma once

#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include "core/KAudioPlugin.h"
#include "core/KParameter.h"
#include "kernel/KEntryPoints.h"
#include "ui/KBitmap.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KEditorHost.h"

// A host that writes down every call an editor makes of it, in order.
struct KRecordingEditorHost final : KEditorHost {
  struct Call {
    char kind;  // 'b' begin, 'v' value, 'e' end
    int32_t parameter;
    double value;
  };
  std::vector<Call> calls;
  bool acceptResize = true;
  int32_t width = 0, height = 0;

  void BeginEdit(int32_t p) override { calls.push_back({'b', p, 0}); }
  void PerformEdit(int32_t p, double v) override { calls.push_back({'v', p, v}); }
  void EndEdit(int32_t p) override { calls.push_back({'e', p, 0}); }
  bool ResizeView(int32_t w, int32_t h) override {
    if (!acceptResize) return false;
    width = w;
    height = h;
    return true;
  }
  // The kinds of the calls for one parameter as a word, "bvve" say.
  std::string KindsOf(int32_t p) const {
    std::string kinds;
    for (const Call& c : calls)
      if (c.parameter == p) kinds += c.kind;
    return kinds;
  }
};

inline std::unique_ptr<KAudioPlugin> KMakeCataloguePlugin(const char* key) {
  return std::unique_ptr<KAudioPlugin>(CreateTorvanePlugin(KString::Static(key)));
}

// The first control, depth first, of type T for which `match` holds.
template <class T, class F>
T* KFindControl(KControl& from, F&& match) {
  if (auto* typed = dynamic_cast<T*>(&from); typed && match(*typed)) return typed;
  for (int32_t i = 0; i < from.ChildCount(); ++i)
    if (T* found = KFindControl<T>(from.Child(i), match)) return found;
  return nullptr;
}

// Pixels of two editor pictures further apart than the drawers' tolerance (2) in any colour
// channel, within `area` (pixels; the whole picture when empty); -1 for pictures of different
// sizes.
inline int64_t KEditorPictureDifferences(const KBitmap& a, const KBitmap& b, KRect area = {}) {
  if (a.Width() != b.Width() || a.Height() != b.Height()) return -1;
  if (area.IsEmpty()) area = a.Bounds();
  int64_t beyond = 0;
  for (int32_t y = area.top; y <= area.bottom; ++y)
    for (int32_t x = area.left; x <= area.right; ++x)
      for (int shift = 0; shift < 24; shift += 8)
        if (std::abs(int((a.Pixel(x, y) >> shift) & 0xFF) - int((b.Pixel(x, y) >> shift) & 0xFF)) > 2) {
          ++beyond;
          break;
        }
  return beyond;
}

inline KPoint KCentreOf(const KRect& r) { return {(r.left + r.right) / 2, (r.top + r.bottom) / 2}; }
inline KPoint KCentreOf(const KControl& control) { return KCentreOf(control.Bounds()); }
