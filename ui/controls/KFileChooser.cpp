#include "ui/controls/KFileChooser.h"

#include <algorithm>
#include <cctype>
#include <memory>

#include "kernel/KException.h"
#include "kernel/platform/KPlatform.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KPopups.h"
#include "ui/controls/KStyle.h"

namespace {

constexpr int32_t kPadding = 12;
constexpr int32_t kLineHeight = 24;
constexpr int32_t kButtonWidth = 80;

bool EndsWithNoCase(const std::string& name, const std::string& ending) {
  if (name.size() < ending.size()) return false;
  return std::equal(ending.begin(), ending.end(), name.end() - static_cast<std::ptrdiff_t>(ending.size()), [](char a, char b) {
    return std::tolower(static_cast<unsigned char>(a)) == std::tolower(static_cast<unsigned char>(b));
  });
}

void PaintButton(KDrawer& drawer, const KStyle& style, const KRect& area, const char* caption, bool enabled) {
  drawer.FillRoundRectangle(area, 4, style.Get(KStyle::kControlFace), 255, kDrawBlend);
  drawer.RoundRectangle(area, 4, style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
  drawer.AlignedTextOut(area, KString::Static(caption), style.LabelFont(), style.Get(enabled ? KStyle::kText : KStyle::kTextDim),
                        kAlignCentre | kAlignMiddle, 255, kDrawBlend);
}

}  // namespace

KFileChooser::KFileChooser(const KRect& window, KString title, const std::string& folder, std::vector<std::string> extensions,
                           Choose choose)
    : KControl(window), title_(std::move(title)), extensions_(std::move(extensions)), choose_(std::move(choose)) {
  const int32_t width = std::min<int32_t>(520, static_cast<int32_t>(window.Width()) - 24);
  const int32_t height = std::min<int32_t>(420, static_cast<int32_t>(window.Height()) - 24);
  const int32_t left = window.left + (static_cast<int32_t>(window.Width()) - width) / 2;
  const int32_t top = window.top + (static_cast<int32_t>(window.Height()) - height) / 2;
  card_ = {left, top, left + width - 1, top + height - 1};
  const int32_t inLeft = card_.left + kPadding, inRight = card_.right - kPadding;
  path_ = {inLeft, card_.top + kPadding + kLineHeight, inRight, card_.top + kPadding + 2 * kLineHeight - 3};
  cancel_ = {inRight - kButtonWidth + 1, card_.bottom - kPadding - kLineHeight + 1, inRight, card_.bottom - kPadding};
  open_ = {cancel_.left - 8 - kButtonWidth, cancel_.top, cancel_.left - 9, cancel_.bottom};
  list_ = {inLeft, path_.bottom + 8, inRight, cancel_.top - 9};
  Show(folder);
}

void KFileChooser::Show(const std::string& folder) {
  std::vector<Entry> entries;
  KString problem;
  const std::string shown = KPlatform::AsFolder(folder);
  try {
    const std::string parent = KPlatform::ParentFolder(shown);
    if (parent != shown) entries.push_back({"..", true});
    for (const std::string& name : KPlatform::ListFolders(shown))
      if (name.front() != '.') entries.push_back({name, true});
    for (const std::string& name : KPlatform::ListFiles(shown))
      if (name.front() != '.' && std::any_of(extensions_.begin(), extensions_.end(), [&](const std::string& e) { return EndsWithNoCase(name, e); }))
        entries.push_back({name, false});
  } catch (const KException& e) {
    problem = e.Message();
  }
  folder_ = shown;
  entries_ = std::move(entries);
  problem_ = problem;
  selected_ = entries_.empty() ? -1 : 0;
  first_ = 0;
  Invalidate();
}

int32_t KFileChooser::VisibleRows() const noexcept { return std::max<int32_t>(1, static_cast<int32_t>(list_.Height()) / kRowHeight); }

KRect KFileChooser::RowArea(int32_t index) const noexcept {
  const int32_t row = index - first_;
  if (index < 0 || index >= static_cast<int32_t>(entries_.size()) || row < 0 || row >= VisibleRows()) return {};
  const int32_t top = list_.top + 2 + row * kRowHeight;
  return {list_.left + 2, top, list_.right - 2, top + kRowHeight - 1};
}

int32_t KFileChooser::RowAt(KPoint at) const noexcept {
  if (!KContains(list_, at)) return -1;
  const int32_t index = first_ + (at.y - list_.top - 2) / kRowHeight;
  return index < static_cast<int32_t>(entries_.size()) ? index : -1;
}

void KFileChooser::Select(int32_t index) {
  if (entries_.empty()) return;
  selected_ = std::clamp(index, 0, static_cast<int32_t>(entries_.size()) - 1);
  // The selection stays in view.
  if (selected_ < first_) first_ = selected_;
  if (selected_ >= first_ + VisibleRows()) first_ = selected_ - VisibleRows() + 1;
  Invalidate();
}

void KFileChooser::Activate(int32_t index) {
  if (index < 0 || index >= static_cast<int32_t>(entries_.size())) return;
  const Entry entry = entries_[static_cast<size_t>(index)];
  if (entry.name == "..") return Show(KPlatform::ParentFolder(folder_));
  if (entry.folder) return Show(KPlatform::SubfolderPath(folder_, entry.name));
  const std::string path = folder_ + entry.name;
  const Choose choose = choose_;
  Close();
  if (choose) choose(path);
}

// A typed path: a file of a listed kind is chosen, anything else is shown as a folder.
void KFileChooser::EditPath() {
  KControlTree* tree = Tree();
  if (!tree) return;
  auto field = std::make_unique<KTextField>(path_, KString::FromUtf8(folder_), [this](const KString& text) {
    const std::string typed = text.ToUtf8();
    const bool file = std::any_of(extensions_.begin(), extensions_.end(), [&](const std::string& e) { return EndsWithNoCase(typed, e); });
    if (!file) return Show(typed);
    const Choose choose = choose_;
    Close();
    if (choose) choose(typed);
  });
  tree->SetFocus(&tree->Root().Add(std::move(field)));
}

void KFileChooser::Close() {
  if (KControlTree* tree = Tree()) {
    if (tree->Focused() == this) tree->SetFocus(nullptr);
    tree->Dismiss(*this);
  }
}

bool KFileChooser::OnMouseDown(const KMouseEvent& event) {
  if (KContains(path_, event.at)) EditPath();
  else if (KContains(cancel_, event.at)) Close();
  else if (KContains(open_, event.at)) Activate(selected_);
  else if (const int32_t row = RowAt(event.at); row >= 0) Select(row);
  return true;
}

bool KFileChooser::OnDoubleClick(const KMouseEvent& event) {
  const int32_t row = RowAt(event.at);
  if (row >= 0) Activate(row);
  else OnMouseDown(event);
  return true;
}

bool KFileChooser::OnWheel(const KMouseEvent& event) {
  const int32_t most = std::max<int32_t>(0, static_cast<int32_t>(entries_.size()) - VisibleRows());
  first_ = std::clamp(first_ - static_cast<int32_t>(event.wheel * 3), 0, most);
  Invalidate();
  return true;
}

bool KFileChooser::OnKey(const KKeyEvent& event) {
  switch (event.key) {
    case kKeyEscape: Close(); break;
    case kKeyReturn: Activate(selected_); break;
    case kKeyBackspace: Show(KPlatform::ParentFolder(folder_)); break;
    case kKeyUp: Select(selected_ - 1); break;
    case kKeyDown: Select(selected_ + 1); break;
    case kKeyHome: Select(0); break;
    case kKeyEnd: Select(static_cast<int32_t>(entries_.size()) - 1); break;
    default: break;
  }
  return true;  // nothing reaches the editor while the chooser is open
}

void KFileChooser::Paint(KDrawer& drawer, const KStyle& style) {
  // Opaque throughout, like the help window: the card is painted again over whatever repaints under it.
  drawer.FillRectangle(KInset(card_, -3), style.Get(KStyle::kHeader), 255, kDrawCopy);
  drawer.FillRoundRectangle(card_, 8, style.Get(KStyle::kPanel), 255, kDrawBlend);
  drawer.RoundRectangle(card_, 8, style.Get(KStyle::kAccent), 255, kDrawBlend);
  drawer.AlignedTextOut({path_.left, card_.top + kPadding, path_.right, path_.top - 4}, title_, style.LabelFont(), style.Get(KStyle::kText),
                        kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  drawer.FillRoundRectangle(path_, 3, style.Get(KStyle::kGraphBack), 255, kDrawBlend);
  drawer.RoundRectangle(path_, 3, style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
  drawer.AlignedTextOut(KInset(path_, 4), KString::FromUtf8(folder_), style.LabelFont(), style.Get(KStyle::kValueText),
                        kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  drawer.FillRoundRectangle(list_, 3, style.Get(KStyle::kGraphBack), 255, kDrawBlend);
  drawer.RoundRectangle(list_, 3, style.Get(KStyle::kPanelBorder), 255, kDrawBlend);
  if (!problem_.IsEmpty())
    drawer.AlignedTextOut(KInset(list_, 8), problem_, style.LabelFont(), style.Get(KStyle::kTextDim), kAlignLeft | kAlignTop, 255,
                          kDrawBlend);
  for (int32_t i = first_; i < static_cast<int32_t>(entries_.size()) && i < first_ + VisibleRows(); ++i) {
    const KRect row = RowArea(i);
    const Entry& entry = entries_[static_cast<size_t>(i)];
    if (i == selected_) drawer.FillRoundRectangle(row, 3, style.Get(KStyle::kAccent), 255, kDrawBlend);
    KString text = KString::FromUtf8(entry.name);
    // Folders carry a trailing slash, so that they read apart from files at a glance.
    if (entry.folder && entry.name != "..") text.Append(u'/');
    const KColor colour = i == selected_ ? style.Get(KStyle::kHeader) : style.Get(entry.folder ? KStyle::kText : KStyle::kValueText);
    drawer.AlignedTextOut({row.left + 6, row.top, row.right - 6, row.bottom}, text, style.LabelFont(), colour, kAlignLeft | kAlignMiddle,
                          255, kDrawBlend);
  }
  PaintButton(drawer, style, open_, "Open", selected_ >= 0);
  PaintButton(drawer, style, cancel_, "Cancel", true);
}
