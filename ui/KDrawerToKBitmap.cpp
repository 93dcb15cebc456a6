#include "ui/KDrawerToKBitmap.h"

#include <algorithm>
#include <cmath>
#include <cstring>

#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "ui/KOpenGLTexture.h"
#include "ui/KTexturedMesh.h"

namespace {
#define KDRAWER_NAME(name) "KDrawerToKBitmap::" #name,
const KString kNames[] = {KDRAWER_OPERATIONS(KDRAWER_NAME)};
#undef KDRAWER_NAME

// Source over destination, colours not premultiplied; `a` is the source's effective alpha.
inline void Blend(uint32_t& d, uint32_t s, uint32_t a) noexcept {
  if (a == 255) {
    d = (s & 0xFFFFFFu) | 0xFF000000u;
    return;
  }
  if (a == 0) return;
  const uint32_t na = 255 - a;
  // Red and blue in one word, green and alpha in another: each lane gets s·a + d·(255-a).
  const uint32_t rb = (s & 0xFF00FFu) * a + (d & 0xFF00FFu) * na + 0x800080u;
  const uint32_t g = (s & 0xFF00u) * a + (d & 0xFF00u) * na + 0x8000u;
  const uint32_t rbOut = ((rb + ((rb >> 8) & 0xFF00FFu)) >> 8) & 0xFF00FFu;
  const uint32_t gOut = ((g + ((g >> 8) & 0xFF00u)) >> 8) & 0xFF00u;
  const uint32_t alpha = a + KMulByte(d >> 24, na);
  d = rbOut | gOut | alpha << 24;
}

inline void Put(uint32_t& d, uint32_t s, uint32_t a, bool copy) noexcept {
  if (copy)
    d = (s & 0xFFFFFFu) | a << 24;
  else
    Blend(d, s, a);
}

// a·(256-w) + b·w over 256, rounded, for all four bytes at once (two per lane).
uint32_t Lerp(uint32_t a, uint32_t b, uint32_t w) noexcept {
  const uint32_t rb = ((a & 0xFF00FFu) * (256 - w) + (b & 0xFF00FFu) * w + 0x800080u) >> 8 & 0xFF00FFu;
  const uint32_t ag = ((a >> 8 & 0xFF00FFu) * (256 - w) + (b >> 8 & 0xFF00FFu) * w + 0x800080u) & 0xFF00FF00u;
  return rb | ag;
}

int64_t Clamp(int64_t v, int64_t lo, int64_t hi) noexcept { return v < lo ? lo : v > hi ? hi : v; }
}  // namespace

// Where blits read: a rectangle of a bitmap whose outside continues its edge texels (clamp)
// or repeats it (wrap), sampled bilinearly at texel positions (texel i spans [i, i+1]).
struct KDrawerToKBitmap::Source {
  const KBitmap& bitmap;
  KRect area;  // the texels that exist for the sampler (the whole texture in the GL drawer)
  double u0, v0, du, dv;  // texel position of the first destination pixel centre, step per pixel
  bool wrap;

  int64_t X(int64_t x) const noexcept {
    const int64_t w = area.right - area.left + 1;
    return wrap ? area.left + ((x - area.left) % w + w) % w : Clamp(x, area.left, area.right);
  }
  int64_t Y(int64_t y) const noexcept {
    const int64_t h = area.bottom - area.top + 1;
    return wrap ? area.top + ((y - area.top) % h + h) % h : Clamp(y, area.top, area.bottom);
  }
  uint32_t At(double u, double v) const noexcept {
    const double fu = u - 0.5, fv = v - 0.5;
    const double iu = std::floor(fu), iv = std::floor(fv);
    const uint32_t wu = uint32_t((fu - iu) * 256 + 0.5), wv = uint32_t((fv - iv) * 256 + 0.5);
    const int64_t x0 = X(int64_t(iu)), x1 = X(int64_t(iu) + 1), y0 = Y(int64_t(iv)), y1 = Y(int64_t(iv) + 1);
    const uint32_t* r0 = bitmap.Row(int32_t(y0));
    const uint32_t* r1 = bitmap.Row(int32_t(y1));
    return Lerp(Lerp(r0[x0], r0[x1], wu), Lerp(r1[x0], r1[x1], wu), wv);
  }
};

KDrawerToKBitmap::KDrawerToKBitmap(KBitmap& target, double scale) : KCoverageDrawer(kNames, scale), target_(target) {}

