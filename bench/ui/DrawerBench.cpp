// The software drawer against Cairo on the scene of an editor: a 900 x 500 background blit,
// 20 anti-aliased knobs of arcs and lines, 200 lines of text and a 512-point response curve.
// Each part is timed for both in turn in the same run; "ratio" is Cairo's time over ours
// (above 1: the drawer is faster). The whole scene is also timed on the OpenGL drawer, as a
// ratio of the software drawer's time over the OpenGL drawer's.
#include <benchmark/benchmark.h>
#include <cairo-ft.h>
#include <cairo.h>
#include <ft2build.h>
#include FT_FREETYPE_H

#include <chrono>
#include <ctime>
#include <cmath>
#include <memory>
#include <string>
#include <vector>

#include "kernel/KException.h"
#include "ui/KDrawerOpenGL.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/platform/KOpenGLContext.h"

namespace {
constexpr int32_t kWidth = 900, kHeight = 500;
constexpr double kPi = 3.141592653589793;

struct Knob {
  double x, y, value;
};

struct Scene {
  KBitmap background{kWidth, kHeight};
  std::vector<Knob> knobs;
  std::vector<std::string> lines;
  std::vector<KString> texts;  // the same lines as the drawer takes them
  std::vector<double> response;

  Scene() {
    for (int32_t y = 0; y < kHeight; ++y)
      for (int32_t x = 0; x < kWidth; ++x) background.Row(y)[x] = KMakeColor(255, uint32_t(30 + x % 17), uint32_t(34 + y % 13), 40);
    for (int i = 0; i < 20; ++i) knobs.push_back({50.0 + (i % 10) * 85, 50.0 + (i / 10) * 80, (i % 7) / 6.0});
    for (int i = 0; i < 200; ++i) {
      lines.push_back("Band " + std::to_string(i) + ": gain -3.5 dB, Q 0.71, 1.25 kHz");
      texts.push_back(KString::FromUtf8(lines.back()));
    }
    for (int i = 0; i < 512; ++i) {
      const double x = i / 511.0;
      response.push_back(9 * std::exp(-std::pow((x - 0.3) / 0.08, 2)) - 6 * std::exp(-std::pow((x - 0.75) / 0.12, 2)));
    }
  }
};

const Scene& TheScene() {
  static const Scene scene;
  return scene;
}

// The arc of a knob from its start to its value, as points.
std::vector<KPointF> ArcPoints(const Knob& k, double radius) {
  std::vector<KPointF> points;
  const double start = -0.75 * kPi, end = start + 1.5 * kPi * k.value;
  for (int i = 0; i <= 32; ++i) {
    const double a = start + (end - start) * i / 32;
    points.push_back({k.x + radius * std::sin(a), k.y - radius * std::cos(a)});
  }
  return points;
}

// --- The scene on our drawers ---
void OursBlit(KDrawer& d) { d.BitBlt({0, 0, kWidth - 1, kHeight - 1}, TheScene().background, {0, 0}, 255, kDrawBlend); }

void OursKnobs(KDrawer& d) {
  for (const Knob& k : TheScene().knobs) {
    d.FillCircle({k.x, k.y}, 22, 0xFF2A3038u, 255, kDrawBlend);
    d.SetLineWidth(3);
    d.PolyLineF(ArcPoints(k, 27), 0xFFF0A030u, 255, kDrawBlend);
    const double a = -0.75 * kPi + 1.5 * kPi * k.value;
    d.SetLineWidth(2);
    d.LineF({k.x, k.y}, {k.x + 18 * std::sin(a), k.y - 18 * std::cos(a)}, 0xFFFFFFFFu, 255, kDrawBlend);
    d.SetLineWidth(1);
    d.Circle({k.x, k.y}, 22, 0xFF6A7682u, 255, kDrawBlend);
  }
}

void OursText(KDrawer& d) {
  const auto& texts = TheScene().texts;
  for (size_t i = 0; i < texts.size(); ++i) {
    const int32_t x = int32_t(i / 50) * 225, y = int32_t(i % 50) * 10;
    d.AlignedTextOut({x, y, x + 224, y + 12}, texts[i], KFont::Small(), 0xFFE0E4E8u, kAlignLeft | kAlignTop,
                     255, kDrawBlend);
  }
}

void OursCurve(KDrawer& d) {
  d.SetLineWidth(1.5);
  d.PaintHorizontalPolyLine({0, 250, kWidth - 1, 499}, TheScene().response, 12, -12, 0xFF60C0F0u, 255, kDrawBlend);
  d.SetLineWidth(1);
}

void OursScene(KDrawer& d) {
  OursBlit(d);
  OursKnobs(d);
  OursText(d);
  OursCurve(d);
}

// --- The same on Cairo ---
struct CairoCanvas {
  cairo_surface_t* surface;
  cairo_surface_t* background;
  cairo_t* cr;
  FT_Library library = nullptr;
  FT_Face face = nullptr;
  cairo_font_face_t* font = nullptr;

