#include "ui/KDrawerToKBitmap.h"

#include <algorithm>
#include <cmath>
#include <cstring>
#include <vector>

#if defined(__SSE2__) || defined(_M_X64)
#include <emmintrin.h>
#endif

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

// Lerp of two rows with one weight, four pixels at a time where SSE2 is there.
void LerpRow(const uint32_t* a, const uint32_t* b, uint32_t w, uint32_t* out, int64_t n) noexcept {
  int64_t i = 0;
#if defined(__SSE2__) || defined(_M_X64)
  const __m128i wb = _mm_set1_epi16(int16_t(w)), wa = _mm_set1_epi16(int16_t(256 - w)), half = _mm_set1_epi16(128);
  const __m128i zero = _mm_setzero_si128();
  for (; i + 4 <= n; i += 4) {
    const __m128i va = _mm_loadu_si128(reinterpret_cast<const __m128i*>(a + i));
    const __m128i vb = _mm_loadu_si128(reinterpret_cast<const __m128i*>(b + i));
    const auto mix = [&](__m128i x, __m128i y) {
      return _mm_srli_epi16(_mm_add_epi16(_mm_add_epi16(_mm_mullo_epi16(x, wa), _mm_mullo_epi16(y, wb)), half), 8);
    };
    const __m128i lo = mix(_mm_unpacklo_epi8(va, zero), _mm_unpacklo_epi8(vb, zero));
    const __m128i hi = mix(_mm_unpackhi_epi8(va, zero), _mm_unpackhi_epi8(vb, zero));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), _mm_packus_epi16(lo, hi));
  }
#endif
  for (; i < n; ++i) out[i] = Lerp(a[i], b[i], w);
}

// `color` blended over n pixels, each with the alpha KMulByte(alpha, coverage). The same bytes
// as Blend: with the colour's alpha lane set to 255, the one formula s·a + d·(255-a) over 255
// also yields Blend's alpha a + d·(255-a)/255.
void BlendCoverageRow(uint32_t* out, const uint8_t* coverage, int64_t n, KColor color, uint32_t alpha) noexcept {
  int64_t i = 0;
#if defined(__SSE2__) || defined(_M_X64)
  const __m128i zero = _mm_setzero_si128(), half = _mm_set1_epi16(128), full = _mm_set1_epi16(255);
  const __m128i source = _mm_unpacklo_epi8(_mm_set1_epi32(int32_t(color | 0xFF000000u)), zero);
  const __m128i alphas = _mm_set1_epi16(int16_t(alpha));
  // x / 255 rounded, for x up to 255 · 255 in 16-bit lanes (x + 128 already added).
  const auto divide = [](__m128i t) { return _mm_srli_epi16(_mm_add_epi16(t, _mm_srli_epi16(t, 8)), 8); };
  const auto blend = [&](__m128i d, __m128i a) {
    return divide(_mm_add_epi16(_mm_add_epi16(_mm_mullo_epi16(source, a), _mm_mullo_epi16(d, _mm_sub_epi16(full, a))), half));
  };
  for (; i + 4 <= n; i += 4) {
    int32_t four;
    std::memcpy(&four, coverage + i, 4);
    if (four == 0) continue;
    const __m128i a = divide(_mm_add_epi16(_mm_mullo_epi16(_mm_unpacklo_epi8(_mm_cvtsi32_si128(four), zero), alphas), half));
    const __m128i pairs = _mm_unpacklo_epi16(a, a);
    const __m128i d = _mm_loadu_si128(reinterpret_cast<const __m128i*>(out + i));
    const __m128i low = blend(_mm_unpacklo_epi8(d, zero), _mm_unpacklo_epi32(pairs, pairs));
    const __m128i high = blend(_mm_unpackhi_epi8(d, zero), _mm_unpackhi_epi32(pairs, pairs));
    _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), _mm_packus_epi16(low, high));
  }
#endif
  for (; i < n; ++i)
    if (coverage[i]) Blend(out[i], color, KMulByte(alpha, coverage[i]));
}