void KDrawerToKBitmap::Stretch(const PixelBox& dest, const Source& source, uint8_t opacity, uint32_t mode) {
  const int64_t x0 = std::max<int64_t>(dest.left, 0), x1 = std::min<int64_t>(dest.right, target_.Width());
  const int64_t y0 = std::max<int64_t>(dest.top, 0), y1 = std::min<int64_t>(dest.bottom, target_.Height());
  if (x1 <= x0 || y1 <= y0 || opacity == 0) return;
  const bool copy = mode & kDrawCopy;
  // One texel per pixel at texel centres: a straight copy of rows, no filtering.
  const double startU = source.u0 + double(x0 - dest.left) * source.du, startV = source.v0 + double(y0 - dest.top) * source.dv;
  if (source.du == 1 && source.dv == 1 && startU - std::floor(startU) == 0.5 && startV - std::floor(startV) == 0.5) {
    const int64_t u = int64_t(startU), v = int64_t(startV);
    for (int64_t y = y0; y < y1; ++y) {
      const uint32_t* in = source.bitmap.Row(int32_t(source.Y(v + y - y0)));
      uint32_t* out = target_.Row(int32_t(y));
      if (!source.wrap && u >= source.area.left && u + (x1 - x0) - 1 <= source.area.right) {
        in += u - x0;
        if (copy && opacity == 255) {
          std::memcpy(out + x0, in + x0, size_t(x1 - x0) * 4);
          continue;
        }
        for (int64_t x = x0; x < x1; ++x) Put(out[x], in[x], KMulByte(in[x] >> 24, opacity), copy);
      } else {
        for (int64_t x = x0; x < x1; ++x) {
          const uint32_t s = in[source.X(u + x - x0)];
          Put(out[x], s, KMulByte(s >> 24, opacity), copy);
        }
      }
    }
    return;
  }
  for (int64_t y = y0; y < y1; ++y) {
    uint32_t* out = target_.Row(int32_t(y));
    const double v = startV + double(y - y0) * source.dv;
    for (int64_t x = x0; x < x1; ++x) {
      const uint32_t s = source.At(startU + double(x - x0) * source.du, v);
      Put(out[x], s, KMulByte(s >> 24, opacity), copy);
    }
  }
}

namespace {
// The sampling of `source` (texels) stretched over the pixel box: the texel position of the
// first pixel centre and the step per pixel.
void Mapping(int64_t pixels, int32_t first, int64_t texels, double& start, double& step) {
  step = double(texels) / double(pixels);
  start = first + step / 2;
}
}  // namespace

void KDrawerToKBitmap::PaintGLTexture(const KRect& dest, const KOpenGLTexture& texture, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPaintGLTexture), [&] {
    if (texture.Bitmap()) StretchBlt(dest, *texture.Bitmap(), texture.Source(), opacity, mode);
  });
}

void KDrawerToKBitmap::PatBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPatBlt), [&] {
    const PixelBox box = ToPixels(dest);
    if (box.IsEmpty() || !IsInside(source, bitmap)) return;
    const double step = 1 / Scale();
    Stretch(box, {bitmap, source, source.left + step / 2, source.top + step / 2, step, step, true}, opacity, mode);
  });
}

void KDrawerToKBitmap::BitBlt(const KRect& dest, const KBitmap& bitmap, KPoint source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationBitBlt), [&] {
    KRect d = dest, s;
    if (!ClipBitBlt(d, bitmap, source, s)) return;
    const PixelBox box = ToPixels(d);
    if (box.IsEmpty()) return;
    Source from{bitmap, bitmap.Bounds(), 0, 0, 0, 0, false};
    Mapping(box.right - box.left, s.left, s.Width(), from.u0, from.du);
    Mapping(box.bottom - box.top, s.top, s.Height(), from.v0, from.dv);
    Stretch(box, from, opacity, mode);
  });
}

void KDrawerToKBitmap::AlphaMask(const KRect& dest, const KBitmap& mask, KPoint source, KColor color, uint8_t opacity,
                                 uint32_t mode) {
  KGuard(Name(kOperationAlphaMask), [&] {
    KRect d = dest, s;
    if (!ClipBitBlt(d, mask, source, s)) return;
    const PixelBox box = ToPixels(d);
    const int64_t x0 = std::max<int64_t>(box.left, 0), x1 = std::min<int64_t>(box.right, target_.Width());
    const int64_t y0 = std::max<int64_t>(box.top, 0), y1 = std::min<int64_t>(box.bottom, target_.Height());
    if (x1 <= x0 || y1 <= y0) return;
    Source from{mask, mask.Bounds(), 0, 0, 0, 0, false};
    Mapping(box.right - box.left, s.left, s.Width(), from.u0, from.du);
    Mapping(box.bottom - box.top, s.top, s.Height(), from.v0, from.dv);
    const uint32_t alpha = KMulByte(KAlphaOf(color), opacity);
    const bool copy = mode & kDrawCopy;
    for (int64_t y = y0; y < y1; ++y) {
      uint32_t* out = target_.Row(int32_t(y));
      const double v = from.v0 + double(y - box.top) * from.dv;
      for (int64_t x = x0; x < x1; ++x)
        Put(out[x], color, KMulByte(from.At(from.u0 + double(x - box.left) * from.du, v) >> 24, alpha), copy);
    }
  });
}

