#include "hosts/common/KHostEditor.h"

#include "core/KAudioPluginHost.h"
#include "ui/editor/KEditor.h"
#include "ui/editor/KEditorFactory.h"

namespace {
// Beyond this a window above the editor's is the host's own, not a frame around it.
constexpr int32_t kLargestFrame = 80;
}  // namespace

KHostEditor::KHostEditor(KAudioPlugin& plugin, KEditorHost* host)
    : editor_(KMakeEditor(plugin, host, KStyle::Load(KStyle::UserSkinPath()))) {}

KHostEditor::~KHostEditor() { Close(); }

int32_t KHostEditor::PixelWidth() const noexcept { return editor_->PixelWidth(); }
int32_t KHostEditor::PixelHeight() const noexcept { return editor_->PixelHeight(); }

bool KHostEditor::Open(uintptr_t parent) {
  if (window_ || parent == 0) return false;
  window_ = std::make_unique<KEditorWindow>(parent, *editor_);
  shownWidth_ = editor_->PixelWidth();
  shownHeight_ = editor_->PixelHeight();
  window_->PaintDirty();
  return true;
}

void KHostEditor::Close() noexcept { window_.reset(); }

void KHostEditor::Idle() {
  if (!window_) return;
  // A scale the host agreed to while the window showed the old one.
  if (editor_->PixelWidth() != shownWidth_ || editor_->PixelHeight() != shownHeight_) {
    shownWidth_ = editor_->PixelWidth();
    shownHeight_ = editor_->PixelHeight();
    window_->Resize();
  }
  window_->Tick();
}

void KHostEditor::GrowHostWindows(int32_t width, int32_t height) {
  if (window_) window_->GrowAncestors(width, height, kLargestFrame);
}

void KInterfaceEditorHost::BeginEdit(int32_t parameter) { host_.BeginGesture(parameter); }
void KInterfaceEditorHost::PerformEdit(int32_t parameter, double normalized) { host_.SendAutomationValue(parameter, normalized); }
void KInterfaceEditorHost::EndEdit(int32_t parameter) { host_.EndGesture(parameter); }
bool KInterfaceEditorHost::ResizeView(int32_t width, int32_t height) { return host_.ResizeEditor(width, height); }
