#pragma once

#include <epoxy/egl.h>

#include "kernel/KException.h"

// The EGL objects behind one OpenGL context: its display, surface and context. Close destroys
// the context and the surface, and ends the display when it is this context's alone.
struct KEGLObjects {
  EGLDisplay display = EGL_NO_DISPLAY;
  EGLSurface surface = EGL_NO_SURFACE;
  EGLContext context = EGL_NO_CONTEXT;
  bool ownsDisplay = false;

  KEGLObjects() = default;
  KEGLObjects(const KEGLObjects&) = delete;
  KEGLObjects& operator=(const KEGLObjects&) = delete;
  ~KEGLObjects() { Close(); }

  bool MakeCurrent() noexcept { return eglMakeCurrent(display, surface, surface, context) == EGL_TRUE; }
  void Release() noexcept { eglMakeCurrent(display, EGL_NO_SURFACE, EGL_NO_SURFACE, EGL_NO_CONTEXT); }
  void Close() noexcept {
    if (display == EGL_NO_DISPLAY) return;
    Release();
    if (context != EGL_NO_CONTEXT) eglDestroyContext(display, context);
    if (surface != EGL_NO_SURFACE) eglDestroySurface(display, surface);
    if (ownsDisplay) eglTerminate(display);
    context = EGL_NO_CONTEXT;
    surface = EGL_NO_SURFACE;
    display = EGL_NO_DISPLAY;
  }
  // Closes what was made so far and reports that OpenGL cannot paint here.
  [[noreturn]] void Fail() {
    Close();
    throw KException("OpenGL is not available on this system.");
  }
};