  explicit CairoCanvas(double scale) {
    surface = cairo_image_surface_create(CAIRO_FORMAT_ARGB32, int(kWidth * scale), int(kHeight * scale));
    const KBitmap& b = TheScene().background;
    background = cairo_image_surface_create_for_data(reinterpret_cast<unsigned char*>(const_cast<uint32_t*>(b.Pixels())),
                                                     CAIRO_FORMAT_ARGB32, b.Width(), b.Height(), b.Width() * 4);
    cr = cairo_create(surface);
    cairo_scale(cr, scale, scale);
    FT_Init_FreeType(&library);
    FT_New_Face(library, (KFont::FontFolder() + "DejaVuSans.ttf").c_str(), 0, &face);
    font = cairo_ft_font_face_create_for_ft_face(face, 0);
    cairo_set_font_face(cr, font);
    cairo_set_font_size(cr, KFont::Small().Size());
  }
  ~CairoCanvas() {
    cairo_destroy(cr);
    cairo_font_face_destroy(font);
    cairo_surface_destroy(background);
    cairo_surface_destroy(surface);
    FT_Done_Face(face);
    FT_Done_FreeType(library);
  }
  void Color(uint32_t c) { cairo_set_source_rgba(cr, KRedOf(c) / 255.0, KGreenOf(c) / 255.0, KBlueOf(c) / 255.0, KAlphaOf(c) / 255.0); }

