#pragma once

#include <cstdint>
#include <mutex>

#include "hosts/vst3/KVST3Controller.h"
#include "hosts/vst3/KVST3Util.h"
#include "hosts/vst3/KVST3View.h"
#include "kernel/KString.h"

class KAudioPluginInterface;

namespace KVST3 {

// What the adapter knows of its host: the application's name, the component handler that
// takes edits and restart requests, and the host's run loop, on which the plug-in interface's
// idle (ending quiet gestures, reporting a changed latency) runs every kIdleMilliseconds.
// User-interface thread only.
class KHostContext {
public:
  static constexpr uint64_t kIdleMilliseconds = 50;

  explicit KHostContext(KAudioPluginInterface& idleTarget) noexcept : timer_(idleTarget) {}
  KHostContext(const KHostContext&) = delete;
  KHostContext& operator=(const KHostContext&) = delete;
  ~KHostContext() { Detach(); }

  // At initialize: the host's name, and its run loop when the host context offers one.
  void Attach(FUnknown* context);
  // At terminate: lets go of everything the host lent.
  void Detach() noexcept;
  const KString& HostName() const noexcept { return hostName_; }

  void SetComponentHandler(IComponentHandler* handler) noexcept;
  // The handler's calls; without a handler they do nothing and answer false.
  bool BeginEdit(ParamID id) noexcept;
  bool PerformEdit(ParamID id, double normalized) noexcept;
  bool EndEdit(ParamID id) noexcept;
  bool Restart(int32_t flags) noexcept;
  // The whole of program list `listId` changed; false when the host has no unit handler.
  bool ProgramListChanged(int32_t listId) noexcept;

private:
  // Lives inside the context; the run loop's references are not counted.
  class KIdleTimer final : public ITimerHandler {
  public:
    explicit KIdleTimer(KAudioPluginInterface& target) noexcept : target_(target) {}
    TResult QueryInterface(const char* iid, void** object) override;
    uint32_t AddRef() override { return 1; }
    uint32_t Release() override { return 1; }
    void OnTimer() override;

  private:
    KAudioPluginInterface& target_;
  };

  void StopTimer() noexcept;

  KString hostName_;
  KShared<IComponentHandler> handler_;
  KShared<IUnitHandler> unitHandler_;  // the handler's, when it has one
  KShared<IRunLoop> runLoop_;
  KIdleTimer timer_;
  bool timerRegistered_ = false;
};

}  // namespace KVST3