void KDrawerToKBitmap::StretchBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBlt), [&] {
    const PixelBox box = ToPixels(dest);
    if (box.IsEmpty() || !IsInside(source, bitmap)) return;
    Source from{bitmap, bitmap.Bounds(), 0, 0, 0, 0, false};
    Mapping(box.right - box.left, source.left, source.Width(), from.u0, from.du);
    Mapping(box.bottom - box.top, source.top, source.Height(), from.v0, from.dv);
    Stretch(box, from, opacity, mode);
  });
}

void KDrawerToKBitmap::StretchBltH(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltH), [&] {
    const KRect d{dest.left, dest.top, dest.right, int32_t(std::min<int64_t>(INT32_MAX, dest.top + source.Height() - 1))};
    StretchBlt(d, bitmap, source, opacity, mode);
  });
}

void KDrawerToKBitmap::StretchBltV(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltV), [&] {
    const KRect d{dest.left, dest.top, int32_t(std::min<int64_t>(INT32_MAX, dest.left + source.Width() - 1)), dest.bottom};
    StretchBlt(d, bitmap, source, opacity, mode);
  });
}

void KDrawerToKBitmap::PaintMesh(const KTexturedMesh& mesh, const KBitmap& bitmap, uint8_t opacity, uint32_t mode) {
  if (!mesh.IsFinite()) return;
  const Source from{bitmap, bitmap.Bounds(), 0, 0, 0, 0, false};
  const bool copy = mode & kDrawCopy;
  for (size_t i = 0; i + 2 < mesh.vertices.size(); i += 3) {
    const KTexturedVertex* t = &mesh.vertices[i];
    const double area = (t[1].x - t[0].x) * (t[2].y - t[0].y) - (t[2].x - t[0].x) * (t[1].y - t[0].y);
    if (area == 0) continue;
    // Edge functions of a triangle turned to positive area; pixels whose centre lies on an edge
    // belong to it only for top and left edges, so that neighbours never paint a pixel twice.
    const KTexturedVertex* v[3] = {&t[0], area > 0 ? &t[1] : &t[2], area > 0 ? &t[2] : &t[1]};
    const double a = std::abs(area);
    const double left = std::min({t[0].x, t[1].x, t[2].x}), right = std::max({t[0].x, t[1].x, t[2].x});
    const double top = std::min({t[0].y, t[1].y, t[2].y}), bottom = std::max({t[0].y, t[1].y, t[2].y});
    const int64_t x0 = std::max<int64_t>(0, int64_t(std::floor(left))), x1 = std::min<int64_t>(target_.Width(), int64_t(std::ceil(right)));
    const int64_t y0 = std::max<int64_t>(0, int64_t(std::floor(top))), y1 = std::min<int64_t>(target_.Height(), int64_t(std::ceil(bottom)));
    bool topLeft[3];
    for (int e = 0; e < 3; ++e) {
      const KTexturedVertex &p = *v[e], &q = *v[(e + 1) % 3];
      // In y-down coordinates with positive (clockwise) area, a top edge runs to the right and a
      // left edge runs upwards.
      topLeft[e] = (q.y == p.y && q.x > p.x) || q.y < p.y;
    }
    for (int64_t y = y0; y < y1; ++y) {
      uint32_t* out = target_.Row(int32_t(y));
      const double py = double(y) + 0.5;
      for (int64_t x = x0; x < x1; ++x) {
        const double px = double(x) + 0.5;
        double w[3];
        bool inside = true;
        for (int e = 0; e < 3 && inside; ++e) {
          const KTexturedVertex &p = *v[e], &q = *v[(e + 1) % 3];
          w[e] = (q.x - p.x) * (py - p.y) - (q.y - p.y) * (px - p.x);
          inside = w[e] > 0 || (w[e] == 0 && topLeft[e]);
        }
        if (!inside) continue;
        // w[e] weighs the vertex opposite edge e.
        const double b0 = w[1] / a, b1 = w[2] / a, b2 = w[0] / a;
        const double u = b0 * v[0]->u + b1 * v[1]->u + b2 * v[2]->u, tv = b0 * v[0]->v + b1 * v[1]->v + b2 * v[2]->v;
        const uint32_t s = from.At(u, tv);
        Put(out[x], s, KMulByte(s >> 24, opacity), copy);
      }
    }
  }
}

