#include "ui/editor/KEditor.h"

#include <algorithm>
#include <cctype>
#include <cmath>
#include <sstream>
#include <vector>

#include "core/KParameter.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KUserMessage.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/KHelpTexts.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KEditorHost.h"
#include "ui/controls/KLabels.h"
#include "ui/controls/KLevelMeterControl.h"
#include "ui/controls/KParameterLink.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KValueControl.h"
#include "ui/editor/KEditorPanels.h"
#include "ui/editor/KHelpPanel.h"

namespace {

constexpr int32_t kCellWidth = 84;
constexpr int32_t kKnobHeight = 100;
constexpr int32_t kListHeight = 56;
constexpr int32_t kSwitchHeight = 28;
constexpr int32_t kPanelPadding = 10;
constexpr int32_t kGap = 10;
constexpr int32_t kMaxRowWidth = 1100;
constexpr int32_t kMeterWidth = 30;
constexpr int32_t kGraphSide = 300;
constexpr int32_t kGraphMinSide = 220;
constexpr int32_t kGraphTopHeight = 220;

double ToDecibels(double linear) noexcept { return linear > 1e-6 ? 20 * std::log10(linear) : -120; }

// The parameter indices of a section's keys; unknown keys are skipped.
std::vector<int32_t> IndicesOf(KAudioPlugin& plugin, const char* keys) {
  std::vector<int32_t> indices;
  std::istringstream in(keys);
  std::string key;
  while (in >> key)
    if (KAudioPluginBase::Parameter* p = plugin.FindParameter(KString::FromUtf8(key))) indices.push_back(p->Index());
  return indices;
}

// A parameter's name without the section's title in front ("Band 1 frequency" in "Band 1" is
// "Frequency").
KString ShortLabel(const KString& name, const KString& section) {
  const int32_t n = section.Length();
  if (name.Length() <= n + 1 || name.CharAt(n) != u' ') return name;
  for (int32_t i = 0; i < n; ++i)
    if (std::tolower(name.CharAt(i)) != std::tolower(section.CharAt(i))) return name;
  KString rest;
  const char16_t first = name.CharAt(n + 1);
  rest.Append(first >= u'a' && first <= u'z' ? static_cast<char16_t>(first - u'a' + u'A') : first);
  rest.AppendPart(name, n + 2, name.Length() - n - 2);
  return rest;
}

struct PlannedSection {
  KString title;
  std::vector<int32_t> cells;     // knobs and drop-downs, in order
  std::vector<int32_t> switches;  // rows below
  int32_t columns;
  std::vector<bool> lists;        // per cell: a drop-down
  int32_t switchWidth = 0;        // the widest switch with its label
  // A row of drop-downs only is lower than a row with a knob.
  std::vector<int32_t> RowHeights() const {
    std::vector<int32_t> heights;
    for (size_t c = 0; c < cells.size(); c += static_cast<size_t>(columns)) {
      bool onlyLists = true;
      for (size_t k = c; k < std::min(cells.size(), c + static_cast<size_t>(columns)); ++k) onlyLists = onlyLists && lists[k];
      heights.push_back(onlyLists ? kListHeight : kKnobHeight);
    }
    return heights;
  }
  int32_t Width() const noexcept {
    const int32_t used = std::max(1, std::min<int32_t>(columns, static_cast<int32_t>(cells.size())));
    return std::max(cells.empty() ? 0 : used * kCellWidth, switchWidth) + 2 * kPanelPadding;
  }
  int32_t Height() const noexcept {
    int32_t rows = 0;
    for (int32_t h : RowHeights()) rows += h;
    return KSectionPanel::kTitleHeight + 8 + rows + static_cast<int32_t>(switches.size()) * kSwitchHeight + kPanelPadding;
  }
};

}  // namespace

// The background; the editor's keys end here whatever has the focus.
class KEditor::Body final : public KEditorBackground {
public:
  Body(const KRect& bounds, KEditor& editor) : KEditorBackground(bounds), editor_(editor) {}
  bool OnKey(const KKeyEvent& event) override {
    const bool control = (event.modifiers & kModControl) != 0;
    const int32_t key = event.key >= 'A' && event.key <= 'Z' ? event.key + 32 : event.key;
    if (control && (key == 'y' || (key == 'z' && (event.modifiers & kModShift)))) editor_.Redo();
    else if (control && key == 'z') editor_.Undo();
    else if (event.key == kKeyF1 || (control && key == 'h')) editor_.ShowHelpAt(editor_.Tree().MousePosition());
    else return false;
    return true;
  }

private:
  KEditor& editor_;
};

