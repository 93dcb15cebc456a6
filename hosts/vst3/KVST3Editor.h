#pragma once

#include <atomic>
#include <memory>

#include "hosts/vst3/KAudioPluginVST3Adapter.h"
#include "hosts/vst3/KVST3Util.h"
#include "hosts/vst3/KVST3View.h"
#include "ui/controls/KEditorHost.h"
#include "ui/platform/KEditorWindow.h"

class KEditor;

// The plug-in's editor as a VST 3 view: an X11 child window of the host's ("X11EmbedWindowID"),
// or on Windows a child of the host's "HWND" fed by the host's message loop. On Linux it is
// served by the host's run loop (its timer ticks the editor, its event handler reads the
// window's events), never by a thread of ours. Edits go to the host's component handler as
// begin / perform / end; a new size is asked of the host's frame. The view keeps the adapter
// alive while the host holds it.
class KAudioPluginVST3Adapter::KEditor final : public KVST3::IPlugView,
                                               public KVST3::IPlugViewContentScaleSupport,
                                               public KVST3::ITimerHandler,
                                               public KVST3::IEventHandler,
                                               public KEditorHost {
public:
  static constexpr uint64_t kTimerMilliseconds = 33;

  explicit KEditor(KAudioPluginVST3Adapter& adapter);
  ~KEditor();
  ::KEditor& Editor() noexcept { return *editor_; }
  KEditorWindow* Window() noexcept { return window_.get(); }

  // ---- FUnknown
  TResult QueryInterface(const char* iid, void** object) override;
  uint32_t AddRef() override;
  uint32_t Release() override;

  // ---- IPlugView
  TResult IsPlatformTypeSupported(KVST3::FIDString type) override;
  TResult Attached(void* parent, KVST3::FIDString type) override;
  TResult Removed() override;
  TResult OnWheel(float distance) override;
  TResult OnKeyDown(char16_t key, int16_t keyCode, int16_t modifiers) override;
  TResult OnKeyUp(char16_t key, int16_t keyCode, int16_t modifiers) override;
  TResult GetSize(KVST3::ViewRect* size) override;
  TResult OnSize(KVST3::ViewRect* newSize) override;
  TResult OnFocus(KVST3::TBool state) override;
  TResult SetFrame(KVST3::IPlugFrame* frame) override;
  TResult CanResize() override;
  TResult CheckSizeConstraint(KVST3::ViewRect* rect) override;
  // ---- IPlugViewContentScaleSupport
  TResult SetContentScaleFactor(float factor) override;
  // ---- ITimerHandler, IEventHandler
  void OnTimer() override;
  void OnFDIsSet(int fileDescriptor) override;

  // ---- KEditorHost
  void BeginEdit(int32_t parameter) override;
  void PerformEdit(int32_t parameter, double normalized) override;
  void EndEdit(int32_t parameter) override;
  bool ResizeView(int32_t width, int32_t height) override;

private:
  // The editor's scale whose size lies nearest to width × height pixels.
  double ScaleFor(int32_t width, int32_t height) const noexcept;
  void Detach() noexcept;

  KAudioPluginVST3Adapter& adapter_;
  std::atomic<uint32_t> references_{1};
  std::unique_ptr<::KEditor> editor_;
  std::unique_ptr<KEditorWindow> window_;
  KVST3::IPlugFrame* frame_ = nullptr;  // the host's, not counted: it outlives the attachment
  KVST3::KShared<KVST3::IRunLoop> runLoop_;
  bool settingSize_ = false;  // inside OnSize: the host's own size change
};
