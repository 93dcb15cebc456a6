#pragma once

// Editor windows and the host's run loop (on Linux a plug-in has no loop of its own: timers
// and file descriptors are run by the host, reached through the host context or the frame).

#include "hosts/vst3/KVST3Base.h"

namespace KVST3 {

struct ViewRect {
  int32_t left;
  int32_t top;
  int32_t right;
  int32_t bottom;
};
static_assert(sizeof(ViewRect) == 16);

// Window types a view may be attached to.
inline constexpr const char* kPlatformTypeHWND = "HWND";
inline constexpr const char* kPlatformTypeX11EmbedWindowID = "X11EmbedWindowID";

class IPlugFrame;

class IPlugView : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x5BC32507, 0xD06049EA, 0xA6151B52, 0x2B755B29);
  virtual TResult IsPlatformTypeSupported(FIDString type) = 0;
  virtual TResult Attached(void* parent, FIDString type) = 0;
  virtual TResult Removed() = 0;
  virtual TResult OnWheel(float distance) = 0;
  virtual TResult OnKeyDown(char16_t key, int16_t keyCode, int16_t modifiers) = 0;
  virtual TResult OnKeyUp(char16_t key, int16_t keyCode, int16_t modifiers) = 0;
  virtual TResult GetSize(ViewRect* size) = 0;
  virtual TResult OnSize(ViewRect* newSize) = 0;
  virtual TResult OnFocus(TBool state) = 0;
  virtual TResult SetFrame(IPlugFrame* frame) = 0;
  virtual TResult CanResize() = 0;
  virtual TResult CheckSizeConstraint(ViewRect* rect) = 0;

protected:
  ~IPlugView() = default;
};

class IPlugFrame : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x367FAF01, 0xAFA94693, 0x8D4DA2A0, 0xED0882A3);
  virtual TResult ResizeView(IPlugView* view, ViewRect* newSize) = 0;

protected:
  ~IPlugFrame() = default;
};

// The host's display scale for a view (1 for 100 %, 2 for 200 %).
class IPlugViewContentScaleSupport : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x65ED9690, 0x8AC44525, 0x8AADEF7A, 0x72EA703F);
  virtual TResult SetContentScaleFactor(float factor) = 0;

protected:
  ~IPlugViewContentScaleSupport() = default;
};

class IEventHandler : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x561E65C9, 0x13A0496F, 0x813A2C35, 0x654D7983);
  virtual void OnFDIsSet(int fileDescriptor) = 0;

protected:
  ~IEventHandler() = default;
};

class ITimerHandler : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x10BDD94F, 0x41424774, 0x821FAD8F, 0xECA72CA9);
  virtual void OnTimer() = 0;

protected:
  ~ITimerHandler() = default;
};

class IRunLoop : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x18C35366, 0x97764F1A, 0x9C5B8385, 0x7A871389);
  virtual TResult RegisterEventHandler(IEventHandler* handler, int fileDescriptor) = 0;
  virtual TResult UnregisterEventHandler(IEventHandler* handler) = 0;
  virtual TResult RegisterTimer(ITimerHandler* handler, uint64_t milliseconds) = 0;
  virtual TResult UnregisterTimer(ITimerHandler* handler) = 0;

protected:
  ~IRunLoop() = default;
};

}  // namespace KVST3
