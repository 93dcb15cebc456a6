#include "ui/KVectorIcons.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <vector>

namespace {

// Each icon is a list of shapes separated by "|", on a 16 × 16 grid:
//   L x,y x,y ...      a stroked polyline          P x,y x,y ...     a filled polygon
//   C cx,cy,r          a stroked circle            D cx,cy,r         a filled disc
//   A cx,cy,r,a0,a1    a stroked arc, degrees clockwise from 12 o'clock
// An "L" or "A" may end with ">" to put an arrowhead on its last point.
struct KIcon {
  const char* name;
  const char* shapes;
};
constexpr KIcon kIcons[] = {
    {"add", "L 8,3 8,13 | L 3,8 13,8"},
    {"analyse", "C 7,7,4.5 | L 10.3,10.3 14,14 | L 4,7 5.5,5 7,9 8.5,6 10,7"},
    {"arrow", "P 4,2 4,13 7,10.5 9,14.5 10.8,13.6 8.8,9.8 12.5,9.5"},
    {"cancel", "L 4,4 12,12 | L 12,4 4,12"},
    {"clipboardcopy", "L 5,4 3,4 3,14.5 11,14.5 11,12 | P 6,1.5 14,1.5 14,11 6,11 6,1.5 7,2.5 7,10 13,10 13,2.5 7,2.5"},
    {"clipboardpaste", "L 5.5,3 3,3 3,14.5 13,14.5 13,3 10.5,3 | P 5.5,1.5 10.5,1.5 10.5,4.5 5.5,4.5 | L 5.5,8 10.5,8 | L 5.5,11 9,11"},
    {"collapse", "L 4,3 8,7 12,3 | L 4,13 8,9 12,13"},
    {"delete", "L 2.5,4 13.5,4 | L 6,4 6,2 10,2 10,4 | L 4,5.5 5,14.5 11,14.5 12,5.5 | L 6.8,7 7,12.5 | L 9.2,7 9,12.5"},
    {"down", "L 8,2.5 8,13 > "},
    {"downthick", "P 5.5,2 10.5,2 10.5,8 14,8 8,14.5 2,8 5.5,8"},
    {"dragndrop", "L 8,1.5 8,14.5 | L 1.5,8 14.5,8 | L 6,3.5 8,1.5 10,3.5 | L 6,12.5 8,14.5 10,12.5 | L 3.5,6 1.5,8 3.5,10 | "
                  "L 12.5,6 14.5,8 12.5,10"},
    {"duplicate", "L 2.5,10.5 2.5,2.5 10.5,2.5 | L 5.5,5.5 13.5,5.5 13.5,13.5 5.5,13.5 5.5,5.5"},
    {"enable", "A 8,8.5,5.5,40,320 | L 8,1.5 8,8"},
    {"export", "L 6,4 2.5,4 2.5,13.5 12,13.5 12,10 | L 7,9 14,2 > | L 10,2 14,2 14,6"},
    {"eye", "P 1,8 4,4.5 8,3.5 12,4.5 15,8 12,11.5 8,12.5 4,11.5 1,8 3,8 5,10.3 8,11 11,10.3 13,8 11,5.7 8,5 5,5.7 3,8 | D 8,8,2.2"},
    {"graph", "L 2,2 2,14 14,14 | L 3.5,11 6,6 9,9 13.5,3"},
    {"heartfull", "P 8,14 2.2,8.2 1.6,5.5 2.8,3.2 5.2,2.4 7,3.2 8,4.6 9,3.2 10.8,2.4 13.2,3.2 14.4,5.5 13.8,8.2"},
    {"import", "L 6,4 2.5,4 2.5,13.5 12,13.5 12,10 | L 14,2 7,9 > | L 7,5 7,9 11,9"},
    {"invertphase", "C 8,8,5 | L 3,13 13,3"},
    {"left", "L 13,8 2.5,8 > "},
    {"lefttriangle", "P 11,3 11,13 4,8"},
    {"list", "D 3,4,1.2 | D 3,8,1.2 | D 3,12,1.2 | L 6,4 14,4 | L 6,8 14,8 | L 6,12 14,12"},
    {"load", "P 1.5,3 6,3 7.5,4.5 13,4.5 13,6 4,6 1.5,13 | P 4.5,7 15,7 12.5,13.5 1.5,13.5"},
    {"lock", "P 3,7.5 13,7.5 13,14.5 3,14.5 | A 8,6,3.5,270,450 | L 4.5,6 4.5,7.5 | L 11.5,6 11.5,7.5"},
    {"maximize", "L 2.5,2.5 13.5,2.5 13.5,13.5 2.5,13.5 2.5,2.5 | L 2.5,4.5 13.5,4.5"},
    {"menu", "L 2.5,4 13.5,4 | L 2.5,8 13.5,8 | L 2.5,12 13.5,12"},
    {"minus", "L 3,8 13,8"},
    {"network", "C 8,3,1.8 | C 3,13,1.8 | C 13,13,1.8 | L 7.1,4.6 3.9,11.4 | L 8.9,4.6 12.1,11.4 | L 4.8,13 11.2,13"},
    {"normalize", "L 1.5,2.5 14.5,2.5 | L 1.5,13.5 14.5,13.5 | L 2,8 4,4 6,12 8,3.5 10,12.5 12,5 14,8"},
    {"ok", "L 2.5,8.5 6.5,12.5 13.5,4"},
    {"panic", "L 8,1.8 14.7,13.8 1.3,13.8 8,1.8 | P 7.2,5.5 8.8,5.5 8.5,10 7.5,10 | D 8,11.8,0.9"},
    {"parallel", "L 1.5,8 4,8 | L 4,4 4,12 | L 4,4 12,4 | L 4,12 12,12 | L 12,4 12,12 | L 12,8 14.5,8"},
    {"pause", "P 3.5,3 6.5,3 6.5,13 3.5,13 | P 9.5,3 12.5,3 12.5,13 9.5,13"},
    {"pencil", "P 11,1.8 14.2,5 5.5,13.7 1.8,14.2 2.3,10.5 | L 9.5,3.3 12.7,6.5"},
    {"play", "P 4.5,2.5 13,8 4.5,13.5"},
    {"plus", "P 6.7,2 9.3,2 9.3,6.7 14,6.7 14,9.3 9.3,9.3 9.3,14 6.7,14 6.7,9.3 2,9.3 2,6.7 6.7,6.7"},
    {"presets", "L 5,3 14,3 | L 5,8 14,8 | L 5,13 14,13 | P 1.5,1.5 3.5,3 1.5,4.5 | P 1.5,6.5 3.5,8 1.5,9.5 | P 1.5,11.5 3.5,13 1.5,14.5"},
    {"process", "L 1.5,8 12,8 > | L 14.5,2.5 14.5,13.5"},
    {"randomize", "L 2.5,2.5 13.5,2.5 13.5,13.5 2.5,13.5 2.5,2.5 | D 5.3,5.3,1.2 | D 10.7,5.3,1.2 | D 8,8,1.2 | D 5.3,10.7,1.2 | D 10.7,10.7,1.2"},
    {"record", "D 8,8,5.5"},
    {"redo", "A 8,9,5,270,430 > "},
    {"repeat", "A 8,8,5.5,30,320 > "},
    {"replace", "L 2,5 12,5 > | L 14,11 4,11 > "},
    {"reset", "A 8,8,5.5,320,610 > "},
    {"rewindright", "P 1.5,3 8,8 1.5,13 | P 8,3 14.5,8 8,13"},
    {"right", "L 3,8 13.5,8 > "},
    {"righttriangle", "P 5,3 12,8 5,13"},
    {"rotate", "A 8,8,5.5,200,500 > "},
    {"save", "P 2,2 12,2 14,4 14,14 2,14 2,2 3.5,3.5 3.5,12.5 12.5,12.5 12.5,4.6 11.4,3.5 3.5,3.5 | P 5,2 11,2 11,6.5 5,6.5 | "
             "P 5,9 11,9 11,14 5,14"},
    {"search", "C 6.5,6.5,4.5 | L 9.8,9.8 14,14"},
    {"settings", "C 8,8,2.2 | A 8,8,5,0,360 | L 8,1 8,3 | L 8,13 8,15 | L 1,8 3,8 | L 13,8 15,8 | L 3.1,3.1 4.5,4.5 | "
                 "L 11.5,11.5 12.9,12.9 | L 12.9,3.1 11.5,4.5 | L 4.5,11.5 3.1,12.9"},
    {"sound", "P 1.5,6 4.5,6 8.5,2.5 8.5,13.5 4.5,10 1.5,10 | A 8.5,8,3.5,45,135 | A 8.5,8,6,40,140"},
    {"start", "P 3,3 5,3 5,13 3,13 | P 13.5,3 13.5,13 6,8"},
    {"tap", "D 8,9,2.5 | A 8,9,5,300,420 | A 8,9,5,120,240"},
    {"undo", "A 8,9,5,90,-70 > "},
    {"up", "L 8,13.5 8,3 > "},
    {"www", "C 8,8,6 | L 2,8 14,8 | L 8,2 8,14 | A 14,8,8.5,225,315 | A 2,8,8.5,45,135"},
    {"zoomdefault", "C 6.5,6.5,4.5 | L 9.8,9.8 14,14 | L 4.5,5.5 8.5,5.5 | L 4.5,7.5 8.5,7.5"},
    {"zoomin", "C 6.5,6.5,4.5 | L 9.8,9.8 14,14 | L 4.5,6.5 8.5,6.5 | L 6.5,4.5 6.5,8.5"},
    {"zoomout", "C 6.5,6.5,4.5 | L 9.8,9.8 14,14 | L 4.5,6.5 8.5,6.5"},
};
constexpr int32_t kIconCount = static_cast<int32_t>(std::size(kIcons));

const KIcon* Find(const KString& name) noexcept {
  for (const KIcon& icon : kIcons)
    if (name == KString::Static(icon.name)) return &icon;
  return nullptr;
}

struct KNames {
  const char* names[kIconCount];
  constexpr KNames() : names{} {
    for (int32_t i = 0; i < kIconCount; ++i) names[i] = kIcons[i].name;
  }
};
constexpr KNames kNames;

constexpr double kPi = 3.141592653589793;
constexpr double kStroke = 1.5;  // grid units

// One shape of an icon in grid units: a stroked polyline, a filled polygon, a stroked circle or
// a filled disc (arcs become polylines, arrowheads polygons).
struct KShape {
  char kind;  // 'L', 'P', 'C', 'D'
  std::vector<KPointF> points;
  double radius = 0;  // circles: centre in points[0]
};

// Reads the numbers of one shape ("8,3 8,13" or "8,8,5.5,30,320") and whether it ends in ">".
std::vector<double> Numbers(const char*& at, bool& arrow) {
  std::vector<double> values;
  arrow = false;
  while (*at != '\0' && *at != '|') {
    if (*at == '>') arrow = true;
    if ((*at >= '0' && *at <= '9') || *at == '-' || *at == '.') {
      char* end = nullptr;
      values.push_back(std::strtod(at, &end));
      at = end;
    } else {
      ++at;
    }
  }
  if (*at == '|') ++at;
  return values;
}

std::vector<KShape> Shapes(const KIcon& icon) {
  std::vector<KShape> shapes;
  const char* text = icon.shapes;
  while (*text != '\0') {
    while (*text == ' ') ++text;
    const char kind = *text;
    if (kind == '\0') break;
    bool arrow = false;
    const std::vector<double> v = Numbers(++text, arrow);
    KShape shape{kind == 'A' ? 'L' : kind, {}};
    if (kind == 'C' || kind == 'D') {
      if (v.size() >= 3) shapes.push_back({kind, {{v[0], v[1]}}, v[2]});
      continue;
    }
    if (kind == 'A' && v.size() >= 5) {
      constexpr int32_t kSteps = 24;
      for (int32_t s = 0; s <= kSteps; ++s) {
        const double a = (v[3] + (v[4] - v[3]) * s / kSteps) * kPi / 180.0;
        shape.points.push_back({v[0] + v[2] * std::sin(a), v[1] - v[2] * std::cos(a)});
      }
    } else {
      for (size_t i = 0; i + 1 < v.size(); i += 2) shape.points.push_back({v[i], v[i + 1]});
    }
    if (shape.points.size() < 2) continue;
    shapes.push_back(shape);
    if (!arrow) continue;
    // A filled head along the last segment.
    const KPointF tip = shape.points.back(), from = shape.points[shape.points.size() - 2];
    const double dx = tip.x - from.x, dy = tip.y - from.y, length = std::hypot(dx, dy);
    if (length <= 0) continue;
    const double ux = dx / length, uy = dy / length, size = 3.2;
    shapes.push_back({'P',
                      {{tip.x + ux, tip.y + uy},
                       {tip.x - ux * size + uy * size * 0.8, tip.y - uy * size - ux * size * 0.8},
                       {tip.x - ux * size - uy * size * 0.8, tip.y - uy * size + ux * size * 0.8}}});
  }
  return shapes;
}

}  // namespace

