#include "ui/KDrawerOpenGL.h"

#include <epoxy/gl.h>

#include <algorithm>
#include <atomic>
#include <cmath>
#include <cstring>

#include "kernel/KException.h"
#include "kernel/KGuard.h"
#include "ui/KTexturedMesh.h"
#include "ui/platform/KOpenGLContext.h"

namespace {
#define KDRAWER_NAME(name) "KDrawerOpenGL::" #name,
const KString kNames[] = {KDRAWER_OPERATIONS(KDRAWER_NAME)};
#undef KDRAWER_NAME

std::atomic<bool> gCapable{true};
std::atomic<int32_t> gFramebufferOption{0};

void Color(KColor c, uint32_t alpha) {
  glColor4ub(GLubyte(KRedOf(c)), GLubyte(KGreenOf(c)), GLubyte(KBlueOf(c)), GLubyte(alpha));
}

void ThrowOnError(const char* what) {
  if (glGetError() != GL_NO_ERROR) throw KException(KString::FromUtf8(what));
}

// Far pixel coordinates are cut to what single-precision vertices carry exactly.
double Vertex(int64_t v) { return double(std::clamp<int64_t>(v, -(1 << 23), 1 << 23)); }

// Texture coordinates of a quad's corners: left, top, right, bottom.
struct TextureArea {
  double s0, t0, s1, t1;
};

// The texels `source` (inclusive) of a texture of width × height as texture coordinates.
TextureArea AreaOf(const KRect& source, double width, double height) {
  return {source.left / width, source.top / height, (source.right + 1.0) / width, (source.bottom + 1.0) / height};
}

// A quad over the pixels [left, right) × [top, bottom) textured with `area` of the texture, in
// the current colour and blending.
void TexturedQuad(GLuint texture, double left, double top, double right, double bottom, const TextureArea& area, GLint wrap) {
  glEnable(GL_TEXTURE_2D);
  glBindTexture(GL_TEXTURE_2D, texture);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, wrap);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, wrap);
  glBegin(GL_QUADS);
  glTexCoord2d(area.s0, area.t0), glVertex2d(left, top);
  glTexCoord2d(area.s1, area.t0), glVertex2d(right, top);
  glTexCoord2d(area.s1, area.t1), glVertex2d(right, bottom);
  glTexCoord2d(area.s0, area.t1), glVertex2d(left, bottom);
  glEnd();
  glDisable(GL_TEXTURE_2D);
  ThrowOnError("The graphics card could not paint the image.");
}
}  // namespace

KDrawerOpenGL::KDrawerOpenGL(KOpenGLContext& context, double scale) : KCoverageDrawer(kNames, scale), context_(context) {}

KDrawerOpenGL::~KDrawerOpenGL() {
  if (!context_.MakeCurrent()) return;
  std::vector<GLuint> names;
  for (auto& [identity, set] : textures_) {
    if (set.whole) names.push_back(set.whole->Name());
    if (set.alphaMask) names.push_back(set.alphaMask->Name());
    for (auto& part : set.parts) names.push_back(part->Name());
  }
  if (framebufferTexture_) names.push_back(framebufferTexture_);
  if (!names.empty()) glDeleteTextures(GLsizei(names.size()), names.data());
  if (framebuffer_) glDeleteFramebuffers(1, &framebuffer_);
  context_.Release();
}

bool KDrawerOpenGL::IsCapable() noexcept { return gCapable; }
void KDrawerOpenGL::SetFramebufferOption(int32_t value) noexcept { gFramebufferOption = value; }

int32_t KDrawerOpenGL::TargetWidth() const noexcept { return context_.Width(); }
int32_t KDrawerOpenGL::TargetHeight() const noexcept { return context_.Height(); }