// One source row filtered across: out[i] mixes the texels columns[2i] and columns[2i+1] with
// weights[i] of 256 for the second; two pixels at a time where the texels are neighbours.
// `lanes` holds per pixel the eight 16-bit factors of that (four of 256 - w, four of w).
void FilterRow(const uint32_t* row, const int64_t* columns, const uint32_t* weights, const int16_t* lanes, uint32_t* out,
               int64_t n) noexcept {
  int64_t i = 0;
#if defined(__SSE2__) || defined(_M_X64)
  const __m128i zero = _mm_setzero_si128(), half = _mm_set1_epi16(128);
  const auto mix = [&](int64_t k) {
    const __m128i m = _mm_mullo_epi16(_mm_unpacklo_epi8(_mm_loadl_epi64(reinterpret_cast<const __m128i*>(row + columns[2 * k])), zero),
                                      _mm_loadu_si128(reinterpret_cast<const __m128i*>(lanes + 8 * k)));
    return _mm_add_epi16(m, _mm_srli_si128(m, 8));
  };
  for (; i + 2 <= n; i += 2) {
    if (columns[2 * i + 1] != columns[2 * i] + 1 || columns[2 * i + 3] != columns[2 * i + 2] + 1) {
      out[i] = Lerp(row[columns[2 * i]], row[columns[2 * i + 1]], weights[i]);
      out[i + 1] = Lerp(row[columns[2 * i + 2]], row[columns[2 * i + 3]], weights[i + 1]);
      continue;
    }
    const __m128i both = _mm_srli_epi16(_mm_add_epi16(_mm_unpacklo_epi64(mix(i), mix(i + 1)), half), 8);
    _mm_storel_epi64(reinterpret_cast<__m128i*>(out + i), _mm_packus_epi16(both, zero));
  }
#endif
  for (; i < n; ++i) out[i] = Lerp(row[columns[2 * i]], row[columns[2 * i + 1]], weights[i]);
}

// n pixels put over `out`; opaque pixels at full opacity are copied four at a time.
void PutRow(uint32_t* out, const uint32_t* in, int64_t n, uint8_t opacity, bool copy) noexcept {
  if (opacity == 255 && copy) {
    std::memcpy(out, in, size_t(n) * 4);
    return;
  }
  int64_t i = 0;
#if defined(__SSE2__) || defined(_M_X64)
  if (opacity == 255) {
    const __m128i alphas = _mm_set1_epi32(int32_t(0xFF000000u));
    for (; i + 4 <= n; i += 4) {
      const __m128i v = _mm_loadu_si128(reinterpret_cast<const __m128i*>(in + i));
      const int opaque = _mm_movemask_epi8(_mm_cmpeq_epi32(_mm_and_si128(v, alphas), alphas));
      if (opaque == 0xFFFF)
        _mm_storeu_si128(reinterpret_cast<__m128i*>(out + i), v);
      else
        for (int64_t j = i; j < i + 4; ++j) Put(out[j], in[j], in[j] >> 24, false);
    }
  }
#endif
  for (; i < n; ++i) Put(out[i], in[i], KMulByte(in[i] >> 24, opacity), copy);
}
}  // namespace

// Where blits read: a rectangle of a bitmap whose outside continues its edge texels (clamp)
// or repeats it (wrap), sampled bilinearly at texel positions (texel i spans [i, i+1]).
struct KDrawerToKBitmap::Source {
  const KBitmap& bitmap;
  KRect area;  // the texels that exist for the sampler (the whole texture in the GL drawer)
  double u0, v0, du, dv;  // texel position of the first destination pixel centre, step per pixel
  bool wrap;

