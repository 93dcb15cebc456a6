#pragma once

// The controller side: parameters and their texts, the host's handler for edits and restarts,
// MIDI controller mapping, units with their program lists, and the channel context.

#include "hosts/vst3/KVST3Processing.h"

namespace KVST3 {

class IPlugView;

struct ParameterInfo {
  enum Flags : int32_t {
    kNoFlags = 0,
    kCanAutomate = 1 << 0,
    kIsReadOnly = 1 << 1,
    kIsWrapAround = 1 << 2,
    kIsList = 1 << 3,
    kIsHidden = 1 << 4,
    kIsProgramChange = 1 << 15,
    kIsBypass = 1 << 16,
  };
  ParamID id;
  String128 title;
  String128 shortTitle;
  String128 units;
  int32_t stepCount;
  ParamValue defaultNormalizedValue;
  int32_t unitId;
  int32_t flags;
};
static_assert(sizeof(ParameterInfo) == 792);

// Flags of IComponentHandler::RestartComponent.
enum RestartFlags : int32_t {
  kReloadComponent = 1 << 0,
  kIoChanged = 1 << 1,
  kParamValuesChanged = 1 << 2,
  kLatencyChanged = 1 << 3,
  kParamTitlesChanged = 1 << 4,
  kMidiCCAssignmentChanged = 1 << 5,
};

class IComponentHandler : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x93A0BEA3, 0x0BD045DB, 0x8E890B0C, 0xC1E46AC6);
  virtual TResult BeginEdit(ParamID id) = 0;
  virtual TResult PerformEdit(ParamID id, ParamValue normalized) = 0;
  virtual TResult EndEdit(ParamID id) = 0;
  virtual TResult RestartComponent(int32_t flags) = 0;

protected:
  ~IComponentHandler() = default;
};

class IEditController : public IPluginBase {
public:
  static constexpr KUID kIID = KUID::FromWords(0xDCD7BBE3, 0x7742448D, 0xA874AACC, 0x979C759E);
  virtual TResult SetComponentState(IBStream* state) = 0;
  virtual TResult SetState(IBStream* state) = 0;
  virtual TResult GetState(IBStream* state) = 0;
  virtual int32_t GetParameterCount() = 0;
  virtual TResult GetParameterInfo(int32_t index, ParameterInfo& info) = 0;
  virtual TResult GetParamStringByValue(ParamID id, ParamValue normalized, String128 text) = 0;
  virtual TResult GetParamValueByString(ParamID id, TChar* text, ParamValue& normalized) = 0;
  virtual ParamValue NormalizedParamToPlain(ParamID id, ParamValue normalized) = 0;
  virtual ParamValue PlainParamToNormalized(ParamID id, ParamValue plain) = 0;
  virtual ParamValue GetParamNormalized(ParamID id) = 0;
  virtual TResult SetParamNormalized(ParamID id, ParamValue normalized) = 0;
  virtual TResult SetComponentHandler(IComponentHandler* handler) = 0;
  virtual IPlugView* CreateView(FIDString name) = 0;

protected:
  ~IEditController() = default;
};

class IEditController2 : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x7F4EFE59, 0xF3204967, 0xAC27A3AE, 0xAFB63038);
  // How the host wants knobs dragged.
  enum KnobMode : int32_t { kCircularMode = 0, kRelativeCircularMode = 1, kLinearMode = 2 };
  virtual TResult SetKnobMode(int32_t mode) = 0;
  virtual TResult OpenHelp(TBool onlyCheck) = 0;
  virtual TResult OpenAboutBox(TBool onlyCheck) = 0;

protected:
  ~IEditController2() = default;
};

// Which parameter a MIDI controller of an event bus moves. Controller numbers 0-127, then
// channel aftertouch (128) and pitch bend (129).
class IMidiMapping : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0xDF0FF9F7, 0x49B74669, 0xB63AB732, 0x7ADBF5E5);
  static constexpr int16_t kAfterTouch = 128;
  static constexpr int16_t kPitchBend = 129;
  static constexpr int16_t kControllerCount = 130;
  virtual TResult GetMidiControllerAssignment(int32_t busIndex, int16_t channel, int16_t controller, ParamID& id) = 0;

protected:
  ~IMidiMapping() = default;
};

// ---- units and program lists
struct UnitInfo {
  static constexpr int32_t kRootUnitId = 0;
  static constexpr int32_t kNoParentUnitId = -1;
  static constexpr int32_t kNoProgramListId = -1;
  int32_t id;
  int32_t parentUnitId;
  String128 name;
  int32_t programListId;
};

struct ProgramListInfo {
  int32_t id;
  String128 name;
  int32_t programCount;
};
static_assert(sizeof(UnitInfo) == 268);
static_assert(sizeof(ProgramListInfo) == 264);

class IUnitInfo : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x3D4BD6B5, 0x913A4FD2, 0xA886E768, 0xA5EB92C1);
  virtual int32_t GetUnitCount() = 0;
  virtual TResult GetUnitInfo(int32_t unitIndex, UnitInfo& info) = 0;
  virtual int32_t GetProgramListCount() = 0;
  virtual TResult GetProgramListInfo(int32_t listIndex, ProgramListInfo& info) = 0;
  virtual TResult GetProgramName(int32_t listId, int32_t programIndex, String128 name) = 0;
  virtual TResult GetProgramInfo(int32_t listId, int32_t programIndex, const char* attribute, String128 value) = 0;
  virtual TResult HasProgramPitchNames(int32_t listId, int32_t programIndex) = 0;
  virtual TResult GetProgramPitchName(int32_t listId, int32_t programIndex, int16_t pitch, String128 name) = 0;
  virtual int32_t GetSelectedUnit() = 0;
  virtual TResult SelectUnit(int32_t unitId) = 0;
  virtual TResult GetUnitByBus(int32_t type, int32_t direction, int32_t busIndex, int32_t channel, int32_t& unitId) = 0;
  virtual TResult SetUnitProgramData(int32_t listOrUnitId, int32_t programIndex, IBStream* data) = 0;

protected:
  ~IUnitInfo() = default;
};

// The host's side of units and program lists, asked of the component handler: a plug-in whose
// program list changed says so here, so that the host reads the list again.
class IUnitHandler : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x4B5147F8, 0x4654486B, 0x8DAB30BA, 0x163A3C56);
  // Program index of a notice that the whole list changed.
  static constexpr int32_t kAllProgramInvalid = -1;
  virtual TResult NotifyUnitSelection(int32_t unitId) = 0;
  virtual TResult NotifyProgramListChange(int32_t listId, int32_t programIndex) = 0;

protected:
  ~IUnitHandler() = default;
};

// ---- the channel the plug-in sits on, as the host tells it
namespace ChannelContext {
inline constexpr const char* kChannelNameKey = "channel name";
inline constexpr const char* kChannelColorKey = "channel color";  // int64 holding 0xAARRGGBB
inline constexpr const char* kChannelPluginLocationKey = "channel plugin location";  // int64, below
enum PluginLocation : int64_t { kPreVolumeFader = 0, kPostVolumeFader = 1, kUsedAsPanner = 2 };

class IInfoListener : public FUnknown {
public:
  static constexpr KUID kIID = KUID::FromWords(0x0F194781, 0x8D984ADA, 0xBBA0C1EF, 0xC011D8D0);
  virtual TResult SetChannelContextInfos(IAttributeList* list) = 0;

protected:
  ~IInfoListener() = default;
};
}  // namespace ChannelContext

}  // namespace KVST3
