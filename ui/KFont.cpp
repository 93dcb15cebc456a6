#include "ui/KFont.h"

#include <ft2build.h>
#include FT_FREETYPE_H

#include <algorithm>
#include <cmath>
#include <mutex>
#include <unordered_map>
#include <vector>

#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/platform/KPlatform.h"

namespace {
constexpr const char* kFaceFiles[4] = {"DejaVuSans.ttf", "DejaVuSans-Bold.ttf", "DejaVuSans-Oblique.ttf",
                                       "DejaVuSans-BoldOblique.ttf"};

struct Glyph {
  uint32_t index = 0;  // in the face, for kerning
  int32_t left = 0, top = 0, width = 0, rows = 0;
  int64_t advance = 0;  // 26.6 fixed point
  std::vector<uint8_t> ink;
};

struct PlacedGlyph {
  const Glyph* glyph;
  int32_t x;  // pen position in whole pixels
};

// FreeType state of the process: the library, one face per style and the rendered glyphs by
// style, size and character. One lock serialises it; text is drawn on the user-interface thread.
class FontCache {
public:
  static FontCache& Instance() {
    static FontCache cache;
    return cache;
  }

  std::mutex& Lock() { return mutex_; }

  // Sets the face of `font` to the pixel size; throws when the file is missing or damaged.
  FT_Face Face(const KFont& font, double scale) {
    const int style = int(font.Style()) & 3;
    if (!faces_[style]) {
      if (!library_ && FT_Init_FreeType(&library_) != 0) throw KException("The font system could not be started.");
      const std::string path = KFont::FontFolder() + kFaceFiles[style];
      if (FT_New_Face(library_, path.c_str(), 0, &faces_[style]) != 0) {
        faces_[style] = nullptr;
        throw KException(KFormatText("Could not load the font '{0}'.", KString::FromUtf8(path)));
      }
    }
    FT_Face face = faces_[style];
    const double pixels = font.Size() * scale;
    if (!(pixels >= 1 && pixels <= 1000)) throw KException("The font size is out of range.");
    const FT_F26Dot6 size = FT_F26Dot6(std::lround(pixels * 64));
    if (size != sizes_[style]) {
      if (FT_Set_Char_Size(face, 0, size, 72, 72) != 0) throw KException("The font size is out of range.");
      sizes_[style] = size;
    }
    return face;
  }

  // Pen positions of the glyphs of `text`, kerned; `width` receives the advance in pixels.
  std::vector<PlacedGlyph> Layout(const KString& text, const KFont& font, double scale, int64_t& width) {
    FT_Face face = Face(font, scale);
    const int style = int(font.Style()) & 3;
    const bool kerning = FT_HAS_KERNING(face);
    std::vector<PlacedGlyph> placed;
    placed.reserve(size_t(text.Length()));
    int64_t pen = 0;
    uint32_t previous = 0;
    for (int32_t i = 0; i < text.Length(); ++i) {
      uint32_t code = text.CharAt(i);
      if (code >= 0xD800 && code < 0xDC00 && i + 1 < text.Length()) {
        const uint32_t low = text.CharAt(i + 1);
        if (low >= 0xDC00 && low < 0xE000) code = 0x10000 + ((code - 0xD800) << 10) + (low - 0xDC00), ++i;
      }
      const Glyph& glyph = GlyphOf(face, style, code);
      if (kerning && previous && glyph.index) {
        FT_Vector kern{};
        if (FT_Get_Kerning(face, previous, glyph.index, FT_KERNING_DEFAULT, &kern) == 0) pen += kern.x;
      }
      placed.push_back({&glyph, int32_t((pen + 32) >> 6)});
      pen += glyph.advance;
      previous = glyph.index;
    }
    width = (pen + 32) >> 6;
    return placed;
  }

private:
  FontCache() = default;
  ~FontCache() {
    for (FT_Face face : faces_)
      if (face) FT_Done_Face(face);
    if (library_) FT_Done_FreeType(library_);
  }

  const Glyph& GlyphOf(FT_Face face, int style, uint32_t code) {
    const uint64_t key = uint64_t(style) << 62 | uint64_t(sizes_[style]) << 32 | code;
    auto found = glyphs_.find(key);
    if (found != glyphs_.end()) return found->second;
    Glyph glyph;
    glyph.index = FT_Get_Char_Index(face, code);
    if (FT_Load_Glyph(face, glyph.index, FT_LOAD_TARGET_LIGHT) == 0 && FT_Render_Glyph(face->glyph, FT_RENDER_MODE_NORMAL) == 0) {
      const FT_Bitmap& b = face->glyph->bitmap;
      glyph.left = face->glyph->bitmap_left, glyph.top = face->glyph->bitmap_top;
      glyph.width = int32_t(b.width), glyph.rows = int32_t(b.rows), glyph.advance = face->glyph->advance.x;
      glyph.ink.resize(size_t(glyph.width) * glyph.rows);
      for (int32_t y = 0; y < glyph.rows; ++y)
        std::copy_n(b.buffer + ptrdiff_t(y) * b.pitch, glyph.width, glyph.ink.begin() + ptrdiff_t(y) * glyph.width);
    }
    return glyphs_.emplace(key, std::move(glyph)).first->second;
  }