void KDrawerOpenGL::Attach() {
  KGuard("KDrawerOpenGL::Attach", [&] {
    if (!context_.MakeCurrent()) throw KException("The drawing context could not be made current.");
    GLint largest = 0;
    glGetIntegerv(GL_MAX_TEXTURE_SIZE, &largest);
    KOpenGLTexture::SetMaximumSize(largest);
    if (largest < 2049) gCapable = false;
    const bool framebuffers = epoxy_gl_version() >= 30 || epoxy_has_gl_extension("GL_ARB_framebuffer_object");
    if (largest >= 4097 && framebuffers && gFramebufferOption != 2 && !framebuffer_) {
      glGetError();
      glGenFramebuffers(1, &framebuffer_);
      glBindFramebuffer(GL_FRAMEBUFFER, framebuffer_);
      bool failed = glGetError() != GL_NO_ERROR;
      if (!failed) {
        glGenTextures(1, &framebufferTexture_);
        glBindTexture(GL_TEXTURE_2D, framebufferTexture_);
        glTexImage2D(GL_TEXTURE_2D, 0, GL_RGBA8, context_.Width(), context_.Height(), 0, GL_BGRA, GL_UNSIGNED_BYTE, nullptr);
        glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_NEAREST);
        glFramebufferTexture2D(GL_FRAMEBUFFER, GL_COLOR_ATTACHMENT0, GL_TEXTURE_2D, framebufferTexture_, 0);
        failed = glGetError() != GL_NO_ERROR || glCheckFramebufferStatus(GL_FRAMEBUFFER) != GL_FRAMEBUFFER_COMPLETE;
      }
      if (failed) {
        // Paint into the window's own framebuffer instead.
        glBindFramebuffer(GL_FRAMEBUFFER, 0);
        glDeleteFramebuffers(1, &framebuffer_);
        if (framebufferTexture_) glDeleteTextures(1, &framebufferTexture_);
        framebuffer_ = framebufferTexture_ = 0;
      }
    }
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    context_.Release();
  });
}

void KDrawerOpenGL::BeginPaint() {
  KGuard("KDrawerOpenGL::BeginPaint", [&] {
    if (!context_.MakeCurrent()) throw KException("The drawing context could not be made current.");
    if (framebuffer_) glBindFramebuffer(GL_FRAMEBUFFER, framebuffer_);
    const int32_t w = context_.Width(), h = context_.Height();
    glViewport(0, 0, w, h);
    glMatrixMode(GL_PROJECTION);
    glLoadIdentity();
    // Pixel coordinates, y downwards: pixel (x, y) spans [x, x+1] × [y, y+1].
    glOrtho(0, w, h, 0, -1, 1);
    glMatrixMode(GL_MODELVIEW);
    glLoadIdentity();
    glDisable(GL_DITHER);
    glDisable(GL_DEPTH_TEST);
    glShadeModel(GL_SMOOTH);
    glTexEnvi(GL_TEXTURE_ENV, GL_TEXTURE_ENV_MODE, GL_MODULATE);
    glBlendFuncSeparate(GL_SRC_ALPHA, GL_ONE_MINUS_SRC_ALPHA, GL_ONE, GL_ONE_MINUS_SRC_ALPHA);
    painting_ = true;
  });
}

void KDrawerOpenGL::EndPaint() {
  KGuard("KDrawerOpenGL::EndPaint", [&] {
    if (!painting_) return;
    painting_ = false;
    glFinish();
    glBindFramebuffer(GL_FRAMEBUFFER, 0);
    context_.Release();
  });
}

void KDrawerOpenGL::CopyToDefaultFramebuffer() {
  KGuard("KDrawerOpenGL::CopyToDefaultFramebuffer", [&] {
    CheckPainting();
    if (!framebuffer_) return;
    const int32_t w = context_.Width(), h = context_.Height();
    glBindFramebuffer(GL_READ_FRAMEBUFFER, framebuffer_);
    glBindFramebuffer(GL_DRAW_FRAMEBUFFER, 0);
    glBlitFramebuffer(0, 0, w, h, 0, 0, w, h, GL_COLOR_BUFFER_BIT, GL_NEAREST);
    glBindFramebuffer(GL_FRAMEBUFFER, framebuffer_);
    ThrowOnError("The graphics card could not show the picture.");
  });
}

