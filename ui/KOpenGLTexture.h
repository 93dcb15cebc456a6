#pragma once

#include <cstdint>

#include "ui/KBitmap.h"

class KDrawerOpenGL;

// A bitmap, or a rectangle of it, uploaded as an OpenGL texture for one drawer. The drawer
// owns its textures; a texture outlives neither its drawer nor (for painting) its bitmap.
class KOpenGLTexture {
public:
  KOpenGLTexture(uint32_t name, const KBitmap* bitmap, const KRect& source) noexcept
      : name_(name), bitmap_(bitmap), source_(source) {}

  uint32_t Name() const noexcept { return name_; }
  const KBitmap* Bitmap() const noexcept { return bitmap_; }
  const KRect& Source() const noexcept { return source_; }
  int32_t Width() const noexcept { return int32_t(source_.Width()); }
  int32_t Height() const noexcept { return int32_t(source_.Height()); }

  // The texture to paint `source` of `bitmap` with: the bitmap's whole texture when `source` is
  // the whole bitmap, or when `force` is clear and the bitmap fits the largest texture;
  // otherwise the texture of exactly that rectangle, made on first use. When `force` is clear
  // and a rectangle's own texture is answered, `source` becomes (0, 0, width-1, height-1) of it.
  // Null when the texture could not be made (reported under "KOpenGLTexture::Get").
  static KOpenGLTexture* Get(const KBitmap& bitmap, KRect& source, KDrawerOpenGL& drawer, bool force);
  // The alpha of the whole bitmap as a mask texture for AlphaMask; null when it could not be
  // made (reported under "KOpenGLTexture::Get (create texture alphamask)").
  static KOpenGLTexture* GetAlphaMask(const KBitmap& bitmap, KDrawerOpenGL& drawer);

  // The largest texture side of the process, read when a drawer's context is set up.
  static int32_t MaximumSize() noexcept;
  static void SetMaximumSize(int32_t size) noexcept;

private:
  uint32_t name_;
  const KBitmap* bitmap_;
  KRect source_;
};