std::span<const char* const> KVectorIcons::Names() noexcept { return kNames.names; }

bool KVectorIcons::Has(const KString& name) noexcept { return Find(name) != nullptr; }

bool KVectorIcons::Paint(KDrawer& drawer, const KString& name, const KRect& rect, KColor colour, uint8_t opacity) {
  const KIcon* icon = Find(name);
  if (!icon) return false;
  const double side = static_cast<double>(std::min(rect.Width(), rect.Height()));
  const double unit = side / 16.0;
  // Grid (0, 0) is the square's top-left edge, half a pixel before the centre of its first pixel.
  const double left = static_cast<double>(rect.left) + (static_cast<double>(rect.Width()) - side) / 2 - 0.5;
  const double top = static_cast<double>(rect.top) + (static_cast<double>(rect.Height()) - side) / 2 - 0.5;
  const double savedWidth = drawer.LineWidth();
  drawer.SetLineWidth(kStroke * unit);
  for (KShape& shape : Shapes(*icon)) {
    for (KPointF& p : shape.points) p = {left + p.x * unit, top + p.y * unit};
    switch (shape.kind) {
      case 'L': drawer.PolyLineF(shape.points, colour, opacity, kDrawBlend); break;
      case 'P': drawer.FillPolygon(shape.points, {}, colour, opacity, kDrawBlend); break;
      case 'C': drawer.Circle(shape.points[0], shape.radius * unit, colour, opacity, kDrawBlend); break;
      default: drawer.FillCircle(shape.points[0], shape.radius * unit, colour, opacity, kDrawBlend); break;
    }
  }
  drawer.SetLineWidth(savedWidth);
  return true;
}

