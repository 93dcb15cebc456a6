#pragma once

#include <cstdint>
#include <memory>

// An OpenGL drawing context (compatibility profile) and the surface it paints. Editor windows
// will bring their own; the off-screen one needs no display, so tests and servers can paint.
class KOpenGLContext {
public:
  KOpenGLContext() = default;
  KOpenGLContext(const KOpenGLContext&) = delete;
  KOpenGLContext& operator=(const KOpenGLContext&) = delete;
  virtual ~KOpenGLContext();

  // A context painting width × height pixels without any display (on Linux an EGL context of
  // Mesa's software renderer when there is no GPU). Throws KException when OpenGL is missing.
  static std::unique_ptr<KOpenGLContext> CreateOffscreen(int32_t width, int32_t height);

  virtual int32_t Width() const noexcept = 0;
  virtual int32_t Height() const noexcept = 0;
  // Makes the context current on the calling thread; false when the system refuses.
  virtual bool MakeCurrent() noexcept = 0;
  // Leaves the calling thread without a current context.
  virtual void Release() noexcept = 0;
};
