// Image files of bitmaps: PNG through libpng's simplified interface, WebP through libwebp.
#include <png.h>
#include <webp/decode.h>

#include <cstring>

#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/platform/KPlatform.h"
#include "ui/KBitmap.h"

namespace {
[[noreturn]] void Damaged(const std::string& name) {
  throw KException(KFormatText("The image '{0}' is damaged or not a PNG or WebP image.", KString::FromUtf8(name)));
}

bool IsPNG(std::string_view bytes) { return bytes.size() >= 8 && png_sig_cmp(reinterpret_cast<png_const_bytep>(bytes.data()), 0, 8) == 0; }
bool IsWebP(std::string_view bytes) { return bytes.size() >= 12 && bytes.substr(0, 4) == "RIFF" && bytes.substr(8, 4) == "WEBP"; }

KBitmap DecodePNG(std::string_view bytes, const std::string& name) {
  png_image image;
  std::memset(&image, 0, sizeof image);
  image.version = PNG_IMAGE_VERSION;
  if (!png_image_begin_read_from_memory(&image, bytes.data(), bytes.size())) Damaged(name);
  image.format = PNG_FORMAT_BGRA;
  if (image.width == 0 || image.height == 0 || image.width > 1u << 16 || image.height > 1u << 16) {
    png_image_free(&image);
    Damaged(name);
  }
  KBitmap bitmap(static_cast<int32_t>(image.width), static_cast<int32_t>(image.height));
  if (!png_image_finish_read(&image, nullptr, bitmap.Pixels(), 0, nullptr)) {
    png_image_free(&image);
    Damaged(name);
  }
  return bitmap;
}

KBitmap DecodeWebP(std::string_view bytes, const std::string& name) {
  const auto* data = reinterpret_cast<const uint8_t*>(bytes.data());
  int width = 0, height = 0;
  if (!WebPGetInfo(data, bytes.size(), &width, &height) || width <= 0 || height <= 0) Damaged(name);
  KBitmap bitmap(width, height);
  const size_t size = static_cast<size_t>(width) * height * 4;
  if (!WebPDecodeBGRAInto(data, bytes.size(), reinterpret_cast<uint8_t*>(bitmap.Pixels()), size, width * 4)) Damaged(name);
  return bitmap;
}
}  // namespace

std::string KBitmap::EncodePNG() const {
  if (!pixels_) throw KException("An empty image cannot be stored.");
  png_image image;
  std::memset(&image, 0, sizeof image);
  image.version = PNG_IMAGE_VERSION;
  image.width = static_cast<png_uint_32>(width_);
  image.height = static_cast<png_uint_32>(height_);
  image.format = PNG_FORMAT_BGRA;
  png_alloc_size_t size = 0;
  if (!png_image_write_get_memory_size(image, size, 0, pixels_, 0, nullptr)) throw KException("The image could not be encoded.");
  std::string bytes(size, '\0');
  if (!png_image_write_to_memory(&image, bytes.data(), &size, 0, pixels_, 0, nullptr)) throw KException("The image could not be encoded.");
  bytes.resize(size);
  return bytes;
}

void KBitmap::Store(const std::string& path) const { KPlatform::WriteFileAtomically(path, EncodePNG()); }

KBitmap KBitmap::Load(const std::string& path) {
  const std::optional<std::string> bytes = KPlatform::ReadFile(path);
  if (!bytes) throw KException(KFormatText("Could not read the image '{0}' ({1}).", KString::FromUtf8(path), KString("no such file")));
  return Decode(*bytes, path);
}

KBitmap KBitmap::Decode(std::string_view bytes, const std::string& name) {
  if (IsPNG(bytes)) return DecodePNG(bytes, name);
  if (IsWebP(bytes)) return DecodeWebP(bytes, name);
  Damaged(name);
}
