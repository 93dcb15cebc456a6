#include "ui/KTexturedMesh.h"

#include <algorithm>
#include <cmath>

namespace {
double Snap(double v) { return std::round(v * 256) / 256; }

void Quad(KTexturedMesh& mesh, const KTexturedVertex (&q)[4]) {
  for (int i : {0, 1, 2, 0, 2, 3}) mesh.vertices.push_back({Snap(q[i].x), Snap(q[i].y), q[i].u, q[i].v});
}
}  // namespace

KTexturedMesh KTexturedMesh::Rotated(KPointF centre, double angle, const KRect& source, double scale) {
  const double w = double(source.Width()) * scale / 2, h = double(source.Height()) * scale / 2;
  const double c = std::cos(angle), s = std::sin(angle);
  const auto at = [&](double dx, double dy, double u, double v) {
    return KTexturedVertex{centre.x + dx * c - dy * s, centre.y + dx * s + dy * c, u, v};
  };
  const double l = source.left, t = source.top, r = source.right + 1.0, b = source.bottom + 1.0;
  KTexturedMesh mesh;
  Quad(mesh, {at(-w, -h, l, t), at(w, -h, r, t), at(w, h, r, b), at(-w, h, l, b)});
  return mesh;
}

KTexturedMesh KTexturedMesh::Arc(KPointF centre, double inner, double outer, double start, double end, const KRect& source) {
  KTexturedMesh mesh;
  // Pieces short enough that the chord stays within a quarter pixel of the outer arc.
  const double step = outer > 0.25 ? 2 * std::acos(1 - 0.25 / outer) : 1;
  const int pieces = std::clamp(int(std::ceil(std::abs(end - start) / step)), 1, 1024);
  const double l = source.left, t = source.top, r = source.right + 1.0, b = source.bottom + 1.0;
  const auto at = [&](double angle, double radius, double u, double v) {
    return KTexturedVertex{centre.x + radius * std::sin(angle), centre.y - radius * std::cos(angle), u, v};
  };
  for (int i = 0; i < pieces; ++i) {
    const double a0 = start + (end - start) * i / pieces, a1 = start + (end - start) * (i + 1) / pieces;
    const double u0 = l + (r - l) * i / pieces, u1 = l + (r - l) * (i + 1) / pieces;
    Quad(mesh, {at(a0, outer, u0, t), at(a1, outer, u1, t), at(a1, inner, u1, b), at(a0, inner, u0, b)});
  }
  return mesh;
}

bool KTexturedMesh::IsFinite() const noexcept {
  return std::all_of(vertices.begin(), vertices.end(), [](const KTexturedVertex& v) {
    return std::abs(v.x) < 1e9 && std::abs(v.y) < 1e9 && std::isfinite(v.u) && std::isfinite(v.v);
  });
}