  void Blit() {
    cairo_set_source_surface(cr, background, 0, 0);
    cairo_paint(cr);
  }
  void Knobs() {
    for (const Knob& k : TheScene().knobs) {
      // Integer points of ours name pixel centres; Cairo's name pixel corners.
      const double x = k.x + 0.5, y = k.y + 0.5;
      Color(0xFF2A3038u);
      cairo_arc(cr, x, y, 22, 0, 2 * kPi);
      cairo_fill(cr);
      const double start = -0.75 * kPi, end = start + 1.5 * kPi * k.value;
      Color(0xFFF0A030u);
      cairo_set_line_width(cr, 3);
      if (end > start) {
        cairo_arc(cr, x, y, 27, start - kPi / 2, end - kPi / 2);
        cairo_stroke(cr);
      }
      Color(0xFFFFFFFFu);
      cairo_set_line_width(cr, 2);
      cairo_move_to(cr, x, y);
      cairo_line_to(cr, x + 18 * std::sin(end), y - 18 * std::cos(end));
      cairo_stroke(cr);
      Color(0xFF6A7682u);
      cairo_set_line_width(cr, 1);
      cairo_arc(cr, x, y, 22, 0, 2 * kPi);
      cairo_stroke(cr);
    }
  }
  void Text() {
    Color(0xFFE0E4E8u);
    const auto& lines = TheScene().lines;
    for (size_t i = 0; i < lines.size(); ++i) {
      cairo_move_to(cr, double(i / 50) * 225, double(i % 50) * 10 + 10);
      cairo_show_text(cr, lines[i].c_str());
    }
  }
  void Curve() {
    const auto& r = TheScene().response;
    Color(0xFF60C0F0u);
    cairo_set_line_width(cr, 1.5);
    cairo_set_line_join(cr, CAIRO_LINE_JOIN_ROUND);
    for (size_t i = 0; i < r.size(); ++i) {
      const double x = 0.5 + double(i) * (kWidth - 1) / double(r.size() - 1), y = 250.5 + (12 - r[i]) / 24 * 249;
      i ? cairo_line_to(cr, x, y) : cairo_move_to(cr, x, y);
    }
    cairo_stroke(cr);
  }
  void Scene() {
    Blit();
    Knobs();
    Text();
    Curve();
  }
  void Finish() { cairo_surface_flush(surface); }
};

// The processor time of this process: the machine that runs the benchmarks is shared, and
// time spent waiting for a core would land on whichever side happened to be running.
struct ProcessorClock {
  using duration = std::chrono::duration<double>;
  using time_point = std::chrono::time_point<ProcessorClock, duration>;
  static time_point now() noexcept { return time_point(duration(double(std::clock()) / CLOCKS_PER_SEC)); }
};

// Times ours and the other drawing in turn; the benchmark's time is ours. "ratio" is the
// other's time over ours.
template <class Clock, class Ours, class Theirs>
void TimePair(benchmark::State& state, const char* other, Ours&& ours, Theirs&& theirs) {
  typename Clock::duration mine{}, them{};
  int64_t frames = 0;
  for (auto _ : state) {
    const auto start = Clock::now();
    ours();
    benchmark::ClobberMemory();
    const auto middle = Clock::now();
    theirs();
    benchmark::ClobberMemory();
    const auto end = Clock::now();
    state.SetIterationTime(std::chrono::duration<double>(middle - start).count());
    mine += middle - start;
    them += end - middle;
    ++frames;
  }
  const auto ms = [frames](auto t) { return std::chrono::duration<double, std::milli>(t).count() / double(frames); };
  state.counters["ms"] = ms(mine);
  state.counters[std::string(other) + "_ms"] = ms(them);
  state.counters["ratio"] = ms(them) / ms(mine);
}

template <void (*OursPart)(KDrawer&), void (CairoCanvas::*CairoPart)()>
void BM_Software_vs_Cairo(benchmark::State& state) {
  const double scale = double(state.range(0));
  KBitmap target(int32_t(kWidth * scale), int32_t(kHeight * scale));
  KDrawerToKBitmap drawer(target, scale);
  CairoCanvas cairo(scale);
  TimePair<ProcessorClock>(state, "cairo", [&] { OursPart(drawer); }, [&] { (cairo.*CairoPart)(), cairo.Finish(); });
}

void BM_OpenGL_Scene(benchmark::State& state) {
  const double scale = double(state.range(0));
  std::unique_ptr<KOpenGLContext> context;
  try {
    context = KOpenGLContext::CreateOffscreen(int32_t(kWidth * scale), int32_t(kHeight * scale));
  } catch (const KException&) {
    state.SkipWithError("no OpenGL on this system");
    return;
  }
  KDrawerOpenGL drawer(*context, scale);
  drawer.Attach();
  KBitmap target(int32_t(kWidth * scale), int32_t(kHeight * scale));
  KDrawerToKBitmap software(target, scale);
  // Against the software drawer, on the wall clock: Mesa's renderer paints on threads of its
  // own, and each OpenGL frame ends when the picture is finished.
  TimePair<std::chrono::steady_clock>(state, "software", [&] { drawer.BeginPaint(), OursScene(drawer), drawer.EndPaint(); },
                                      [&] { OursScene(software); });
}
}  // namespace

BENCHMARK(BM_Software_vs_Cairo<OursBlit, &CairoCanvas::Blit>)->Name("Drawer/Blit900x500")->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Software_vs_Cairo<OursKnobs, &CairoCanvas::Knobs>)->Name("Drawer/Knobs20")->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Software_vs_Cairo<OursText, &CairoCanvas::Text>)->Name("Drawer/Text200Lines")->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Software_vs_Cairo<OursCurve, &CairoCanvas::Curve>)->Name("Drawer/Curve512")->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_Software_vs_Cairo<OursScene, &CairoCanvas::Scene>)->Name("Drawer/Scene")->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
BENCHMARK(BM_OpenGL_Scene)->Name("Drawer/SceneOpenGL")->Arg(1)->Arg(2)->UseManualTime()->Unit(benchmark::kMillisecond);
