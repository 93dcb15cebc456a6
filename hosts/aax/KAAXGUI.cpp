#include "hosts/aax/KAAXGUI.h"

#include "hosts/aax/KAudioPluginAAXAdapter.h"
#include "hosts/common/KHostGuard.h"

using namespace KAAX;

KAAXGUI::KAAXGUI(KAudioPluginAAXAdapter& effect) noexcept : effect_(&effect) { effect.AttachGUI(this); }

KAAXGUI::~KAAXGUI() {
  if (effect_) effect_->AttachGUI(nullptr);
}

Result KAAXGUI::Create(IViewContainer* container) {
  return KHostGuarded("KAAXGUI::Create", kErrorNullObject, [&] {
    if (!container) return kErrorNullObject;
    container_ = container;
    return kSuccess;
  });
}

// The empty view of the class comment: nothing to build yet but the record that it exists.
Result KAAXGUI::CreateViewContents() {
  return KHostGuarded("KAAXGUI::CreateViewContents", kErrorNullObject, [&] {
    if (!container_ || !effect_) return kErrorNotInitialized;
    hasContents_ = true;
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