  int64_t X(int64_t x) const noexcept {
    const int64_t w = area.Width();
    return wrap ? area.left + ((x - area.left) % w + w) % w : Clamp(x, area.left, area.right);
  }
  int64_t Y(int64_t y) const noexcept {
    const int64_t h = area.Height();
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
  const int64_t count = x1 - x0;
  const double startU = source.u0 + double(x0 - dest.left) * source.du, startV = source.v0 + double(y0 - dest.top) * source.dv;
  // Each source position as two texels and the weight of the second, once for all rows.
  const auto split = [](double position, int64_t& first, uint32_t& weight) {
    const double f = position - 0.5, whole = std::floor(f);
    first = int64_t(whole);
    weight = uint32_t((f - whole) * 256 + 0.5);
    if (weight == 256) ++first, weight = 0;
  };
  std::vector<int64_t> columns(static_cast<size_t>(2 * count));
  std::vector<uint32_t> weights(static_cast<size_t>(count));
  std::vector<int16_t> lanes(static_cast<size_t>(8 * count));
  bool unfiltered = true;  // every pixel centre on a texel centre
  for (int64_t i = 0; i < count; ++i) {
    int64_t first;
    split(startU + double(i) * source.du, first, weights[size_t(i)]);
    std::fill_n(&lanes[size_t(8 * i)], 4, int16_t(256 - weights[size_t(i)]));
    std::fill_n(&lanes[size_t(8 * i + 4)], 4, int16_t(weights[size_t(i)]));
    columns[size_t(2 * i)] = source.X(first);
    columns[size_t(2 * i + 1)] = source.X(first + 1);
    unfiltered = unfiltered && weights[size_t(i)] == 0;
  }
  // Filtered rows: each source row is filtered across once into a line buffer, and two such
  // lines are mixed for each target row (a row of a two-times enlargement serves two rows).
  std::vector<uint32_t> upper(static_cast<size_t>(count)), lower(static_cast<size_t>(count)), mixed(static_cast<size_t>(count));
  int64_t upperRow = INT64_MIN, lowerRow = INT64_MIN;
  const auto filterRow = [&](int64_t row, std::vector<uint32_t>& into) {
    FilterRow(source.bitmap.Row(int32_t(source.Y(row))), columns.data(), weights.data(), lanes.data(), into.data(), count);
  };
  for (int64_t y = y0; y < y1; ++y) {
    int64_t first;
    uint32_t wy;
    split(startV + double(y - y0) * source.dv, first, wy);
    uint32_t* out = target_.Row(int32_t(y)) + x0;
    // One texel per pixel in order: the source row itself.
    if (unfiltered && wy == 0 && source.du == 1 && columns[size_t(2 * count - 2)] - columns[0] == count - 1) {
      PutRow(out, source.bitmap.Row(int32_t(source.Y(first))) + columns[0], count, opacity, copy);
      continue;
    }
    if (first == lowerRow) std::swap(upper, lower), std::swap(upperRow, lowerRow);
    if (first != upperRow) filterRow(first, upper), upperRow = first;
    if (wy == 0) {
      PutRow(out, upper.data(), count, opacity, copy);
      continue;
    }
    if (first + 1 != lowerRow) filterRow(first + 1, lower), lowerRow = first + 1;
    LerpRow(upper.data(), lower.data(), wy, mixed.data(), count);
    PutRow(out, mixed.data(), count, opacity, copy);
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

void KDrawerToKBitmap::PaintCoverage(const KCoverage& mask, KColor color, uint8_t opacity, uint32_t) {
  const uint32_t alpha = KMulByte(KAlphaOf(color), opacity);
  if (alpha == 0) return;
  mask.ForEachSpan([&](int32_t row, int32_t begin, int32_t end) {
    BlendCoverageRow(target_.Row(mask.y + row) + mask.x + begin, &mask.values[size_t(row) * mask.width + size_t(begin)],
                     end - begin, color, alpha);
  });
}

void KDrawerToKBitmap::PaintGlyphs(const std::vector<KGlyphInk>& glyphs, KColor color, uint8_t opacity, uint32_t mode) {
  const uint32_t alpha = KMulByte(KAlphaOf(color), opacity);
  if (alpha == 0) return;
  // Where inks overlap (italics, tight pairs) their coverage must add up before it is blended
  // once, as one mask; glyphs that stand apart go straight onto the target.
  int64_t right = INT64_MIN;
  for (const KGlyphInk& g : glyphs) {
    if (g.x < right) return KCoverageDrawer::PaintGlyphs(glyphs, color, opacity, mode);
    right = std::max(right, g.x + g.width);
  }
  for (const KGlyphInk& g : glyphs) {
    const int64_t x0 = std::max<int64_t>(g.x, 0), x1 = std::min<int64_t>(g.x + g.width, target_.Width());
    const int64_t y0 = std::max<int64_t>(g.y, 0), y1 = std::min<int64_t>(g.y + g.height, target_.Height());
    for (int64_t y = y0; y < y1; ++y)
      BlendCoverageRow(target_.Row(int32_t(y)) + x0, g.ink + size_t(y - g.y) * g.width + size_t(x0 - g.x), x1 - x0, color, alpha);
  }
}
