#pragma once

#include <cstdint>

// What an editor asks of the host that shows it: the three steps of an edit gesture on a
// parameter, and a new size for its window. The host layer implements it on the plug-in's host
// interface; without a host (a snapshot, a test) the editor runs with none.
class KEditorHost {
public:
  virtual ~KEditorHost() = default;
  virtual void BeginEdit(int32_t parameter) = 0;
  virtual void PerformEdit(int32_t parameter, double normalized) = 0;
  virtual void EndEdit(int32_t parameter) = 0;
  // Answers whether the host resized the editor's frame to width × height pixels.
  virtual bool ResizeView(int32_t width, int32_t height) = 0;
};
