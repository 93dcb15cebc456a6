#include <benchmark/benchmark.h>

#include <cmath>
#include <memory>
#include <vector>

#include "kernel/KEntryPoints.h"
#include "kernel/KException.h"
#include "plugins/KPluginEditors.h"
#include "ui/KDrawerOpenGL.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/platform/KOpenGLContext.h"

// The compressor's editor, the largest graph and the most meters: a full repaint at scale 1 and 2
// by each drawer, beside the reference of filling the same picture with one colour (the least a
// full repaint can cost); and the idle tick a window runs 30 times a second while the meters
// move and nothing else happens, which repaints only the meters.
namespace {

struct Editor {
  std::unique_ptr<KAudioPlugin> plugin{CreateTorvanePlugin(KString("KCompressorPlugin"))};
  std::unique_ptr<KEditor> editor = KMakePluginEditor(*plugin, nullptr);
  explicit Editor(double scale) { editor->SetScale(scale); }
};

void BM_EditorFill(benchmark::State& state) {
  Editor e(static_cast<double>(state.range(0)));
  KBitmap picture(e.editor->PixelWidth(), e.editor->PixelHeight());
  KDrawerToKBitmap drawer(picture, e.editor->Scale());
  const KRect all{0, 0, e.editor->Width() - 1, e.editor->Height() - 1};
  for (auto _ : state) {
    drawer.FillRectangle(all, 0xFF202020, 255, kDrawCopy);
    benchmark::DoNotOptimize(picture.Pixels());
  }
}

void BM_EditorFullRepaintSoftware(benchmark::State& state) {
  Editor e(static_cast<double>(state.range(0)));
  KBitmap picture(e.editor->PixelWidth(), e.editor->PixelHeight());
  KDrawerToKBitmap drawer(picture, e.editor->Scale());
  for (auto _ : state) benchmark::DoNotOptimize(e.editor->PaintAll(drawer));
}

// Each repaint is read back, so the time includes the GPU's (here Mesa's) work, not just the calls.
void BM_EditorFullRepaintOpenGL(benchmark::State& state) {
  Editor e(static_cast<double>(state.range(0)));
  std::unique_ptr<KOpenGLContext> context;
  try {
    context = KOpenGLContext::CreateOffscreen(e.editor->PixelWidth(), e.editor->PixelHeight());
  } catch (const KException&) {
    state.SkipWithError("no OpenGL");
    return;
  }
  KDrawerOpenGL drawer(*context, e.editor->Scale());
  drawer.Attach();
  drawer.BeginPaint();
  for (auto _ : state) {
    e.editor->PaintAll(drawer);
    benchmark::DoNotOptimize(drawer.GetScreenShot().Pixels());
  }
  drawer.EndPaint();
}

// One tick of a window with the meters moving: the audio side's peaks change, the tree ticks, the
// dirty meters repaint.
void BM_EditorIdleTick(benchmark::State& state) {
  Editor e(static_cast<double>(state.range(0)));
  KBitmap picture(e.editor->PixelWidth(), e.editor->PixelHeight());
  KDrawerToKBitmap drawer(picture, e.editor->Scale());
  e.editor->PaintAll(drawer);
  std::vector<float> block(64);
  int64_t tick = 0, painted = 0;
  for (auto _ : state) {
    const float level = 0.5f + 0.45f * static_cast<float>(std::sin(0.2 * static_cast<double>(++tick)));
    std::fill(block.begin(), block.end(), level);
    for (int32_t m = 0; m < KAudioPlugin::kMeterCount; ++m) {
      e.plugin->GetMeter(KAudioPlugin::Meter(m)).Reset();
      e.plugin->GetMeter(KAudioPlugin::Meter(m)).Accumulate(block.data(), 64);
    }
    e.editor->Tree().Tick();
    const KRect area = e.editor->Paint(drawer);
    painted += area.IsEmpty() ? 0 : area.Width() * area.Height();
  }
  state.counters["painted share"] = static_cast<double>(painted) / static_cast<double>(tick) /
                                    (static_cast<double>(e.editor->Width()) * e.editor->Height());
}

BENCHMARK(BM_EditorFill)->Arg(1)->Arg(2)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_EditorFullRepaintSoftware)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_EditorFullRepaintOpenGL)->Arg(1)->Arg(2)->Unit(benchmark::kMillisecond);
BENCHMARK(BM_EditorIdleTick)->Arg(1)->Arg(2)->Unit(benchmark::kMicrosecond);

}  // namespace