KEditor::KEditor(KAudioPlugin& plugin, const KString& title, const KEditorDescription& description, KEditorHost* host,
                 KStyle style)
    : plugin_(plugin), host_(host), style_(std::move(style)), description_(description) {
  // No peak held past its sub-block; the meters read the peaks taken since their last tick.
  plugin_.SetMeterReset(true);
  Build(description, title);
}

KEditor::~KEditor() = default;

int32_t KEditor::PixelWidth() const noexcept { return static_cast<int32_t>(std::lround(width_ * scale_)); }
int32_t KEditor::PixelHeight() const noexcept { return static_cast<int32_t>(std::lround(height_ * scale_)); }

void KEditor::Build(const KEditorDescription& description, const KString& title) {
  // ---- plan: which control each parameter gets, in which section
  std::vector<PlannedSection> sections;
  const auto plan = [&](const KString& name, const std::vector<int32_t>& indices, int32_t columns) {
    PlannedSection section{name, {}, {}, std::max(1, columns), {}, 0};
    for (int32_t index : indices) {
      const int32_t steps = plugin_.GetParameter(index).Steps();
      (steps == 1 ? section.switches : section.cells).push_back(index);
      if (steps != 1) section.lists.push_back(steps > 1);
      // The pill, a gap and the label.
      const KString label = ShortLabel(plugin_.GetParameter(index).Name(), name);
      if (steps == 1) section.switchWidth = std::max(section.switchWidth, 46 + static_cast<int32_t>(style_.LabelFont().TextWidth(label)));
    }
    sections.push_back(std::move(section));
  };
  if (description.sections.empty()) {
    std::vector<int32_t> all(static_cast<size_t>(plugin_.ParameterCount()));
    for (int32_t i = 0; i < plugin_.ParameterCount(); ++i) all[static_cast<size_t>(i)] = i;
    plan(KString("Controls"), all, 4);
  }
  for (const KEditorSection& s : description.sections) plan(KString::FromUtf8(s.title), IndicesOf(plugin_, s.keys), s.columns);

  // ---- place: sections in rows beside or below the graph, meters at the right
  const bool graphLeft = description.graph && description.graphPlace == KEditorDescription::kGraphLeft;
  const bool graphTop = description.graph && description.graphPlace == KEditorDescription::kGraphTop;
  const int32_t meterCount = plugin_.GetShape().inputBuses > 0 ? (description.gainReduction ? 3 : 2) : 1;
  int32_t sectionsLeft = kMargin;
  int32_t rowsWidth = 0;
  int32_t x = 0, y = 0, rowHeight = 0;
  struct Placed {
    size_t section;
    KRect rect;
  };
  std::vector<Placed> placed;
  std::vector<size_t> rowStart{0};
  for (size_t i = 0; i < sections.size(); ++i) {
    const int32_t w = sections[i].Width();
    if (x > 0 && x + w > kMaxRowWidth) {
      rowStart.push_back(placed.size());
      y += rowHeight + kGap;
      x = 0;
      rowHeight = 0;
    }
    placed.push_back({i, {x, y, x + w - 1, y + sections[i].Height() - 1}});
    x += w + kGap;
    rowsWidth = std::max(rowsWidth, x - kGap);
    rowHeight = std::max(rowHeight, sections[i].Height());
  }
  // Sections of a row share its height.
  rowStart.push_back(placed.size());
  for (size_t r = 0; r + 1 < rowStart.size(); ++r) {
    int32_t bottom = 0;
    for (size_t p = rowStart[r]; p < rowStart[r + 1]; ++p) bottom = std::max(bottom, placed[p].rect.bottom);
    for (size_t p = rowStart[r]; p < rowStart[r + 1]; ++p) placed[p].rect.bottom = bottom;
  }
  const int32_t sectionsHeight = placed.empty() ? 0 : placed.back().rect.bottom + 1;
  // A graph beside the sections is square and as tall as they are, within bounds.
  const int32_t graphSide = std::clamp(sectionsHeight, kGraphMinSide, kGraphSide);
  const int32_t top = kHeaderHeight + kMargin + (graphTop ? kGraphTopHeight + kGap : 0);
  if (graphLeft) sectionsLeft += graphSide + kGap;
  const int32_t contentHeight = std::max(sectionsHeight, graphLeft ? graphSide : 0);
  const int32_t metersLeft = sectionsLeft + rowsWidth + kGap;
  width_ = metersLeft + meterCount * (kMeterWidth + 8) - 8 + kMargin;
  width_ = std::max(width_, 560);
  height_ = top + contentHeight + kMargin;

  tree_ = std::make_unique<KControlTree>(KRect{0, 0, width_ - 1, height_ - 1});
  tree_->SetStyle(style_);
  KControl& body = tree_->Root().Emplace<Body>(KRect{0, 0, width_ - 1, height_ - 1}, *this);

  // ---- the title bar
  KControl& header = body.Emplace<KHeaderBar>(KRect{0, 0, width_ - 1, kHeaderHeight - 1});
  int32_t right = width_ - kMargin;
  const auto button = [&](int32_t w, const char* caption, KButton::Action action, KButton::Enabled enabled, const char* help) -> KButton& {
    KButton& b = header.Emplace<KButton>(KRect{right - w + 1, 10, right, kHeaderHeight - 11}, KString::Static(caption),
                                         std::move(action), std::move(enabled), KString::Static(help));
    right -= w + 6;
    return b;
  };
  button(28, "?", [this] { ShowHelp({}); }, {}, "");
  sizeButton_ = &button(58, "100 %", [this] { OpenSizeMenu(); }, {}, "editor-size");
  sizeButton_->SetCaptionSource([this] { return KFormat("{0} %").Arg(static_cast<int32_t>(std::lround(scale_ * 100))).Text(); });
  button(52, "Redo", [this] { Redo(); }, [this] { return plugin_.CanRedo(); }, "redo");
  button(52, "Undo", [this] { Undo(); }, [this] { return plugin_.CanUndo(); }, "undo");
  // A narrow editor narrows the preset button first, so that the plug-in's name keeps its room.
  constexpr int32_t kTitleRoom = 180;
  presetButton_ = &button(std::clamp(right - kMargin - 4 - kTitleRoom - 6, 96, 180), "", [this] { OpenPresetMenu(); }, {}, "presets");
  header.Emplace<KTextLabel>(KRect{kMargin + 4, 0, std::max(kMargin + 4 + kTitleRoom, right), kHeaderHeight - 1}, title, KTextLabel::kTitle);
  // The button names the active preset, with a star once the settings left it.
  presetButton_->SetCaptionSource([this] {
    if (plugin_.ActivePresetName().IsEmpty()) return KString("Presets");
    KString caption = plugin_.ActivePresetName();
    if (!plugin_.IsActivePresetCurrent()) caption.Append(u' ').Append(u'*');
    return caption;
  });

  // ---- the graph
  if (graphLeft)
    body.Add(description.graph(KRect{kMargin, top, kMargin + graphSide - 1, top + graphSide - 1}, plugin_, host_));
  if (graphTop)
    body.Add(description.graph(KRect{kMargin, kHeaderHeight + kMargin, metersLeft - kGap - 1, kHeaderHeight + kMargin + kGraphTopHeight - 1},
                               plugin_, host_));

  // ---- the sections
  for (const Placed& p : placed) {
    const PlannedSection& s = sections[p.section];
    KRect r{sectionsLeft + p.rect.left, top + p.rect.top, sectionsLeft + p.rect.right, top + p.rect.bottom};
    // The last row reaches down to the graph's foot.
    if (p.rect.bottom == sectionsHeight - 1) r.bottom = top + contentHeight - 1;
    KControl& panel = body.Emplace<KSectionPanel>(r, s.title);
    const int32_t innerWidth = static_cast<int32_t>(r.Width()) - 2 * kPanelPadding;
    const int32_t columns = std::max(1, std::min<int32_t>(s.columns, static_cast<int32_t>(s.cells.size())));
    const int32_t cellWidth = innerWidth / columns;
    const std::vector<int32_t> rowHeights = s.RowHeights();
    int32_t cy = r.top + KSectionPanel::kTitleHeight + 8;
    for (size_t c = 0; c < s.cells.size(); ++c) {
      const size_t row = c / static_cast<size_t>(columns);
      const int32_t column = static_cast<int32_t>(c % static_cast<size_t>(columns));
      if (c > 0 && column == 0) cy += rowHeights[row - 1];
      const int32_t cx = r.left + kPanelPadding + column * cellWidth;
      const KParameterLink link(plugin_, s.cells[c], host_);
      KParameterControl& control =
          s.lists[c] ? static_cast<KParameterControl&>(panel.Emplace<KDropDown>(KRect{cx + 2, cy, cx + cellWidth - 3, cy + 46}, link))
                     : panel.Emplace<KKnob>(KRect{cx, cy, cx + cellWidth - 1, cy + kKnobHeight - 5}, link);
      control.SetLabel(ShortLabel(control.Label(), s.title));
    }
    if (!s.cells.empty()) cy += rowHeights.back();
    for (int32_t index : s.switches) {
      KSwitch& toggle = panel.Emplace<KSwitch>(KRect{r.left + kPanelPadding, cy, r.right - kPanelPadding, cy + kSwitchHeight - 3},
                                               KParameterLink(plugin_, index, host_));
      toggle.SetLabel(ShortLabel(toggle.Label(), s.title));
      cy += kSwitchHeight;
    }
  }

  // ---- the meters, lock-free reads of what the audio thread published
  int32_t mx = metersLeft;
  const KRect meterBox{0, top, 0, top + contentHeight - 1};
  const auto meter = [&](const char* caption, KLevelMeterControl::Kind kind, KLevelMeterControl::Source source) {
    body.Emplace<KLevelMeterControl>(KRect{mx, meterBox.top, mx + kMeterWidth - 1, meterBox.bottom}, KString::Static(caption), kind,
                                     kind == KLevelMeterControl::kLevel ? 2 : 1, std::move(source));
    mx += kMeterWidth + 8;
  };
  const auto levels = [this](KAudioPlugin::Meter first, KAudioPlugin::Meter second) {
    return [this, first, second](double& l, double& r) {
      l = ToDecibels(plugin_.GetMeter(first).TakePeak());
      r = ToDecibels(plugin_.GetMeter(second).TakePeak());
    };
  };
  if (plugin_.GetShape().inputBuses > 0) meter("In", KLevelMeterControl::kLevel, levels(KAudioPlugin::kInputLeft, KAudioPlugin::kInputRight));
  if (description.gainReduction && plugin_.GetShape().inputBuses > 0)
    meter("GR", KLevelMeterControl::kGainReduction, [this, f = description.gainReduction](double& l, double& r) { l = r = f(plugin_); });
  meter("Out", KLevelMeterControl::kLevel, levels(KAudioPlugin::kOutputLeft, KAudioPlugin::kOutputRight));
}

