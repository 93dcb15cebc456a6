#include "hosts/aax/KAAXGUI.h"

#include <cstdint>

#include "hosts/aax/KAudioPluginAAXAdapter.h"
#include "hosts/common/KHostGuard.h"

using namespace KAAX;

namespace {
// The kind of container window this system's editor windows live in.
#if defined(_WIN32)
constexpr ViewContainerType kNativeContainer = kViewContainerHWND;
#else
constexpr ViewContainerType kNativeContainer = kViewContainerX11Window;
#endif
}  // namespace

KAAXGUI::KAAXGUI(KAudioPluginAAXAdapter& effect) noexcept : effect_(&effect) { effect.AttachGUI(this); }

KAAXGUI::~KAAXGUI() { DetachEffect(); }

// The editor reaches the plug-in: it goes before the effect does.
void KAAXGUI::DetachEffect() noexcept {
  view_.reset();
  host_.reset();
  if (effect_) effect_->AttachGUI(nullptr);
  effect_ = nullptr;
}

Result KAAXGUI::Create(IViewContainer* container) {
  return KHostGuarded("KAAXGUI::Create", kErrorNullObject, [&] {
    if (!container) return kErrorNullObject;
    container_ = container;
    return kSuccess;
  });
}

// The editor, framed at its size, in the container's window when it holds one this platform
// knows (a container without a window still gets the size, for a host that shows it later).
Result KAAXGUI::CreateViewContents() {
  return KHostGuarded("KAAXGUI::CreateViewContents", kErrorNullObject, [&] {
    if (!container_ || !effect_) return kErrorNotInitialized;
    if (!view_) {
      host_ = std::make_unique<KInterfaceEditorHost>(*effect_);
      view_ = std::make_unique<KHostEditor>(effect_->GetPlugin(), host_.get());
    }
    if (container_->GetType() == kNativeContainer && !view_->IsOpen()) view_->Open(reinterpret_cast<uintptr_t>(container_->GetPtr()));
    return Resize(view_->PixelWidth(), view_->PixelHeight()) ? kSuccess : kErrorNotInitialized;
  });
}

Result KAAXGUI::DeleteViewContents() {
  return KHostGuarded("KAAXGUI::DeleteViewContents", kErrorNullObject, [&] {
    view_.reset();
    host_.reset();
    return kSuccess;
  });
}

Result KAAXGUI::TimerWakeup() {
  return KHostGuarded("KAAXGUI::TimerWakeup", kSuccess, [&] {
    if (view_) view_->Idle();
    return kSuccess;
  });
}

Result KAAXGUI::GetViewSize(int32_t* width, int32_t* height) const {
  if (!width || !height) return kErrorNullObject;
  *width = width_;
  *height = height_;
  return kSuccess;
}

bool KAAXGUI::Resize(int32_t width, int32_t height) noexcept {
  return KHostGuarded("KAAXGUI::Resize", false, [&] {
    if (!container_ || container_->SetViewSize(width, height) != kSuccess) return false;
    width_ = width;
    height_ = height;
    return true;
  });
}
