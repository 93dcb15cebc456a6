#pragma once

#include <cstdint>

#include "hosts/vst2/KVST2Interface.h"

namespace KVST2 {

// The editor of an instance, as the dispatcher reaches it with the editor's opcodes.
class KEffectEditor {
public:
  virtual ~KEffectEditor() = default;
  // The editor's rectangle, kept by the editor until the next call.
  virtual bool getRect(ERect** rect) = 0;
  // `window` is the host's window to embed into (an X11 window id on Linux).
  virtual bool open(void* window) = 0;
  virtual void close() = 0;
  virtual void idle() = 0;
  // Answer 1 when the editor took the key, so that the host does not act on it too.
  virtual int32_t onKeyDown(int32_t character, int32_t virtualKey, int32_t modifiers) = 0;
  virtual int32_t onKeyUp(int32_t character, int32_t virtualKey, int32_t modifiers) = 0;
};

// The plug-in side of one VST 2 instance: owns the AEffect record the host holds, turns the
// host's opcodes into virtual methods with the format's usual answers as defaults, and wraps
// the calls back to the host. A null host callback answers every call with its default
// (version 1, nothing done). The host's effClose deletes the object.
class KEffect {
public:
  KEffect(HostCallback host, int32_t programs, int32_t parameters) noexcept;
  KEffect(const KEffect&) = delete;
  KEffect& operator=(const KEffect&) = delete;
  virtual ~KEffect() = default;

  AEffect* Effect() noexcept { return &effect_; }
  static KEffect* Of(AEffect* effect) noexcept { return static_cast<KEffect*>(effect->object); }

  // ---- what the host reaches through the dispatcher, with the format's defaults
  virtual void open() {}
  virtual void close() {}
  virtual void suspend() {}
  virtual void resume() {}
  virtual void setSampleRate(float rate) { sampleRate_ = rate; }
  virtual void setBlockSize(int32_t size) { blockSize_ = size; }
  virtual void processReplacing(float** inputs, float** outputs, int32_t sampleFrames) = 0;
  virtual void setParameter(int32_t, float) {}
  virtual float getParameter(int32_t) { return 0.0f; }
  virtual int32_t getProgram() { return 0; }
  virtual void setProgram(int32_t) {}
  virtual void setProgramName(char*) {}
  virtual void getProgramName(char* name) { *name = 0; }
  virtual bool getProgramNameIndexed(int32_t, int32_t, char*) { return false; }
  virtual void getParameterLabel(int32_t, char* label) { *label = 0; }
  virtual void getParameterDisplay(int32_t, char* text) { *text = 0; }
  virtual void getParameterName(int32_t, char* text) { *text = 0; }
  virtual bool canParameterBeAutomated(int32_t) { return true; }
  virtual bool string2parameter(int32_t, char*) { return false; }
  virtual int32_t getChunk(void**, bool) { return 0; }
  virtual int32_t setChunk(void*, int32_t, bool) { return 0; }
  virtual int32_t processEvents(VstEvents*) { return 0; }
  virtual bool getInputProperties(int32_t, VstPinProperties*) { return false; }
  virtual bool getOutputProperties(int32_t, VstPinProperties*) { return false; }
  virtual bool setSpeakerArrangement(VstSpeakerArrangement*, VstSpeakerArrangement*) { return false; }
  virtual bool getSpeakerArrangement(VstSpeakerArrangement** input, VstSpeakerArrangement** output);
  virtual bool setBypass(bool) { return false; }
  virtual bool getEffectName(char*) { return false; }
  virtual bool getVendorString(char*) { return false; }
  virtual bool getProductString(char*) { return false; }
  virtual int32_t getVendorVersion() { return 0; }
  virtual int32_t canDo(char*) { return 0; }
  virtual int32_t getGetTailSize() { return 0; }
  virtual intptr_t getPlugCategory();
  virtual int32_t idle() { return 0; }
  virtual int32_t startProcess() { return 0; }
  virtual int32_t stopProcess() { return 0; }

  // ---- calls to the host
  intptr_t CallHost(int32_t opcode, int32_t index = 0, intptr_t value = 0, void* ptr = nullptr, float opt = 0.0f) noexcept;
  // The host's VST version; 1 without a host or when it answers 0.
  int32_t getMasterVersion() noexcept;
  bool getHostProductString(char* text) noexcept { return CallHost(audioMasterGetProductString, 0, 0, text) != 0; }
  VstTimeInfo* getTimeInfo(int32_t filter) noexcept { return reinterpret_cast<VstTimeInfo*>(CallHost(audioMasterGetTime, 0, filter)); }
  int32_t getCurrentProcessLevel() noexcept { return static_cast<int32_t>(CallHost(audioMasterGetCurrentProcessLevel)); }
  bool sendVstEventsToHost(VstEvents* events) noexcept { return CallHost(audioMasterProcessEvents, 0, 0, events) == 1; }
  bool beginEdit(int32_t index) noexcept { return CallHost(audioMasterBeginEdit, index) != 0; }
  bool endEdit(int32_t index) noexcept { return CallHost(audioMasterEndEdit, index) != 0; }
  bool updateDisplay() noexcept { return CallHost(audioMasterUpdateDisplay) != 0; }
  bool ioChanged() noexcept { return CallHost(audioMasterIOChanged) != 0; }
  bool sizeWindow(int32_t width, int32_t height) noexcept { return CallHost(audioMasterSizeWindow, width, height) != 0; }
  // The value takes effect here first, then the host records it.
  void setParameterAutomated(int32_t index, float value);

  // ---- the record's fields
  void setNumInputs(int32_t count) noexcept { effect_.numInputs = count; }
  void setNumOutputs(int32_t count) noexcept { effect_.numOutputs = count; }
  void setNumParams(int32_t count) noexcept { effect_.numParams = count; }
  void setUniqueID(int32_t id) noexcept { effect_.uniqueID = id; }
  void setInitialDelay(int32_t samples) noexcept { effect_.initialDelay = samples; }
  void canProcessReplacing(bool state) noexcept { SetFlag(effFlagsCanReplacing, state); }
  void programsAreChunks(bool state) noexcept { SetFlag(effFlagsProgramChunks, state); }
  void isSynth(bool state) noexcept { SetFlag(effFlagsIsSynth, state); }
  // The editor the editor's opcodes reach (not owned; null: none, and the host is told so).
  void setEditor(KEffectEditor* editor) noexcept {
    editor_ = editor;
    SetFlag(effFlagsHasEditor, editor != nullptr);
  }

  float SampleRate() const noexcept { return sampleRate_; }
  int32_t BlockSize() const noexcept { return blockSize_; }

private:
  intptr_t Dispatch(int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt);
  void SetFlag(int32_t flag, bool state) noexcept { effect_.flags = state ? effect_.flags | flag : effect_.flags & ~flag; }
  static intptr_t DispatchEntry(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt);
  static void ProcessEntry(AEffect* effect, float** inputs, float** outputs, int32_t sampleFrames);
  static void SetParameterEntry(AEffect* effect, int32_t index, float value);
  static float GetParameterEntry(AEffect* effect, int32_t index);

  AEffect effect_;
  HostCallback host_;
  KEffectEditor* editor_ = nullptr;
  float sampleRate_ = 44100.0f;
  int32_t blockSize_ = 1024;
};

}  // namespace KVST2
