#include <benchmark/benchmark.h>

#include <cstdio>

#include "kernel/KFormat.h"

// The formatter beside std::snprintf doing the same substitutions: a short status line and a
// message of several hundred characters.
namespace {

constexpr char kLongReason[] =
    "The plug-in could not read its settings because the file is damaged or was written by a "
    "newer version; defaults were loaded instead and the file was left unchanged";

#define TORVANE_LONG_PATTERN(NAME, REASON, CODE, LOAD)                                                       \
  "Could not create plugin " NAME ".\n\nError: " REASON ".\n\nThe host asked for the plug-in while "          \
  "restoring a project. Every other plug-in of the project was loaded, and the project can be saved "         \
  "without losing the settings of this one: they are kept as they were read. Error code " CODE ", processor " \
  "load " LOAD " percent at the time of the request."

void BM_Format_Short(benchmark::State& state) {
  for (auto _ : state) {
    KString text = KFormatText("{0} of {1} ({2.1}%)", 3, 12, 25.0);
    benchmark::DoNotOptimize(text);
  }
}

void BM_Reference_Snprintf_Short(benchmark::State& state) {
  char buffer[64];
  for (auto _ : state) {
    std::snprintf(buffer, sizeof(buffer), "%d of %d (%.1f%%)", 3, 12, 25.0);
    benchmark::DoNotOptimize(buffer);
  }
}

void BM_Format_Long(benchmark::State& state) {
  const KString name = "Multiband Dynamics";
  const KString reason = kLongReason;
  for (auto _ : state) {
    KString text = KFormatText(TORVANE_LONG_PATTERN("{0}", "{1}", "{2x}", "{3.2}"), name, reason, 0x8007000E, 37.25);
    benchmark::DoNotOptimize(text);
  }
}

void BM_Reference_Snprintf_Long(benchmark::State& state) {
  char buffer[1024];
  for (auto _ : state) {
    std::snprintf(buffer, sizeof(buffer), TORVANE_LONG_PATTERN("%s", "%s", "%X", "%.2f"), "Multiband Dynamics",
                  kLongReason, 0x8007000E, 37.25);
    benchmark::DoNotOptimize(buffer);
  }
}

}  // namespace

BENCHMARK(BM_Format_Short);
BENCHMARK(BM_Reference_Snprintf_Short);
BENCHMARK(BM_Format_Long);
BENCHMARK(BM_Reference_Snprintf_Long);
