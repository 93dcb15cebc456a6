#pragma once

#include <vector>

#include "ui/KGeometry.h"

// Triangles of a bitmap painted with a transform (turned, bent along an arc). Positions are in
// target pixels, snapped to 1/256 of a pixel as the GL rasteriser does, and texture positions
// in texels of the bitmap (texel i spans [i, i+1]); both drawers paint the same triangles, so
// they cover the same pixels.
struct KTexturedVertex {
  double x, y, u, v;
};

struct KTexturedMesh {
  std::vector<KTexturedVertex> vertices;  // three per triangle

  // `source` centred on `centre` (pixels), turned clockwise by `angle`, each texel `scale` pixels.
  static KTexturedMesh Rotated(KPointF centre, double angle, const KRect& source, double scale);
  // `source` along an arc around `centre`: x from start to end angle, y from outer to inner radius.
  static KTexturedMesh Arc(KPointF centre, double inner, double outer, double start, double end, const KRect& source);
  bool IsFinite() const noexcept;
};