namespace {
// The current read buffer's width × height pixels, top row first (OpenGL's rows run bottom to top).
KBitmap ReadPicture(int32_t width, int32_t height) {
  KBitmap shot(width, height);
  glPixelStorei(GL_PACK_ALIGNMENT, 4);
  glReadPixels(0, 0, width, height, GL_BGRA, GL_UNSIGNED_BYTE, shot.Pixels());
  for (int32_t y = 0; y < height / 2; ++y) std::swap_ranges(shot.Row(y), shot.Row(y) + width, shot.Row(height - 1 - y));
  return shot;
}
}  // namespace

KBitmap KDrawerOpenGL::GetScreenShot() {
  KBitmap picture;
  KGuard("KDrawerOpenGL::GetScreenShot", [&] {
    const bool wasPainting = painting_;
    if (!wasPainting) BeginPaint();
    if (!painting_) return;
    picture = ReadPicture(context_.Width(), context_.Height());
    if (!wasPainting) EndPaint();
  });
  return picture;
}

uint32_t KDrawerOpenGL::Upload(const uint32_t* pixels, int32_t width, int32_t height, bool alphaOnly) {
  glGetError();
  GLuint name = 0;
  glGenTextures(1, &name);
  glBindTexture(GL_TEXTURE_2D, name);
  glPixelStorei(GL_UNPACK_ALIGNMENT, 4);
  glPixelStorei(GL_UNPACK_ROW_LENGTH, 0);
  glTexImage2D(GL_TEXTURE_2D, 0, alphaOnly ? GL_ALPHA8 : GL_RGBA8, width, height, 0, GL_BGRA, GL_UNSIGNED_BYTE, pixels);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_LINEAR);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, GL_LINEAR);
  if (glGetError() != GL_NO_ERROR) {
    glDeleteTextures(1, &name);
    throw KException("The graphics card could not take the image.");
  }
  ++textureCount_;
  return name;
}

void KDrawerOpenGL::CheckPainting() const {
  if (!painting_) throw KException("The drawer paints only between BeginPaint and EndPaint.");
}

void KDrawerOpenGL::SetBlending(uint32_t mode) {
  if (mode & kDrawCopy)
    glDisable(GL_BLEND);
  else
    glEnable(GL_BLEND);
}

void KDrawerOpenGL::PaintTexture(const KOpenGLTexture& texture, const PixelBox& box, const KRect& source, uint8_t opacity,
                                 uint32_t mode) {
  SetBlending(mode);
  glColor4ub(255, 255, 255, opacity);
  TexturedQuad(texture.Name(), Vertex(box.left), Vertex(box.top), Vertex(box.right), Vertex(box.bottom),
               AreaOf(source, texture.Width(), texture.Height()), GL_CLAMP_TO_EDGE);
}

void KDrawerOpenGL::PaintGLTexture(const KRect& dest, const KOpenGLTexture& texture, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPaintGLTexture), [&] {
    CheckPainting();
    const PixelBox box = ToPixels(dest);
    if (!box.IsEmpty()) PaintTexture(texture, box, {0, 0, texture.Width() - 1, texture.Height() - 1}, opacity, mode);
  });
}

