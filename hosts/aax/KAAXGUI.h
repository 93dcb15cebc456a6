#pragma once

#include <cstdint>
#include <memory>

#include "hosts/aax/KAAXBase.h"
#include "hosts/aax/KAAXLiveObject.h"
#include "hosts/common/KHostEditor.h"
#include "kernel/KExport.h"

class KAudioPluginAAXAdapter;

// The GUI of an AAX effect: the host makes it for one effect-parameters object, gives it a
// view container (Create), then asks it for its contents (CreateViewContents): the plug-in's
// editor, embedded into the container's window (an HWND on Windows, an X11 window on Linux)
// and framed at the editor's size. The host's periodic TimerWakeup runs the editor's timers and
// window; DeleteViewContents gives the window back. Edits reach the host as the adapter's touch, set and release requests, and the editor's
// new sizes go to the container.
//
// Every method is guarded as the adapter's are ("KAAXGUI::<Method>").
class TORVANE_API KAAXGUI {
public:
  explicit KAAXGUI(KAudioPluginAAXAdapter& effect) noexcept;
  KAAXGUI(const KAAXGUI&) = delete;
  KAAXGUI& operator=(const KAAXGUI&) = delete;
  virtual ~KAAXGUI();

  virtual KAAX::Result Create(KAAX::IViewContainer* container);
  virtual KAAX::Result CreateViewContents();
  virtual KAAX::Result DeleteViewContents();
  virtual KAAX::Result TimerWakeup();
  // The view's size as the host should frame it (0 x 0 before its contents exist).
  virtual KAAX::Result GetViewSize(int32_t* width, int32_t* height) const;
  // The host's last reference: the GUI deletes itself (in the library that made it).
  virtual void Release() noexcept { delete this; }

  // The editor's new size to the host's frame; false without a container or when refused.
  bool Resize(int32_t width, int32_t height) noexcept;
  // The effect went away first (its host closed it): the GUI no longer reaches it.
  void DetachEffect() noexcept;
  bool HasContents() const noexcept { return view_ != nullptr; }
  // The editor, while the contents exist.
  KHostEditor* View() noexcept { return view_.get(); }

private:
  KAudioPluginAAXAdapter* effect_;
  KAAX::IViewContainer* container_ = nullptr;
  std::unique_ptr<KInterfaceEditorHost> host_;
  std::unique_ptr<KHostEditor> view_;
  int32_t width_ = 0;
  int32_t height_ = 0;
  KAAXLiveObject live_;
};
