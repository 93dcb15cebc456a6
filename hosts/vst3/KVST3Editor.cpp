#include "hosts/vst3/KVST3Editor.h"

#include <cmath>
#include <cstring>

#include "hosts/common/KHostGuard.h"
#include "ui/editor/KEditor.h"
#include "ui/editor/KEditorFactory.h"

using namespace KVST3;

namespace {
// The host's window type the editor's window lives in, and the parent as its window class wants it.
#if defined(_WIN32)
constexpr const char* kNativeWindowType = kPlatformTypeHWND;
uintptr_t NativeParent(void* parent) noexcept { return reinterpret_cast<uintptr_t>(parent); }
#else
constexpr const char* kNativeWindowType = kPlatformTypeX11EmbedWindowID;
unsigned long NativeParent(void* parent) noexcept { return reinterpret_cast<unsigned long>(parent); }
#endif
}  // namespace

KAudioPluginVST3Adapter::KEditor::KEditor(KAudioPluginVST3Adapter& adapter)
    : adapter_(adapter), editor_(KMakeEditor(*adapter.plugin_, this, KStyle::Load(KStyle::UserSkinPath()))) {
  adapter_.AddRef();
}

KAudioPluginVST3Adapter::KEditor::~KEditor() {
  Detach();
  editor_.reset();
  adapter_.Release();
}

TResult KAudioPluginVST3Adapter::KEditor::QueryInterface(const char* iid, void** object) {
  if (!object) return kInvalidArgument;
  if (FUnknown::kIID.Is(iid) || IPlugView::kIID.Is(iid)) *object = static_cast<IPlugView*>(this);
  else if (IPlugViewContentScaleSupport::kIID.Is(iid)) *object = static_cast<IPlugViewContentScaleSupport*>(this);
  else if (ITimerHandler::kIID.Is(iid)) *object = static_cast<ITimerHandler*>(this);
  else if (IEventHandler::kIID.Is(iid)) *object = static_cast<IEventHandler*>(this);
  else {
    *object = nullptr;
    return kNoInterface;
  }
  AddRef();
  return kResultOk;
}

uint32_t KAudioPluginVST3Adapter::KEditor::AddRef() { return ++references_; }

uint32_t KAudioPluginVST3Adapter::KEditor::Release() {
  const uint32_t left = --references_;
  if (left == 0) delete this;
  return left;
}

TResult KAudioPluginVST3Adapter::KEditor::IsPlatformTypeSupported(FIDString type) {
  return type && std::strcmp(type, kNativeWindowType) == 0 ? kResultTrue : kResultFalse;
}

TResult KAudioPluginVST3Adapter::KEditor::Attached(void* parent, FIDString type) {
  return KHostGuarded("KAudioPluginVST3Adapter::KEditor::attached", kResultFalse, [&] {
    if (IsPlatformTypeSupported(type) != kResultTrue || !parent || window_) return kResultFalse;
    window_ = std::make_unique<KEditorWindow>(NativeParent(parent), *editor_);
    // Linux hosts hand their run loop out through the frame.
    runLoop_.Query(frame_);
    if (runLoop_) {
      runLoop_->RegisterEventHandler(this, window_->FileDescriptor());
      runLoop_->RegisterTimer(this, kTimerMilliseconds);
    }
    window_->PaintDirty();
    return kResultOk;
  });
}

void KAudioPluginVST3Adapter::KEditor::Detach() noexcept {
  if (runLoop_) {
    runLoop_->UnregisterTimer(this);
    runLoop_->UnregisterEventHandler(this);
    runLoop_.Reset();
  }
  window_.reset();
}

TResult KAudioPluginVST3Adapter::KEditor::Removed() {
  return KHostGuarded("KAudioPluginVST3Adapter::KEditor::removed", kResultFalse, [&] {
    Detach();
    return kResultOk;
  });
}

// Mouse and keys arrive as X events on the window itself.
TResult KAudioPluginVST3Adapter::KEditor::OnWheel(float) { return kResultFalse; }
TResult KAudioPluginVST3Adapter::KEditor::OnKeyDown(char16_t, int16_t, int16_t) { return kResultFalse; }
TResult KAudioPluginVST3Adapter::KEditor::OnKeyUp(char16_t, int16_t, int16_t) { return kResultFalse; }
TResult KAudioPluginVST3Adapter::KEditor::OnFocus(TBool) { return kResultOk; }

