#pragma once

#include <cstdint>
#include <span>
#include <vector>

#include "core/KAudioPlugin.h"
#include "tools/KAudioFile.h"

// One automation lane of the command line: break points in seconds with normalised values;
// between them the value moves in a straight line, before the first and after the last it holds.
struct KAutomationLane {
  struct Point {
    double seconds;
    double normalized;
  };
  int32_t parameter;
  std::vector<Point> points;
};

// One plug-in of a chain, with what feeds it besides the audio before it.
struct KRenderStage {
  KAudioPlugin* plugin;
  std::vector<KAutomationLane> automation;
  KAudioSource* sideChain = nullptr;
};

struct KRenderOptions {
  int32_t blockSize = 512;  // 0: every block's size drawn from 1 to 512 with a fixed seed
  double tailSeconds = 0.0;
  bool showProgress = false;
};

struct KRenderSummary {
  double seconds = 0.0;  // audio rendered
  double inputPeak = 0.0, inputRms = 0.0, outputPeak = 0.0, outputRms = 0.0;  // linear, all channels
  double realtimeFactor = 0.0;
};

// Runs `input` through the plug-ins in series, block by block, as a host would, until the
// input ends (a stream's length need not be known), and writes the result. The output is
// aligned with the input: the latency of the whole chain is rendered past the end and cut
// from the start.
KRenderSummary KRender(std::span<const KRenderStage> stages, KAudioSource& input, KAudioFileWriter& output, const KRenderOptions& options);
