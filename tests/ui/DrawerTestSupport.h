#pragma once

#include <gtest/gtest.h>

#include <cstdlib>
#include <memory>
#include <string>

#include "kernel/KException.h"
#include "kernel/platform/KPlatform.h"
#include "ui/KBitmap.h"
#include "ui/KDrawerOpenGL.h"
#include "ui/platform/KOpenGLContext.h"

// Where tests leave pictures for a person to look at (created on first use).
inline std::string KPicturePath(const std::string& name) {
  KPlatform::CreateFolders(TORVANE_UI_PICTURES);
  return std::string(TORVANE_UI_PICTURES) + name;
}

// Per-channel largest difference of two pictures of the same size, and how many pixels differ
// by more than `tolerance` in any channel.
struct KPictureDifference {
  uint32_t largest = 0;
  int64_t beyond = 0;
  KBitmap picture;  // the differences, times 16, on black
};
inline KPictureDifference KCompare(const KBitmap& a, const KBitmap& b, uint32_t tolerance) {
  KPictureDifference d;
  d.picture = KBitmap(a.Width(), a.Height());
  for (int32_t y = 0; y < a.Height(); ++y)
    for (int32_t x = 0; x < a.Width(); ++x) {
      uint32_t worst = 0, shown = 0xFF000000u;
      for (int shift = 0; shift < 32; shift += 8) {
        const int32_t ca = int32_t(a.Pixel(x, y) >> shift & 0xFF), cb = int32_t(b.Pixel(x, y) >> shift & 0xFF);
        const uint32_t diff = uint32_t(std::abs(ca - cb));
        worst = std::max(worst, diff);
        if (shift < 24) shown |= std::min(255u, diff * 16) << shift;
      }
      d.largest = std::max(d.largest, worst);
      d.beyond += worst > tolerance;
      d.picture.Row(y)[x] = shown;
    }
  return d;
}

// An OpenGL drawer on an off-screen context, set up and painting; skips the test where the
// system has no OpenGL at all.
struct KOpenGLPainter {
  std::unique_ptr<KOpenGLContext> context;
  std::unique_ptr<KDrawerOpenGL> drawer;

  bool Open(int32_t width, int32_t height, double scale = 1) {
    try {
      context = KOpenGLContext::CreateOffscreen(width, height);
    } catch (const KException&) {
      return false;
    }
    drawer = std::make_unique<KDrawerOpenGL>(*context, scale);
    drawer->Attach();
    drawer->BeginPaint();
    return true;
  }
};
#define KOPEN_GL_OR_SKIP(painter, ...) \
  if (!(painter).Open(__VA_ARGS__)) GTEST_SKIP() << "no OpenGL on this system"