void KDrawerOpenGL::PatBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationPatBlt), [&] {
    CheckPainting();
    const PixelBox box = ToPixels(dest);
    if (box.IsEmpty() || !IsInside(source, bitmap)) return;
    KRect part = source;
    const KOpenGLTexture* texture = KOpenGLTexture::Get(bitmap, part, *this, true);
    if (!texture) return;
    // Texture coordinates count whole patterns from the destination's corner; a whole-bitmap
    // texture of a rectangle that is not the whole bitmap cannot repeat, so it is never used.
    const double repeatsX = double(dest.Width()) / texture->Width();
    const double repeatsY = double(dest.Height()) / texture->Height();
    SetBlending(mode);
    glColor4ub(255, 255, 255, opacity);
    TexturedQuad(texture->Name(), Vertex(box.left), Vertex(box.top), Vertex(box.right), Vertex(box.bottom),
                 {0, 0, repeatsX, repeatsY}, GL_REPEAT);
  });
}

void KDrawerOpenGL::BitBlt(const KRect& dest, const KBitmap& bitmap, KPoint source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationBitBlt), [&] {
    CheckPainting();
    KRect d = dest, s;
    if (!ClipBitBlt(d, bitmap, source, s)) return;
    const PixelBox box = ToPixels(d);
    if (box.IsEmpty()) return;
    if (const KOpenGLTexture* texture = KOpenGLTexture::Get(bitmap, s, *this, false)) PaintTexture(*texture, box, s, opacity, mode);
  });
}

void KDrawerOpenGL::AlphaMask(const KRect& dest, const KBitmap& mask, KPoint source, KColor color, uint8_t opacity,
                              uint32_t mode) {
  KGuard(Name(kOperationAlphaMask), [&] {
    CheckPainting();
    KRect d = dest, s;
    if (!ClipBitBlt(d, mask, source, s)) return;
    const PixelBox box = ToPixels(d);
    if (box.IsEmpty()) return;
    const KOpenGLTexture* texture = KOpenGLTexture::GetAlphaMask(mask, *this);
    if (!texture) return;
    SetBlending(mode);
    Color(color, KMulByte(KAlphaOf(color), opacity));
    TexturedQuad(texture->Name(), Vertex(box.left), Vertex(box.top), Vertex(box.right), Vertex(box.bottom),
                 AreaOf(s, texture->Width(), texture->Height()), GL_CLAMP_TO_EDGE);
  });
}

void KDrawerOpenGL::StretchBlt(const KRect& dest, const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBlt), [&] {
    CheckPainting();
    const PixelBox box = ToPixels(dest);
    if (box.IsEmpty() || !IsInside(source, bitmap)) return;
    KRect s = source;
    if (const KOpenGLTexture* texture = KOpenGLTexture::Get(bitmap, s, *this, false)) PaintTexture(*texture, box, s, opacity, mode);
  });
}

void KDrawerOpenGL::PaintMesh(const KTexturedMesh& mesh, const KBitmap& bitmap, const KRect& source, uint8_t opacity,
                              uint32_t mode) {
  if (!mesh.IsFinite()) return;
  KRect s = source;
  const KOpenGLTexture* texture = KOpenGLTexture::Get(bitmap, s, *this, false);
  if (!texture) return;
  // Mesh texels are the bitmap's; the texture may hold only the source rectangle.
  const double du = s.left - source.left, dv = s.top - source.top;
  const double tw = texture->Width(), th = texture->Height();
  SetBlending(mode);
  glEnable(GL_TEXTURE_2D);
  glBindTexture(GL_TEXTURE_2D, texture->Name());
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_S, GL_CLAMP_TO_EDGE);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_WRAP_T, GL_CLAMP_TO_EDGE);
  glColor4ub(255, 255, 255, opacity);
  glBegin(GL_TRIANGLES);
  for (const KTexturedVertex& v : mesh.vertices) {
    glTexCoord2d((v.u + du) / tw, (v.v + dv) / th);
    glVertex2d(v.x, v.y);
  }
  glEnd();
  glDisable(GL_TEXTURE_2D);
  ThrowOnError("The graphics card could not paint the image.");
}