KPopupMenu& KEditor::OpenMenu(const KRect& anchor, std::vector<KString> items, int32_t current, std::function<void(int32_t)> choose) {
  auto menu = std::make_unique<KPopupMenu>(tree_->Root().Bounds(), anchor, std::move(items), current, std::move(choose));
  KPopupMenu& opened = *menu;
  tree_->Root().Add(std::move(menu));
  tree_->SetFocus(&opened);
  return opened;
}

void KEditor::OpenSizeMenu() {
  std::vector<KString> items;
  int32_t current = 0;
  for (int32_t i = 0; i < static_cast<int32_t>(std::size(kScales)); ++i) {
    items.push_back(KFormat("{0} %").Arg(static_cast<int32_t>(kScales[i] * 100)).Text());
    if (kScales[i] == scale_) current = i;
  }
  OpenMenu(sizeButton_->Bounds(), items, current, [this](int32_t i) { SetScale(kScales[i]); });
}

// The factory presets under a heading of their own, then the user's, then what can be done
// with the user's: the factory's are only loaded, never renamed or deleted.
void KEditor::OpenPresetMenu() {
  KStringList names = plugin_.FactoryPresetNames();
  const int32_t factory = names.Count();
  try {
    names = plugin_.ListPresets();
  } catch (const KException& e) {
    KShowUserMessage(e.Message());
  }
  std::vector<KString> items;
  std::vector<int32_t> presetOf;  // per item: its place in the preset list, or -1
  std::vector<int32_t> headings;
  for (int32_t i = 0; i < names.Count(); ++i) {
    if (i == 0 || i == factory) {
      headings.push_back(static_cast<int32_t>(items.size()));
      items.push_back(KString::Static(i < factory ? "Factory presets" : "My presets"));
      presetOf.push_back(-1);
    }
    items.push_back(names[i]);
    presetOf.push_back(i);
  }
  const int32_t save = static_cast<int32_t>(items.size());
  items.push_back(KString("Save preset..."));
  const bool userActive = !plugin_.ActivePresetName().IsEmpty() && !plugin_.IsActivePresetFactory();
  if (userActive) {
    items.push_back(KString("Rename preset..."));
    items.push_back(KString("Delete preset"));
  }
  const int32_t currentPreset = plugin_.GlobalSettings().presetIndex;
  const auto current = std::find(presetOf.begin(), presetOf.end(), currentPreset);
  const int32_t highlighted = currentPreset >= 0 && current != presetOf.end() ? static_cast<int32_t>(current - presetOf.begin()) : -1;
  KPopupMenu& menu = OpenMenu(presetButton_->Bounds(), items, highlighted, [this, presetOf, save](int32_t i) {
    if (i < save) return Guarded([&] { SelectPreset(presetOf[static_cast<size_t>(i)]); });
    const KString active = plugin_.ActivePresetName();
    if (i > save + 1) return Guarded([&] { plugin_.DeletePreset(active); });
    // Save and rename ask for the name in a field over the button.
    const bool rename = i == save + 1;
    KControl& field = tree_->Root().Add(std::make_unique<KTextField>(presetButton_->Bounds(), active, [this, rename, active](const KString& name) {
      Guarded([&] {
        if (rename) plugin_.RenamePreset(active, name);
        else plugin_.SavePreset(name);
      });
    }));
    tree_->SetFocus(&field);
  });
  for (int32_t heading : headings) menu.MarkHeading(heading);
}

