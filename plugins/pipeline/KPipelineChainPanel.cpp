#include "plugins/pipeline/KPipelineChainPanel.h"

#include "core/KParameter.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KRegistries.h"
#include "kernel/KUserMessage.h"
#include "plugins/pipeline/KEffectPipeline.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KLabels.h"
#include "ui/controls/KParameterLink.h"
#include "ui/controls/KPopups.h"
#include "ui/editor/KEditorPanels.h"

namespace {
constexpr int32_t kPadding = 10;
// Columns of a row, from the section's inner left edge: slot, name, then the buttons.
constexpr int32_t kNameLeft = 64;
constexpr int32_t kButtonsLeft = 300;
constexpr int32_t kButtonWidth = 90;
constexpr int32_t kButtonGap = 6;
}  // namespace

KPipelineChainPanel::KPipelineChainPanel(const KRect& bounds, KEffectPipeline& pipeline, KEditorHost* host)
    : KControl(bounds), pipeline_(pipeline), host_(host) {
  section_ = &Emplace<KSectionPanel>(bounds, KString::Static("Modules"));
  const KRect addArea{bounds.right - kPadding - 130, bounds.top + 3, bounds.right - kPadding, bounds.top + KSectionPanel::kTitleHeight - 3};
  add_ = &section_->Emplace<KButton>(
      addArea, KString::Static("Add module..."), [this] { OpenAddMenu(); },
      [this] { return pipeline_.ModuleCount() < KEffectPipeline::kSlots; }, KString::Static(kAddKey));
  Rebuild();
}

KPipelineChainPanel::Shown KPipelineChainPanel::Current() const {
  Shown shown;
  for (int32_t position = 0; position < pipeline_.ModuleCount(); ++position) shown.emplace_back(pipeline_.KeyAt(position), pipeline_.SlotAt(position));
  return shown;
}

void KPipelineChainPanel::OnTimer() {
  if (Current() != shown_) Rebuild();
}

void KPipelineChainPanel::Rebuild() {
  for (KControl* row : rows_) section_->Remove(*row);
  rows_.clear();
  shown_ = Current();
  const KRect& r = Bounds();
  const int32_t left = r.left + kPadding;
  int32_t top = r.top + KSectionPanel::kTitleHeight + 6;
  const auto place = [&](std::unique_ptr<KControl> control) { rows_.push_back(&section_->Add(std::move(control))); };
  if (shown_.empty())
    place(std::make_unique<KTextLabel>(KRect{left, top, r.right - kPadding, top + kRowHeight - 5},
                                       KString::Static("No modules yet: \"Add module...\" puts the first one in.")));
  const int32_t last = static_cast<int32_t>(shown_.size()) - 1;
  for (int32_t position = 0; position <= last; ++position) {
    const int32_t slot = shown_[static_cast<size_t>(position)].second;
    const int32_t bottom = top + kRowHeight - 5;
    place(std::make_unique<KTextLabel>(KRect{left, top, left + kNameLeft - 6, bottom}, KFormat("Slot {0}").Arg(slot + 1).Text()));
    place(std::make_unique<KTextLabel>(KRect{left + kNameLeft, top, left + kButtonsLeft - 6, bottom}, shown_[static_cast<size_t>(position)].first,
                                       KTextLabel::kTitle));
    int32_t x = left + kButtonsLeft;
    const auto button = [&](const char* caption, KButton::Action action, KButton::Enabled enabled, const char* key) -> KButton& {
      auto made = std::make_unique<KButton>(KRect{x, top, x + kButtonWidth - 1, bottom}, KString::Static(caption), std::move(action),
                                            std::move(enabled), KString::Static(key));
      x += kButtonWidth + kButtonGap;
      KButton& placed = *made;
      place(std::move(made));
      return placed;
    };
    // Bypass is the slot's host parameter: the click is a gesture on it, as a switch's would be.
    const auto bypassed = [this, slot] { return pipeline_.GetParameter(KEffectPipeline::BypassIndex(slot)).Normalized() >= 0.5; };
    button("", [this, slot, bypassed] { KParameterLink(pipeline_, KEffectPipeline::BypassIndex(slot), host_).Change(bypassed() ? 0.0 : 1.0); }, {},
           kBypassKey)
        .SetCaptionSource([bypassed] { return KString::Static(bypassed() ? "Bypassed" : "Active"); });
    button("Move up", [this, slot] { Move(slot, -1); }, [position] { return position > 0; }, kUpKey);
    button("Move down", [this, slot] { Move(slot, 1); }, [position, last] { return position < last; }, kDownKey);
    button("Remove", [this, slot] { Edit([this, slot] { pipeline_.RemoveModule(slot); }); }, {}, kRemoveKey);
    top += kRowHeight;
  }
}

void KPipelineChainPanel::Move(int32_t slot, int32_t by) {
  // The position is the chain's at the click, which a tick may not have shown yet.
  Edit([this, slot, by] { pipeline_.MoveModule(slot, pipeline_.PositionOfSlot(slot) + by); });
}

void KPipelineChainPanel::OpenAddMenu() {
  KControlTree* tree = Tree();
  if (!tree) return;
  KRegistries& registries = KRegistries::Instance();
  registries.EnsureBuilt();
  const KPluginRegistry& modules = registries.Modules();
  // The modules under a heading for each category, in the registries' order of categories; an
  // item's key is its module's, a heading's empty.
  std::vector<KString> items, keys;
  std::vector<int32_t> headings;
  for (const char* category : KRegistries::kCategories) {
    const KString name = KString::Static(category);
    for (int32_t i = 0; i < modules.Count(); ++i) {
      const KPluginRecord& record = modules.Record(i);
      if (record.category != name) continue;
      if (headings.empty() || items[static_cast<size_t>(headings.back())] != name) {
        headings.push_back(static_cast<int32_t>(items.size()));
        items.push_back(name);
        keys.emplace_back();
      }
      items.push_back(record.key);
      keys.push_back(record.key);
    }
  }
  auto& menu = dynamic_cast<KPopupMenu&>(tree->Root().Add(std::make_unique<KPopupMenu>(
      tree->Root().Bounds(), add_->Bounds(), std::move(items), -1, [this, keys](int32_t chosen) {
        const KString key = keys[static_cast<size_t>(chosen)];
        Edit([this, key] { pipeline_.AddModule(key); });
      })));
  for (int32_t heading : headings) menu.MarkHeading(heading);
  tree->SetFocus(&menu);
}

void KPipelineChainPanel::Edit(const std::function<void()>& edit) {
  try {
    pipeline_.UndoStoreSettings();
    KChangeParameters(pipeline_, host_, edit);
  } catch (const KException& e) {
    KShowUserMessage(e.Message());
  }
}
