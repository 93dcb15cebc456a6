#pragma once

#include <cstdint>
#include <memory>

#include "hosts/common/KHostEditor.h"
#include "hosts/vst2/KAudioPluginVSTAdapter.h"

// The plug-in's editor in a VST 2 host's window: the host hands effEditOpen the window to embed
// into (an X11 window on Linux, an HWND on Windows) and drives everything else by its effEditIdle
// calls (the editor's timers, the window's events, gestures that went quiet). The editor itself is made on the host's first
// question about it, so that a host that never opens it (a scanner) never builds it.
//
// A new size (the editor's size menu) goes to the host with sizeWindow; a host that refuses has
// its windows above the editor's grown by the editor. One resize at a time, and only while the
// window is open.
class KAudioPluginVSTAdapter::KEditor final : public KVST2::KEffectEditor {
public:
  explicit KEditor(KAudioPluginVSTAdapter& adapter) noexcept : adapter_(adapter), host_(adapter) {}

  bool getRect(KVST2::ERect** rect) override;
  bool open(void* window) override;
  void close() override;
  void idle() override;
  int32_t onKeyDown(int32_t character, int32_t virtualKey, int32_t modifiers) override;
  int32_t onKeyUp(int32_t character, int32_t virtualKey, int32_t modifiers) override;

  // The adapter's editor-resize slot.
  bool Resize(int32_t width, int32_t height);
  // A key the host passed on, given to the editor as if it came from its window; answers whether
  // the editor took it.
  bool ProcessVSTKeyDown(int32_t character, int32_t virtualKey, int32_t modifiers);
  // The editor, made on first use.
  KHostEditor& View();

private:
  KAudioPluginVSTAdapter& adapter_;
  KInterfaceEditorHost host_;
  std::unique_ptr<KHostEditor> view_;
  KVST2::ERect rect_{};
  int32_t resizing_ = 0;  // depth of resizes under way
};