template <class F>
void KEditor::Guarded(F&& action) {
  try {
    action();
  } catch (const KException& e) {
    KShowUserMessage(e.Message());
  }
}

bool KEditor::SetScale(double scale) {
  if (scale == scale_) return true;
  if (host_ && !host_->ResizeView(static_cast<int32_t>(std::lround(width_ * scale)), static_cast<int32_t>(std::lround(height_ * scale))))
    return false;
  scale_ = scale;
  tree_->InvalidateAll();
  return true;
}

template <class F>
void KEditor::ChangeAll(F&& change) {
  KChangeParameters(plugin_, host_, change);
}

void KEditor::Undo() {
  ChangeAll([this] { plugin_.Undo(); });
}

void KEditor::Redo() {
  ChangeAll([this] { plugin_.Redo(); });
}

void KEditor::SelectPreset(int32_t index) {
  ChangeAll([this, index] { plugin_.SelectPreset(index); });
}

void KEditor::ShowHelpAt(KPoint at) {
  for (KControl* control = tree_->Root().FindAt(at); control; control = control->Parent()) {
    const KString key = control->HelpKey();
    if (!key.IsEmpty()) {
      ShowHelp(key);
      return;
    }
  }
  ShowHelp({});
}

void KEditor::ShowHelp(const KString& key) {
  KString markup = description_.help ? description_.help(plugin_, key) : KString();
  if (markup.IsEmpty()) markup = KHelpTexts::ControlHelp({}, KHelpTexts::KnobActions());
  KControl& panel = tree_->Root().Add(std::make_unique<KHelpPanel>(tree_->Root().Bounds(), markup));
  tree_->SetFocus(&panel);
}

KRect KEditor::PaintAll(KDrawer& drawer) {
  tree_->InvalidateAll();
  return tree_->Paint(drawer);
}

KBitmap KEditor::Render() {
  KBitmap picture(PixelWidth(), PixelHeight());
  KDrawerToKBitmap drawer(picture, scale_);
  PaintAll(drawer);
  return picture;
}
