#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "kernel/KString.h"
#include "ui/KCoverage.h"

// Alignment of a line of text in a box: one horizontal and one vertical value, or-ed.
inline constexpr uint32_t kAlignLeft = 0, kAlignCentre = 1, kAlignRight = 2;
inline constexpr uint32_t kAlignTop = 0, kAlignMiddle = 4, kAlignBottom = 8;

// One glyph's coverage, width × height bytes, placed with its top-left corner at pixel (x, y).
struct KGlyphInk {
  int64_t x, y;
  int32_t width, height;
  const uint8_t* ink;
};

enum class KFontStyle : uint8_t { Normal, Bold, Italic, BoldItalic };

// A typeface style at a size in logical pixels (the em height). The faces are the font files
// shipped beside the kernel; the named sizes are those of help texts and control labels.
class KFont {
public:
  constexpr KFont(double size = 13, KFontStyle style = KFontStyle::Normal) noexcept : size_(size), style_(style) {}

  static constexpr KFont Normal() noexcept { return {13}; }
  static constexpr KFont Bold() noexcept { return {13, KFontStyle::Bold}; }
  static constexpr KFont Italic() noexcept { return {13, KFontStyle::Italic}; }
  // Headings from 1 (largest) to 4; other levels are clamped.
  static constexpr KFont Large(int level) noexcept {
    constexpr double sizes[4] = {26, 21, 17, 15};
    return {sizes[level < 1 ? 0 : level > 4 ? 3 : level - 1], KFontStyle::Bold};
  }
  // Secondary text: captions, units, footnotes.
  static constexpr KFont Small() noexcept { return {11}; }

  double Size() const noexcept { return size_; }
  KFontStyle Style() const noexcept { return style_; }
  KFont WithStyle(KFontStyle style) const noexcept { return {size_, style}; }

  // Metrics in logical units when drawn at `scale` (hinting makes them depend on it a little).
  // Throw KException when the font file cannot be loaded.
  double Ascent(double scale = 1) const;
  double Descent(double scale = 1) const;
  double LineHeight(double scale = 1) const;
  double TextWidth(const KString& text, double scale = 1) const;

  // The glyphs of a line of text aligned in the pixel box [left, right) × [top, bottom),
  // drawn at `scale` pixels per logical unit. The pen starts on whole pixels, so that hinted
  // glyphs stay sharp. The inks live as long as the process.
  std::vector<KGlyphInk> Place(const KString& text, double scale, const double (&box)[4], uint32_t alignment) const;
  // The glyphs' ink as one mask, cut to a target of width × height pixels.
  static KCoverage Compose(const std::vector<KGlyphInk>& glyphs, int32_t width, int32_t height);

  // The folder the font files are looked up in: the one holding the kernel.
  static std::string FontFolder();

private:
  double size_;
  KFontStyle style_;
};
