#pragma once

#include <cstdint>
#include <string>
#include <string_view>

#include "ui/KGeometry.h"

// A 32-bit image: one 0xAARRGGBB word per pixel (blue, green, red, alpha in memory), rows top
// to bottom without padding, colours not premultiplied. Every bitmap carries an identity that
// drawers key their caches (textures) with; MarkChanged gives it a new one after its pixels
// were changed.
class KBitmap {
public:
  KBitmap() noexcept;
  // Transparent black. Negative sizes count as 0; throws KException when the size cannot be
  // held ("The image is too large.").
  KBitmap(int32_t width, int32_t height);
  KBitmap(const KBitmap& other);
  KBitmap(KBitmap&& other) noexcept;
  KBitmap& operator=(KBitmap other) noexcept;
  ~KBitmap();

  int32_t Width() const noexcept { return width_; }
  int32_t Height() const noexcept { return height_; }
  KRect Bounds() const noexcept { return {0, 0, width_ - 1, height_ - 1}; }
  uint32_t* Pixels() noexcept { return pixels_; }
  const uint32_t* Pixels() const noexcept { return pixels_; }
  uint32_t* Row(int32_t y) noexcept { return pixels_ + static_cast<size_t>(y) * width_; }
  const uint32_t* Row(int32_t y) const noexcept { return pixels_ + static_cast<size_t>(y) * width_; }
  KColor Pixel(int32_t x, int32_t y) const noexcept { return Row(y)[x]; }

  uint64_t Identity() const noexcept { return identity_; }
  void MarkChanged() noexcept;

  // A copy of a rectangle of this bitmap (clipped to it).
  KBitmap Copy(const KRect& source) const;
  void Fill(KColor color) noexcept;

  // PNG with alpha. Throws KException "Could not write the image '{0}' ({1})."
  void Store(const std::string& path) const;
  std::string EncodePNG() const;
  // A PNG or WebP image, told apart by its signature. Throws KException "Could not read the
  // image '{0}' ({1})." for a missing file and "The image '{0}' is damaged or not a PNG or WebP
  // image." for anything it cannot decode.
  static KBitmap Load(const std::string& path);
  // The same from bytes in memory; `name` stands in the message.
  static KBitmap Decode(std::string_view bytes, const std::string& name);

private:
  int32_t width_ = 0;
  int32_t height_ = 0;
  uint32_t* pixels_ = nullptr;
  uint64_t identity_;
};
