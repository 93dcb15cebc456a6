#include <benchmark/benchmark.h>

#include <memory>
#include <string>
#include <vector>

#include "kernel/KEntryPoints.h"
#include "plugins/KPluginHelpPage.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/KHelpTexts.h"
#include "ui/KRichTextLayout.h"
#include "ui/KRichTextPlain.h"
#include "ui/KRichTextRenderer.h"

// The compressor's whole help (title, overview and sixteen sections) in the software drawer, at
// scale 1 and 2: reading the mark-up, then laying it out and drawing it. The reference draws the
// same words as ready-made plain lines, one text call per line in one font, into the same
// picture: the cost of the ink alone, so that the ratio shows what mark-up and layout add.
namespace {

constexpr int32_t kWidth = 456;

struct Help {
  KString markup;
  KRichTextDocument document;
  std::vector<KString> lines;  // the plain text as laid out, line by line
  int32_t height = 0;

  Help() {
    const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString("KCompressorPlugin")));
    const KPluginHelpPage page(*plugin);
    markup = page.Markup();
    document = page.Document();
    const KRichTextLayout layout(document, kWidth);
    height = layout.Height();
    for (const KRichTextLayout::Piece& piece : layout.Pieces())
      if (piece.kind == KRichTextLayout::Piece::kText) lines.push_back(piece.text);
  }
};
const Help& TheHelp() {
  static const Help help;
  return help;
}

void BM_HelpRender(benchmark::State& state) {
  const Help& help = TheHelp();
  for (auto _ : state) {
    KRichTextRenderer renderer;
    renderer.Render(KHelpTexts::SemanticTagSets());
    renderer.Render(help.markup);
    benchmark::DoNotOptimize(renderer.Document().body.items.size());
  }
  state.counters["characters"] = help.markup.Length();
}

void BM_HelpLayoutAndDraw(benchmark::State& state) {
  const Help& help = TheHelp();
  const double scale = static_cast<double>(state.range(0));
  KBitmap picture(static_cast<int32_t>(kWidth * scale), static_cast<int32_t>(help.height * scale));
  KDrawerToKBitmap drawer(picture, scale);
  for (auto _ : state) {
    const KRichTextLayout layout(help.document, kWidth, scale);
    layout.Draw(drawer);
    benchmark::DoNotOptimize(picture.Pixels());
  }
  state.counters["pieces"] = static_cast<double>(KRichTextLayout(help.document, kWidth, scale).Pieces().size());
}

void BM_PlainLinesDraw(benchmark::State& state) {
  const Help& help = TheHelp();
  const double scale = static_cast<double>(state.range(0));
  KBitmap picture(static_cast<int32_t>(kWidth * scale), static_cast<int32_t>(help.height * scale));
  KDrawerToKBitmap drawer(picture, scale);
  const KFont font = KFont::Normal();
  const int32_t step = help.height / static_cast<int32_t>(help.lines.size());
  for (auto _ : state) {
    drawer.FillRectangle({0, 0, kWidth - 1, help.height - 1}, 0xFFFFFFFF, 255, kDrawCopy);
    int32_t y = 0;
    for (const KString& line : help.lines) {
      drawer.AlignedTextOut({0, y, kWidth - 1, y + step - 1}, line, font, 0xFF000000, kAlignLeft | kAlignTop, 255, kDrawBlend);
      y += step;
    }
    benchmark::DoNotOptimize(picture.Pixels());
  }
}

}  // namespace

BENCHMARK(BM_HelpRender)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_HelpLayoutAndDraw)->Arg(1)->Arg(2)->Unit(benchmark::kMicrosecond);
BENCHMARK(BM_PlainLinesDraw)->Arg(1)->Arg(2)->Unit(benchmark::kMicrosecond);
