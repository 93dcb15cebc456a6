#pragma once

#include <cstdint>
#include <memory>

#include "kernel/KExport.h"
#include "ui/controls/KEditorHost.h"
#include "ui/platform/KEditorWindow.h"

class KAudioPlugin;
class KAudioPluginHost;
class KEditor;

// The plug-in's editor as the host formats without a run loop of their own show it (VST 2, AAX,
// the LV2 UI): made once, embedded into a host's window (X11, or an HWND on Windows) on Open,
// driven only by the host's
// idle calls, given back on Close and opened again at will. Edits go to the `host` the format
// glue gives (by default the plug-in's host interface: begin, send, end gesture and the
// editor-resize slot); a host that takes the new size has the window follow it at the next idle.
class TORVANE_API KHostEditor {
public:
  // `host` may be null: edits and resizing go nowhere.
  KHostEditor(KAudioPlugin& plugin, KEditorHost* host);
  ~KHostEditor();
  KHostEditor(const KHostEditor&) = delete;
  KHostEditor& operator=(const KHostEditor&) = delete;

  KEditor& Editor() noexcept { return *editor_; }
  KEditorWindow* Window() noexcept { return window_.get(); }
  bool IsOpen() const noexcept { return window_ != nullptr; }
  // The editor's size in pixels at its present scale.
  int32_t PixelWidth() const noexcept;
  int32_t PixelHeight() const noexcept;

  // A child window of the host's window `parent` (an X11 window, or an HWND on Windows), painted
  // at once; false when one is open already or `parent` is 0. KException when there is no
  // display or the system refuses the window.
  bool Open(uintptr_t parent);
  void Close() noexcept;
  // The host's idle call: the editor's timers, the window's events, the size the host took.
  void Idle();
  // Grows the windows above the editor's to width × height pixels, for hosts that refuse to.
  void GrowHostWindows(int32_t width, int32_t height);

private:
  std::unique_ptr<KEditor> editor_;
  std::unique_ptr<KEditorWindow> window_;
  int32_t shownWidth_ = 0;
  int32_t shownHeight_ = 0;
};

// Edits of an editor as the plug-in's own sends: the host interface's gesture slots, and its
// editor-resize slot for a new size.
class TORVANE_API KInterfaceEditorHost final : public KEditorHost {
public:
  explicit KInterfaceEditorHost(KAudioPluginHost& host) noexcept : host_(host) {}
  void BeginEdit(int32_t parameter) override;
  void PerformEdit(int32_t parameter, double normalized) override;
  void EndEdit(int32_t parameter) override;
  bool ResizeView(int32_t width, int32_t height) override;

private:
  KAudioPluginHost& host_;
};
