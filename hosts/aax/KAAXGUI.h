#pragma once

#include <cstdint>

#include "hosts/aax/KAAXBase.h"
#include "hosts/aax/KAAXLiveObject.h"
#include "kernel/KExport.h"

class KAudioPluginAAXAdapter;

// The GUI of an AAX effect: the host makes it for one effect-parameters object, gives it a
// view container (Create), then asks it for its contents (CreateViewContents).
//
// The view is empty for now: the editors that fill it are still being built. It has no size
// (0 x 0) and draws nothing, so a host shows the effect with its own generic controls; the
// frame and the editor's resize path through the view container are in place for the editor
// to come. Every method is guarded as the adapter's are ("KAAXGUI::<Method>").
class TORVANE_API KAAXGUI {
public:
  explicit KAAXGUI(KAudioPluginAAXAdapter& effect) noexcept;
  KAAXGUI(const KAAXGUI&) = delete;
  KAAXGUI& operator=(const KAAXGUI&) = delete;
  virtual ~KAAXGUI();

  virtual KAAX::Result Create(KAAX::IViewContainer* container);
  virtual KAAX::Result CreateViewContents();
  // The view's size as the host should frame it.
  virtual KAAX::Result GetViewSize(int32_t* width, int32_t* height) const;
  // The host's last reference: the GUI deletes itself (in the library that made it).
  virtual void Release() noexcept { delete this; }

  // The editor's new size to the host's frame; false without a container or when refused.
  bool Resize(int32_t width, int32_t height) noexcept;
  // The effect went away first (its host closed it): the GUI no longer reaches it.
  void DetachEffect() noexcept { effect_ = nullptr; }
  bool HasContents() const noexcept { return hasContents_; }

private:
  KAudioPluginAAXAdapter* effect_;
  KAAX::IViewContainer* container_ = nullptr;
  bool hasContents_ = false;
  int32_t width_ = 0;
  int32_t height_ = 0;
  KAAXLiveObject live_;
};
