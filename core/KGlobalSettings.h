#pragma once

#include <cstdint>
#include <utility>

#include "kernel/KArray.h"
#include "kernel/KString.h"

// The settings of a plug-in instance that belong to neither its parameters nor its own
// processing: how it is set up in its host. Each field starts at its default, which is what a
// state document without the attribute means. The channel mode and the bypass switch are not
// here: the audio thread reads them, so the plug-in keeps those two as atomics.
//
// Of these, the current preset is kept up to date by the plug-in's preset operations; the rest
// is carried for the editor and for subsystems that consult it (the surround and program-change
// handling, oversampling), and a plug-in that does not use a setting still gives it back as it
// was loaded.
struct KGlobalSettings {
  using Size = std::pair<int32_t, int32_t>;  // width, height; 0,0: the editor's own size

  // Oversampling choices, stored by these texts.
  static constexpr const char* kUpsamplingNames[] = {"Off", "2x", "4x", "8x", "16x"};

  // ---- surround and ambisonics
  uint32_t surroundChannelsEnable = 0xFFFFFFFFu;  // one bit per channel of a surround set: processed
  int32_t ambisonicsOrder = 1;
  double surroundVolume = 0.0;  // dB
  int32_t surroundChannel = 0;  // the channel the editor shows
  bool enableSurroundProcessing = true;

  // ---- program changes
  bool midiProgramChangeEnable = false;
  int32_t previousNextPresetController = -1;  // a controller that steps through the presets; -1: none
  bool simulateProgramChange = false;
  struct ProgramChange {
    KArray<int32_t> values;        // the preset chosen by each program number, in program order
    KString folder;                // where those presets are found; empty: the plug-in's own
    int32_t controller = -1;       // a controller that selects programs too; -1: none
    int32_t channel = 0;           // 1 to 16; 0: every channel
    bool enabled = false;
  } programChange;

  // ---- bypass
  bool smartBypass = false;  // bypass by itself while the input is silent

  // ---- processing options
  int32_t maxLFOBlockSizeOffline = 0;  // samples; 0: as in real time
  bool randomizerCompensation = false;
  bool limiter = false;
  bool auditionDifference = false;
  bool enableLatencyReporting = true;
  bool disableOnSilence = false;

  // ---- oversampling, indices into kUpsamplingNames
  int32_t upsampling = 0;
  int32_t upsamplingOffline = 0;
  bool hqUpsampling = false;

  // ---- current preset: its position in the preset list and its name
  int32_t presetIndex = -1;
  KString preset;

  // ---- editor sizes of the edit screen and of the easy screen
  Size editorSize{0, 0};
  Size editorSizeEasy{0, 0};
};