void KDrawerToKBitmap::RotatedBlt(KPointF centre, double angle, const KBitmap& bitmap, const KRect& source, uint8_t opacity,
                                  uint32_t mode) {
  KGuard(Name(kOperationRotatedBlt), [&] {
    if (!IsInside(source, bitmap)) return;
    PaintMesh(KTexturedMesh::Rotated(ToPixels(centre), angle, source, Scale()), bitmap, opacity, mode);
  });
}

void KDrawerToKBitmap::StretchBltArc(KPointF centre, double innerRadius, double outerRadius, double startAngle,
                                     double endAngle, const KBitmap& bitmap, const KRect& source, uint8_t opacity,
                                     uint32_t mode) {
  KGuard(Name(kOperationStretchBltArc), [&] {
    if (!IsInside(source, bitmap)) return;
    const double s = Scale();
    PaintMesh(KTexturedMesh::Arc(ToPixels(centre), innerRadius * s, outerRadius * s, startAngle, endAngle, source), bitmap,
              opacity, mode);
  });
}

void KDrawerToKBitmap::FillRectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationFillRectangle), [&] {
    const PixelBox box = ToPixels(rect);
    const int64_t x0 = std::max<int64_t>(box.left, 0), x1 = std::min<int64_t>(box.right, target_.Width());
    const int64_t y0 = std::max<int64_t>(box.top, 0), y1 = std::min<int64_t>(box.bottom, target_.Height());
    const uint32_t alpha = KMulByte(KAlphaOf(color), opacity);
    const bool copy = mode & kDrawCopy;
    for (int64_t y = y0; y < y1; ++y) {
      uint32_t* out = target_.Row(int32_t(y));
      for (int64_t x = x0; x < x1; ++x) Put(out[x], color, alpha, copy);
    }
  });
}

void KDrawerToKBitmap::FillRectangleGradient(const KRect& rect, KColor from, KColor to, KGradient direction, uint8_t opacity,
                                             uint32_t mode) {
  KGuard(Name(kOperationFillRectangleGradient), [&] {
    const PixelBox box = ToPixels(rect);
    const int64_t x0 = std::max<int64_t>(box.left, 0), x1 = std::min<int64_t>(box.right, target_.Width());
    const int64_t y0 = std::max<int64_t>(box.top, 0), y1 = std::min<int64_t>(box.bottom, target_.Height());
    if (x1 <= x0 || y1 <= y0) return;
    const bool vertical = direction == KGradient::Vertical;
    const double start = double(vertical ? box.top : box.left), length = double(vertical ? box.bottom - box.top : box.right - box.left);
    const bool copy = mode & kDrawCopy;
    // The colour at a pixel centre, each channel interpolated and rounded.
    const auto at = [&](int64_t p) {
      const double t = (double(p) + 0.5 - start) / length;
      uint32_t c = 0;
      for (int shift = 0; shift < 32; shift += 8) {
        const double a = (from >> shift) & 0xFF, b = (to >> shift) & 0xFF;
        c |= uint32_t(a + (b - a) * t + 0.5) << shift;
      }
      return c;
    };
    for (int64_t y = y0; y < y1; ++y) {
      uint32_t* out = target_.Row(int32_t(y));
      const uint32_t rowColor = at(y);
      for (int64_t x = x0; x < x1; ++x) {
        const uint32_t c = vertical ? rowColor : at(x);
        Put(out[x], c, KMulByte(c >> 24, opacity), copy);
      }
    }
  });
}

void KDrawerToKBitmap::SetPixel(KPoint at, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationSetPixel), [&] { FillRectangle({at.x, at.y, at.x, at.y}, color, opacity, mode); });
}

void KDrawerToKBitmap::PaintCoverage(const KCoverage& mask, KColor color, uint8_t opacity, uint32_t) {
  const uint32_t alpha = KMulByte(KAlphaOf(color), opacity);
  for (int32_t y = 0; y < mask.height; ++y) {
    const uint8_t* in = &mask.values[size_t(y) * mask.width];
    uint32_t* out = target_.Row(mask.y + y) + mask.x;
    for (int32_t x = 0; x < mask.width; ++x)
      if (in[x]) Blend(out[x], color, KMulByte(alpha, in[x]));
  }
}
