#pragma once

#include "ui/KDrawerToKBitmap.h"
#include "ui/platform/KWindowSurface.h"

// The software drawer into a back buffer that keeps the picture between paints; each system's
// surface puts the changed pixels on its window in Show.
class KSoftwareSurface : public KWindowSurface {
public:
  KSoftwareSurface(int32_t width, int32_t height, double scale) : backBuffer_(width, height), drawer_(backBuffer_, scale) {}

  KDrawer& Drawer() noexcept override { return drawer_; }
  bool IsOpenGL() const noexcept override { return false; }
  bool KeepsPicture() const noexcept override { return true; }
  void Begin() override {}
  KBitmap Picture() override { return backBuffer_; }

protected:
  KBitmap backBuffer_;
  KDrawerToKBitmap drawer_;
};