std::string KVectorIcons::Svg(const KString& name) {
  const KIcon* icon = Find(name);
  if (!icon) return {};
  std::string svg = "<svg class=\"icon\" viewBox=\"0 0 16 16\" fill=\"currentColor\" stroke=\"currentColor\" stroke-width=\"1.5\" "
                    "stroke-linejoin=\"round\">";
  char number[32];
  auto append = [&](double value) { svg.append(number, static_cast<size_t>(std::snprintf(number, sizeof number, "%.2f", value))); };
  for (const KShape& shape : Shapes(*icon)) {
    if (shape.kind == 'C' || shape.kind == 'D') {
      svg.append("<circle cx=\"");
      append(shape.points[0].x);
      svg.append("\" cy=\"");
      append(shape.points[0].y);
      svg.append("\" r=\"");
      append(shape.radius);
      svg.append(shape.kind == 'C' ? "\" fill=\"none\"/>" : "\" stroke=\"none\"/>");
      continue;
    }
    svg.append(shape.kind == 'L' ? "<polyline fill=\"none\" points=\"" : "<polygon stroke=\"none\" points=\"");
    for (const KPointF& p : shape.points) {
      append(p.x);
      svg.push_back(',');
      append(p.y);
      svg.push_back(' ');
    }
    svg.back() = '"';
    svg.append("/>");
  }
  return svg.append("</svg>");
}
