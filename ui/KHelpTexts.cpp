#include "ui/KHelpTexts.h"

#include "kernel/KFormat.h"

namespace {
constexpr const char* kKnobActions[] = {
    "Drag up or down to change the value; hold Shift for fine steps.",
    "Turn the mouse wheel for small steps.",
    "Double-click to type a value.",
    "Ctrl+click to return to the default value.",
};
constexpr const char* kSwitchActions[] = {
    "Click to step to the next setting; right-click lists them all.",
    "Ctrl+click to return to the default setting.",
};
constexpr const char* kButtonActions[] = {"Click to run it."};
}  // namespace

std::span<const char* const> KHelpTexts::KnobActions() noexcept { return kKnobActions; }
std::span<const char* const> KHelpTexts::ButtonActions() noexcept { return kButtonActions; }
std::span<const char* const> KHelpTexts::SwitchActions() noexcept { return kSwitchActions; }

const KString& KHelpTexts::SemanticTagSets() {
  static const KString sets(
      "<tagset name=name></tagset>"
      "<tagset name=control><c color=008800><b></tagset>"
      "<tagset name=value><c color=008800><b></tagset>"
      "<tagset name=range><c color=008800></tagset>"
      "<tagset name=shortcut><c color=00BB00></tagset>"
      "<tagset name=shortcutnop><c color=00BB00></tagset>"
      "<tagset name=reference><c color=880000><b></tagset>"
      "<tagset name=symbol><c color=880000><b></tagset>"
      "<tagset name=example><i></tagset>");
  return sets;
}

KString KHelpTexts::Section(const KString& title) {
  return KString::Static(kSectionHeader) + Escape(title) + KString("</l2><left>");
}

KString KHelpTexts::ActionItems(std::span<const char* const> actions) {
  KString items;
  for (const char* action : actions) items.Append(KFormatText(KString::Static(kActionItem), Escape(KString::Static(action))));
  return items;
}

KString KHelpTexts::ControlHelp(const KString& helpText, std::span<const char* const> actions) {
  KString text = Section(KString::Static(kControlMeaning)).Append(KString("<p>"));
  text.Append(helpText.IsEmpty() ? KString::Static(kNoHelp) : helpText);
  if (!actions.empty()) text.Append(Section(KString::Static(kMouseAndKeys))).Append(ActionItems(actions));
  return text.Append(KString("<p><s>")).Append(KString::Static(kF1Hint)).Append(KString("</s>"));
}

KString KHelpTexts::Escape(const KString& text) {
  KString out;
  out.Reserve(text.Length());
  for (int32_t i = 0; i < text.Length(); ++i) {
    const char16_t c = text.CharAt(i);
    if (c == '&') out.Append(KString("&amp;"));
    else if (c == '<') out.Append(KString("&lt;"));
    else if (c == '>') out.Append(KString("&gt;"));
    else out.Append(c);
  }
  return out;
}
