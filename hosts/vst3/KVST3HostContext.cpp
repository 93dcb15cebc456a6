#include "hosts/vst3/KVST3HostContext.h"

#include "hosts/KAudioPluginInterface.h"
#include "hosts/common/KHostGuard.h"

namespace KVST3 {

void KHostContext::Attach(FUnknown* context) {
  StopTimer();
  KShared<IHostApplication> application;
  application.Query(context);
  String128 name = {};
  if (application && application->GetName(name) == kResultOk) hostName_ = KTextOf(name, 128);
  runLoop_.Query(context);
  if (runLoop_) timerRegistered_ = runLoop_->RegisterTimer(&timer_, kIdleMilliseconds) == kResultOk;
}

void KHostContext::StopTimer() noexcept {
  if (runLoop_ && timerRegistered_) runLoop_->UnregisterTimer(&timer_);
  timerRegistered_ = false;
  runLoop_.Reset();
}

void KHostContext::Detach() noexcept {
  StopTimer();
  handler_.Reset();
  unitHandler_.Reset();
}

void KHostContext::SetComponentHandler(IComponentHandler* handler) noexcept {
  handler_.Reset(handler);
  unitHandler_.Query(handler);
}

bool KHostContext::BeginEdit(ParamID id) noexcept { return handler_ && handler_->BeginEdit(id) == kResultOk; }

bool KHostContext::PerformEdit(ParamID id, double normalized) noexcept {
  return handler_ && handler_->PerformEdit(id, normalized) == kResultOk;
}

bool KHostContext::EndEdit(ParamID id) noexcept { return handler_ && handler_->EndEdit(id) == kResultOk; }

bool KHostContext::Restart(int32_t flags) noexcept { return handler_ && handler_->RestartComponent(flags) == kResultOk; }

bool KHostContext::ProgramListChanged(int32_t listId) noexcept {
  return unitHandler_ && unitHandler_->NotifyProgramListChange(listId, IUnitHandler::kAllProgramInvalid) == kResultOk;
}

TResult KHostContext::KIdleTimer::QueryInterface(const char* iid, void** object) {
  if (!object) return kInvalidArgument;
  *object = FUnknown::kIID.Is(iid) || ITimerHandler::kIID.Is(iid) ? this : nullptr;
  return *object ? kResultOk : kNoInterface;
}

void KHostContext::KIdleTimer::OnTimer() {
  KHostGuarded("KAudioPluginVST3Adapter::OnTimer", 0, [&] {
    target_.Idle();
    return 0;
  });
}

}  // namespace KVST3
