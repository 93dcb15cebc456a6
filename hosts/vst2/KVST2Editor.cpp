#include "hosts/vst2/KVST2Editor.h"

#include <cstdint>

#include "hosts/common/KHostGuard.h"
#include "ui/controls/KControlEvents.h"
#include "ui/editor/KEditor.h"

using namespace KVST2;

namespace {

int32_t KeyOf(int32_t character, int32_t virtualKey) noexcept {
  switch (virtualKey) {
    case VKEY_BACK: return kKeyBackspace;
    case VKEY_TAB: return kKeyTab;
    case VKEY_RETURN: case VKEY_ENTER: return kKeyReturn;
    case VKEY_ESCAPE: return kKeyEscape;
    case VKEY_SPACE: return ' ';
    case VKEY_END: return kKeyEnd;
    case VKEY_HOME: return kKeyHome;
    case VKEY_LEFT: return kKeyLeft;
    case VKEY_UP: return kKeyUp;
    case VKEY_RIGHT: return kKeyRight;
    case VKEY_DOWN: return kKeyDown;
    case VKEY_DELETE: return kKeyDelete;
    case VKEY_F1: return kKeyF1;
    default: break;
  }
  return virtualKey == 0 && character >= 0x20 && character < 0x7F ? character : kKeyNone;
}

uint32_t ModifiersOf(int32_t modifiers) noexcept {
  return ((modifiers & MODIFIER_SHIFT) ? kModShift : 0) | ((modifiers & (MODIFIER_COMMAND | MODIFIER_CONTROL)) ? kModControl : 0) |
         ((modifiers & MODIFIER_ALTERNATE) ? kModAlt : 0);
}

}  // namespace

KHostEditor& KAudioPluginVSTAdapter::KEditor::View() {
  if (!view_) view_ = std::make_unique<KHostEditor>(*adapter_.plugin_, &host_);
  return *view_;
}

bool KAudioPluginVSTAdapter::KEditor::getRect(ERect** rect) {
  return KHostGuarded("KAudioPluginVSTAdapter::KEditor::getRect", false, [&] {
    if (!rect) return false;
    rect_ = ERect{0, 0, static_cast<int16_t>(View().PixelHeight()), static_cast<int16_t>(View().PixelWidth())};
    *rect = &rect_;
    return true;
  });
}

bool KAudioPluginVSTAdapter::KEditor::open(void* window) {
  return KHostGuarded("KAudioPluginVSTAdapter::KEditor::open", false,
                      [&] { return View().Open(reinterpret_cast<uintptr_t>(window)); });
}

void KAudioPluginVSTAdapter::KEditor::close() {
  KHostGuarded("KAudioPluginVSTAdapter::KEditor::close", 0, [&] {
    if (view_) view_->Close();
    return 0;
  });
}

void KAudioPluginVSTAdapter::KEditor::idle() {
  KHostGuarded("KAudioPluginVSTAdapter::KEditor::idle", 0, [&] {
    adapter_.Idle();
    if (view_) view_->Idle();
    return 0;
  });
}

int32_t KAudioPluginVSTAdapter::KEditor::onKeyDown(int32_t character, int32_t virtualKey, int32_t modifiers) {
  return KHostGuarded("KAudioPluginVSTAdapter::KEditor::onKeyDown", 0,
                      [&] { return ProcessVSTKeyDown(character, virtualKey, modifiers) ? 1 : 0; });
}

// The release of a key the editor takes is the editor's too, though it does nothing with it.
int32_t KAudioPluginVSTAdapter::KEditor::onKeyUp(int32_t character, int32_t virtualKey, int32_t) {
  return view_ && view_->IsOpen() && KeyOf(character, virtualKey) != kKeyNone ? 1 : 0;
}

bool KAudioPluginVSTAdapter::KEditor::ProcessVSTKeyDown(int32_t character, int32_t virtualKey, int32_t modifiers) {
  const int32_t key = KeyOf(character, virtualKey);
  if (!view_ || !view_->IsOpen() || key == kKeyNone) return false;
  return view_->Editor().Tree().Key({key, ModifiersOf(modifiers)});
}

bool KAudioPluginVSTAdapter::KEditor::Resize(int32_t width, int32_t height) {
  if (resizing_ > 0 || !view_ || !view_->IsOpen()) return false;
  ++resizing_;
  struct Leave {
    int32_t& depth;
    ~Leave() { --depth; }
  } leave{resizing_};
  if (!adapter_.sizeWindow(width, height)) view_->GrowHostWindows(width, height);
  return true;
}