  std::mutex mutex_;
  FT_Library library_ = nullptr;
  FT_Face faces_[4] = {};
  FT_F26Dot6 sizes_[4] = {};
  std::unordered_map<uint64_t, Glyph> glyphs_;
};

double Metric(const KFont& font, double scale, FT_Pos FT_Size_Metrics::*field) {
  FontCache& cache = FontCache::Instance();
  std::lock_guard lock(cache.Lock());
  return std::abs(double(cache.Face(font, scale)->size->metrics.*field)) / 64 / scale;
}

// Far outside any target, well inside the range of int32 pixel arithmetic.
int64_t ClampPixel(double v) { return int64_t(std::clamp(std::round(v), -1e9, 1e9)); }
}  // namespace

std::string KFont::FontFolder() { return KPlatform::KernelFolder(); }

double KFont::Ascent(double scale) const { return Metric(*this, scale, &FT_Size_Metrics::ascender); }
double KFont::Descent(double scale) const { return Metric(*this, scale, &FT_Size_Metrics::descender); }
double KFont::LineHeight(double scale) const { return Metric(*this, scale, &FT_Size_Metrics::height); }

double KFont::TextWidth(const KString& text, double scale) const {
  FontCache& cache = FontCache::Instance();
  std::lock_guard lock(cache.Lock());
  int64_t width = 0;
  cache.Layout(text, *this, scale, width);
  return double(width) / scale;
}

std::vector<KGlyphInk> KFont::Place(const KString& text, double scale, const double (&box)[4], uint32_t alignment) const {
  FontCache& cache = FontCache::Instance();
  std::lock_guard lock(cache.Lock());
  int64_t advance = 0;
  const std::vector<PlacedGlyph> placed = cache.Layout(text, *this, scale, advance);
  const FT_Size_Metrics& metrics = cache.Face(*this, scale)->size->metrics;
  const double ascent = double(metrics.ascender) / 64, descent = -double(metrics.descender) / 64;
  const auto [boxLeft, boxTop, boxRight, boxBottom] = box;
  double penX = boxLeft, baselineY = boxTop + ascent;
  if (alignment & kAlignCentre) penX = (boxLeft + boxRight - double(advance)) / 2;
  if (alignment & kAlignRight) penX = boxRight - double(advance);
  if (alignment & kAlignMiddle) baselineY = (boxTop + boxBottom - ascent - descent) / 2 + ascent;
  if (alignment & kAlignBottom) baselineY = boxBottom - descent;
  const int64_t x = ClampPixel(penX), baseline = ClampPixel(baselineY);
  std::vector<KGlyphInk> glyphs;
  glyphs.reserve(placed.size());
  for (const PlacedGlyph& p : placed)
    if (!p.glyph->ink.empty())
      glyphs.push_back({x + p.x + p.glyph->left, baseline - p.glyph->top, p.glyph->width, p.glyph->rows, p.glyph->ink.data()});
  return glyphs;
}

KCoverage KFont::Compose(const std::vector<KGlyphInk>& glyphs, int32_t width, int32_t height) {
  // The box of all ink, cut to the target.
  int64_t left = INT64_MAX, top = INT64_MAX, right = INT64_MIN, bottom = INT64_MIN;
  for (const KGlyphInk& g : glyphs) {
    left = std::min(left, g.x), right = std::max(right, g.x + g.width);
    top = std::min(top, g.y), bottom = std::max(bottom, g.y + g.height);
  }
  left = std::max<int64_t>(left, 0), top = std::max<int64_t>(top, 0);
  right = std::min<int64_t>(right, width), bottom = std::min<int64_t>(bottom, height);
  if (right <= left || bottom <= top) return {};
  KCoverage mask{int32_t(left), int32_t(top), int32_t(right - left), int32_t(bottom - top), {}, {}};
  mask.values.assign(size_t(mask.width) * mask.height, 0);
  for (const KGlyphInk& g : glyphs) {
    const int64_t x0 = std::max(g.x, left), x1 = std::min(g.x + g.width, right);
    for (int64_t y = std::max(g.y, top); y < std::min(g.y + g.height, bottom); ++y) {
      const uint8_t* in = g.ink + size_t(y - g.y) * g.width;
      uint8_t* out = &mask.values[size_t(y - top) * mask.width];
      for (int64_t px = x0; px < x1; ++px) out[px - left] = uint8_t(std::min(255, out[px - left] + in[px - g.x]));
    }
  }
  return mask;
}