TResult KAudioPluginVST3Adapter::KEditor::GetSize(ViewRect* size) {
  if (!size) return kInvalidArgument;
  *size = {0, 0, editor_->PixelWidth(), editor_->PixelHeight()};
  return kResultOk;
}

double KAudioPluginVST3Adapter::KEditor::ScaleFor(int32_t width, int32_t height) const noexcept {
  double best = ::KEditor::kScales[0], distance = 1e300;
  for (double scale : ::KEditor::kScales) {
    const double d = std::fabs(editor_->Width() * scale - width) + std::fabs(editor_->Height() * scale - height);
    if (d < distance) {
      distance = d;
      best = scale;
    }
  }
  return best;
}

TResult KAudioPluginVST3Adapter::KEditor::OnSize(ViewRect* newSize) {
  return KHostGuarded("KAudioPluginVST3Adapter::KEditor::onSize", kResultFalse, [&] {
    if (!newSize) return kInvalidArgument;
    // The host set the size: take the scale that fits it without asking back.
    const double scale = ScaleFor(newSize->right - newSize->left, newSize->bottom - newSize->top);
    if (scale != editor_->Scale()) {
      settingSize_ = true;
      editor_->SetScale(scale);
      settingSize_ = false;
    }
    if (window_) window_->Resize();
    return kResultOk;
  });
}

TResult KAudioPluginVST3Adapter::KEditor::SetFrame(IPlugFrame* frame) {
  frame_ = frame;
  return kResultOk;
}

TResult KAudioPluginVST3Adapter::KEditor::CanResize() { return kResultTrue; }

TResult KAudioPluginVST3Adapter::KEditor::CheckSizeConstraint(ViewRect* rect) {
  if (!rect) return kInvalidArgument;
  // The editor comes in its scales' sizes only: the nearest one.
  const double scale = ScaleFor(rect->right - rect->left, rect->bottom - rect->top);
  rect->right = rect->left + static_cast<int32_t>(std::lround(editor_->Width() * scale));
  rect->bottom = rect->top + static_cast<int32_t>(std::lround(editor_->Height() * scale));
  return kResultTrue;
}

TResult KAudioPluginVST3Adapter::KEditor::SetContentScaleFactor(float factor) {
  return KHostGuarded("KAudioPluginVST3Adapter::KEditor::setContentScaleFactor", kResultFalse, [&] {
    double nearest = ::KEditor::kScales[0];
    for (double scale : ::KEditor::kScales)
      if (std::fabs(scale - factor) < std::fabs(nearest - factor)) nearest = scale;
    return editor_->SetScale(nearest) ? kResultOk : kResultFalse;
  });
}

void KAudioPluginVST3Adapter::KEditor::OnTimer() {
  KHostGuarded("KAudioPluginVST3Adapter::KEditor::onTimer", 0, [&] {
    if (window_) window_->Tick();
    return 0;
  });
}

void KAudioPluginVST3Adapter::KEditor::OnFDIsSet(int) {
  KHostGuarded("KAudioPluginVST3Adapter::KEditor::onFDIsSet", 0, [&] {
    if (window_) window_->ProcessEvents();
    return 0;
  });
}

void KAudioPluginVST3Adapter::KEditor::BeginEdit(int32_t parameter) { adapter_.BeginGesture(parameter); }
void KAudioPluginVST3Adapter::KEditor::PerformEdit(int32_t parameter, double normalized) {
  adapter_.SendAutomationValue(parameter, normalized);
}
void KAudioPluginVST3Adapter::KEditor::EndEdit(int32_t parameter) { adapter_.EndGesture(parameter); }

bool KAudioPluginVST3Adapter::KEditor::ResizeView(int32_t width, int32_t height) {
  // While the host sets the size itself there is nothing to ask; before the view is shown the
  // host reads the new size from GetSize.
  if (settingSize_ || !frame_) return settingSize_ || !window_;
  ViewRect rect{0, 0, width, height};
  return frame_->ResizeView(this, &rect) == kResultOk;
}
