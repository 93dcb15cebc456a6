#include "ui/KOpenGLTexture.h"

#include <epoxy/gl.h>

#include <algorithm>
#include <atomic>

#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "ui/KDrawerOpenGL.h"

namespace {
std::atomic<int32_t> gMaximumSize{2048};
}

int32_t KOpenGLTexture::MaximumSize() noexcept { return gMaximumSize; }
void KOpenGLTexture::SetMaximumSize(int32_t size) noexcept { gMaximumSize = size; }

KOpenGLTexture* KOpenGLTexture::Get(const KBitmap& bitmap, KRect& source, KDrawerOpenGL& drawer, bool force) {
  KOpenGLTexture* texture = nullptr;
  KGuard("KOpenGLTexture::Get", [&] {
    KDrawerOpenGL::TextureSet& set = drawer.TexturesOf(bitmap);
    const int32_t w = bitmap.Width(), h = bitmap.Height();
    const int32_t largest = MaximumSize();
    if (source == bitmap.Bounds() || (!force && w <= largest && h <= largest)) {
      if (!set.whole) {
        const uint32_t name = drawer.Upload(bitmap.Pixels(), w, h, false);
        set.whole = std::make_unique<KOpenGLTexture>(name, &bitmap, bitmap.Bounds());
      }
      texture = set.whole.get();
      return;
    }
    if (source.Width() > largest || source.Height() > largest) throw KException("The image is too large for the graphics card.");
    auto& parts = set.parts;
    const auto at = std::lower_bound(parts.begin(), parts.end(), source,
                                     [](const std::unique_ptr<KOpenGLTexture>& t, const KRect& r) { return t->Source() < r; });
    if (at != parts.end() && (*at)->Source() == source) {
      texture = at->get();
    } else {
      const KBitmap piece = bitmap.Copy(source);
      const uint32_t name = drawer.Upload(piece.Pixels(), piece.Width(), piece.Height(), false);
      texture = parts.insert(at, std::make_unique<KOpenGLTexture>(name, &bitmap, source))->get();
    }
    if (!force) source = {0, 0, texture->Width() - 1, texture->Height() - 1};
  });
  return texture;
}

KOpenGLTexture* KOpenGLTexture::GetAlphaMask(const KBitmap& bitmap, KDrawerOpenGL& drawer) {
  KOpenGLTexture* texture = nullptr;
  KGuard("KOpenGLTexture::Get (create texture alphamask)", [&] {
    KDrawerOpenGL::TextureSet& set = drawer.TexturesOf(bitmap);
    if (!set.alphaMask) {
      if (bitmap.Width() > MaximumSize() || bitmap.Height() > MaximumSize())
        throw KException("The image is too large for the graphics card.");
      const uint32_t name = drawer.Upload(bitmap.Pixels(), bitmap.Width(), bitmap.Height(), true);
      set.alphaMask = std::make_unique<KOpenGLTexture>(name, &bitmap, bitmap.Bounds());
    }
    texture = set.alphaMask.get();
  });
  return texture;
}
