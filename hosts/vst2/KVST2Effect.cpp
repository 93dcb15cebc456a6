#include "hosts/vst2/KVST2Effect.h"

namespace KVST2 {

KEffect::KEffect(HostCallback host, int32_t programs, int32_t parameters) noexcept : effect_{}, host_(host) {
  effect_.magic = kEffectMagic;
  effect_.dispatcher = &DispatchEntry;
  effect_.process = &ProcessEntry;
  effect_.setParameter = &SetParameterEntry;
  effect_.getParameter = &GetParameterEntry;
  effect_.numPrograms = programs;
  effect_.numParams = parameters;
  effect_.numInputs = 1;
  effect_.numOutputs = 2;
  effect_.ioRatio = 1.0f;
  effect_.object = this;
  effect_.uniqueID = FourCharacters("NoEf");
  effect_.version = 1;
  effect_.processReplacing = &ProcessEntry;
}

bool KEffect::getSpeakerArrangement(VstSpeakerArrangement** input, VstSpeakerArrangement** output) {
  *input = nullptr;
  *output = nullptr;
  return false;
}

intptr_t KEffect::getPlugCategory() { return (effect_.flags & effFlagsIsSynth) ? kPlugCategSynth : kPlugCategUnknown; }

intptr_t KEffect::CallHost(int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt) noexcept {
  return host_ ? host_(&effect_, opcode, index, value, ptr, opt) : 0;
}

int32_t KEffect::getMasterVersion() noexcept {
  const auto version = static_cast<int32_t>(CallHost(audioMasterVersion));
  return version == 0 ? 1 : version;
}

void KEffect::setParameterAutomated(int32_t index, float value) {
  setParameter(index, value);
  CallHost(audioMasterAutomate, index, 0, nullptr, value);
}

intptr_t KEffect::Dispatch(int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt) {
  char* const text = static_cast<char*>(ptr);
  switch (opcode) {
    case effOpen: open(); return 0;
    case effClose: close(); delete this; return 1;
    case effSetProgram: if (value < effect_.numPrograms) setProgram(static_cast<int32_t>(value)); return 0;
    case effGetProgram: return getProgram();
    case effSetProgramName: setProgramName(text); return 0;
    case effGetProgramName: getProgramName(text); return 0;
    case effGetParamLabel: getParameterLabel(index, text); return 0;
    case effGetParamDisplay: getParameterDisplay(index, text); return 0;
    case effGetParamName: getParameterName(index, text); return 0;
    case effSetSampleRate: setSampleRate(opt); return 0;
    case effSetBlockSize: setBlockSize(static_cast<int32_t>(value)); return 0;
    case effMainsChanged: value ? resume() : suspend(); return 0;
    case effGetChunk: return getChunk(static_cast<void**>(ptr), index != 0);
    case effSetChunk: return setChunk(ptr, static_cast<int32_t>(value), index != 0);
    case effProcessEvents: return processEvents(static_cast<VstEvents*>(ptr));
    case effCanBeAutomated: return canParameterBeAutomated(index) ? 1 : 0;
    case effString2Parameter: return string2parameter(index, text) ? 1 : 0;
    case effGetProgramNameIndexed: return getProgramNameIndexed(static_cast<int32_t>(value), index, text) ? 1 : 0;
    case effGetInputProperties: return getInputProperties(index, static_cast<VstPinProperties*>(ptr)) ? 1 : 0;
    case effGetOutputProperties: return getOutputProperties(index, static_cast<VstPinProperties*>(ptr)) ? 1 : 0;
    case effGetPlugCategory: return getPlugCategory();
    case effSetSpeakerArrangement:
      return setSpeakerArrangement(reinterpret_cast<VstSpeakerArrangement*>(value), static_cast<VstSpeakerArrangement*>(ptr)) ? 1 : 0;
    case effGetSpeakerArrangement:
      return getSpeakerArrangement(reinterpret_cast<VstSpeakerArrangement**>(value), static_cast<VstSpeakerArrangement**>(ptr)) ? 1 : 0;
    case effSetBypass: return setBypass(value != 0) ? 1 : 0;
    case effGetEffectName: return getEffectName(text) ? 1 : 0;
    case effGetVendorString: return getVendorString(text) ? 1 : 0;
    case effGetProductString: return getProductString(text) ? 1 : 0;
    case effGetVendorVersion: return getVendorVersion();
    case effCanDo: return text ? canDo(text) : 0;
    case effGetTailSize: return getGetTailSize();
    case effIdle: return idle();
    case effGetVstVersion: return kVstVersion;
    case effStartProcess: return startProcess();
    case effStopProcess: return stopProcess();
    case effEditGetRect: return editor_ && editor_->getRect(static_cast<ERect**>(ptr)) ? 1 : 0;
    case effEditOpen: return editor_ && editor_->open(ptr) ? 1 : 0;
    case effEditClose: if (editor_) editor_->close(); return 0;
    case effEditIdle: if (editor_) editor_->idle(); return 0;
    case effEditKeyDown: return editor_ ? editor_->onKeyDown(index, static_cast<int32_t>(value), static_cast<int32_t>(opt)) : 0;
    case effEditKeyUp: return editor_ ? editor_->onKeyUp(index, static_cast<int32_t>(value), static_cast<int32_t>(opt)) : 0;
    default: return 0;
  }
}

intptr_t KEffect::DispatchEntry(AEffect* effect, int32_t opcode, int32_t index, intptr_t value, void* ptr, float opt) {
  return Of(effect)->Dispatch(opcode, index, value, ptr, opt);
}

void KEffect::ProcessEntry(AEffect* effect, float** inputs, float** outputs, int32_t sampleFrames) {
  Of(effect)->processReplacing(inputs, outputs, sampleFrames);
}

void KEffect::SetParameterEntry(AEffect* effect, int32_t index, float value) { Of(effect)->setParameter(index, value); }

float KEffect::GetParameterEntry(AEffect* effect, int32_t index) { return Of(effect)->getParameter(index); }

}  // namespace KVST2