void KDrawerOpenGL::RotatedBlt(KPointF centre, double angle, const KBitmap& bitmap, const KRect& source, uint8_t opacity,
                               uint32_t mode) {
  KGuard(Name(kOperationRotatedBlt), [&] {
    CheckPainting();
    if (!IsInside(source, bitmap)) return;
    PaintMesh(KTexturedMesh::Rotated(ToPixels(centre), angle, source, Scale()), bitmap, source, opacity, mode);
  });
}

void KDrawerOpenGL::StretchBltArc(KPointF centre, double innerRadius, double outerRadius, double startAngle, double endAngle,
                                  const KBitmap& bitmap, const KRect& source, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationStretchBltArc), [&] {
    CheckPainting();
    if (!IsInside(source, bitmap)) return;
    const double s = Scale();
    PaintMesh(KTexturedMesh::Arc(ToPixels(centre), innerRadius * s, outerRadius * s, startAngle, endAngle, source), bitmap,
              source, opacity, mode);
  });
}

void KDrawerOpenGL::FillRectangle(const KRect& rect, KColor color, uint8_t opacity, uint32_t mode) {
  KGuard(Name(kOperationFillRectangle), [&] {
    CheckPainting();
    const PixelBox box = ToPixels(rect);
    if (box.IsEmpty()) return;
    SetBlending(mode);
    Color(color, KMulByte(KAlphaOf(color), opacity));
    glRectd(Vertex(box.left), Vertex(box.top), Vertex(box.right), Vertex(box.bottom));
    ThrowOnError("The graphics card could not fill the rectangle.");
  });
}

void KDrawerOpenGL::FillRectangleGradient(const KRect& rect, KColor from, KColor to, KGradient direction, uint8_t opacity,
                                          uint32_t mode) {
  KGuard(Name(kOperationFillRectangleGradient), [&] {
    CheckPainting();
    const PixelBox box = ToPixels(rect);
    if (box.IsEmpty()) return;
    const bool vertical = direction == KGradient::Vertical;
    const uint32_t a0 = KMulByte(KAlphaOf(from), opacity), a1 = KMulByte(KAlphaOf(to), opacity);
    SetBlending(mode);
    glBegin(GL_QUADS);
    Color(from, a0), glVertex2d(Vertex(box.left), Vertex(box.top));
    vertical ? Color(from, a0) : Color(to, a1);
    glVertex2d(Vertex(box.right), Vertex(box.top));
    Color(to, a1), glVertex2d(Vertex(box.right), Vertex(box.bottom));
    vertical ? Color(to, a1) : Color(from, a0);
    glVertex2d(Vertex(box.left), Vertex(box.bottom));
    glEnd();
    ThrowOnError("The graphics card could not fill the rectangle.");
  });
}

void KDrawerOpenGL::PaintCoverage(const KCoverage& mask, KColor color, uint8_t opacity, uint32_t) {
  CheckPainting();
  // A texture of its own for each mask: refilling one texture that painted quads still wait
  // on would make the renderer finish them first.
  GLuint texture = 0;
  glGenTextures(1, &texture);
  glBindTexture(GL_TEXTURE_2D, texture);
  glPixelStorei(GL_UNPACK_ALIGNMENT, 1);
  glTexImage2D(GL_TEXTURE_2D, 0, GL_ALPHA8, mask.width, mask.height, 0, GL_ALPHA, GL_UNSIGNED_BYTE, mask.values.data());
  glPixelStorei(GL_UNPACK_ALIGNMENT, 4);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MIN_FILTER, GL_NEAREST);
  glTexParameteri(GL_TEXTURE_2D, GL_TEXTURE_MAG_FILTER, GL_NEAREST);
  glEnable(GL_BLEND);
  Color(color, KMulByte(KAlphaOf(color), opacity));
  try {
    TexturedQuad(texture, mask.x, mask.y, mask.x + mask.width, mask.y + mask.height, {0, 0, 1, 1}, GL_CLAMP_TO_EDGE);
  } catch (...) {
    glDeleteTextures(1, &texture);
    throw;
  }
  glDeleteTextures(1, &texture);
}
