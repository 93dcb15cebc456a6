#include "ui/controls/KStyle.h"

#include <cstdlib>
#include <optional>

#include "core/KXMLReader.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KModule.h"
#include "kernel/KUserMessage.h"
#include "kernel/platform/KPlatform.h"

namespace {

constexpr const char* kColorNames[KStyle::kColorCount] = {
    "background", "header",    "panel",     "panelBorder", "text",           "textDim",   "valueText",
    "accent",     "knobBody",  "knobTrack", "controlFace", "controlHover",   "meterLow",  "meterMid",
    "meterHigh",  "meterReduction", "graphBack", "graphGrid", "graphCurve", "graphFill"};
constexpr const char* kFontNames[] = {"label", "value", "title"};
constexpr const char* kSizeNames[] = {"knob", "radius", "meter"};

constexpr const char* kDefaultSkin = R"(<Skin Name="Graphite">
  <Colors background="15181d" header="0e1014" panel="1e2229" panelBorder="2b313a" text="e4e8ee"
          textDim="8b95a3" valueText="f4f6f9" accent="3fc1e0" knobBody="2c323c" knobTrack="3a424e"
          controlFace="2a3039" controlHover="394250" meterLow="38d39f" meterMid="f2c14e" meterHigh="ff5a5f"
          meterReduction="ff9f43" graphBack="121419" graphGrid="262b33" graphCurve="3fc1e0" graphFill="3fc1e038"/>
  <Fonts label="11" value="11" title="16"/>
  <Sizes knob="54" radius="6" meter="8"/>
</Skin>)";

// "RRGGBB" or "RRGGBBAA".
bool ParseColor(const std::string& text, KColor& color) {
  if (text.size() != 6 && text.size() != 8) return false;
  char* end = nullptr;
  const unsigned long value = std::strtoul(text.c_str(), &end, 16);
  if (end != text.c_str() + text.size()) return false;
  color = text.size() == 6 ? 0xFF000000u | static_cast<KColor>(value)
                           : static_cast<KColor>((value >> 8) | ((value & 0xFF) << 24));
  return true;
}

[[noreturn]] void Refuse(const char* what, const std::string& name, const std::string& value) {
  throw KException(KFormat("The skin's {0} '{1}' has the bad value '{2}'.")
                       .Arg(KString::Static(what))
                       .Arg(KString::FromUtf8(name))
                       .Arg(KString::FromUtf8(value))
                       .Text());
}

double ParseSize(const std::string& name, const std::string& text, double lowest, double highest) {
  char* end = nullptr;
  const double value = std::strtod(text.c_str(), &end);
  if (text.empty() || end != text.c_str() + text.size() || !(value >= lowest && value <= highest)) Refuse("size", name, text);
  return value;
}

}  // namespace

KStyle::KStyle() { Apply(KXMLReader::Read(kDefaultSkin), {}); }

const char* KStyle::DefaultSkinText() noexcept { return kDefaultSkin; }

void KStyle::Apply(const Element& skin, const std::string& folder) {
  if (!(skin.GetName() == KString("Skin"))) throw KException("This is not a skin file (its root is not 'Skin').");
  KStyle next = *this;  // all or nothing
  next.name_ = skin.GetAttribute("Name", name_);
  if (const Element* colors = skin.FindChild("Colors")) {
    for (int32_t i = 0; i < kColorCount; ++i)
      if (const KString* value = colors->FindAttribute(KString::Static(kColorNames[i])))
        if (!ParseColor(value->ToUtf8(), next.colors_[i])) Refuse("colour", kColorNames[i], value->ToUtf8());
  }
  if (const Element* fonts = skin.FindChild("Fonts")) {
    for (int32_t i = 0; i < 3; ++i)
      if (const KString* value = fonts->FindAttribute(KString::Static(kFontNames[i])))
        next.sizes_[kLabelFont + i] = ParseSize(kFontNames[i], value->ToUtf8(), 6, 48);
  }
  if (const Element* sizes = skin.FindChild("Sizes")) {
    for (int32_t i = 0; i < 3; ++i)
      if (const KString* value = sizes->FindAttribute(KString::Static(kSizeNames[i])))
        next.sizes_[kKnob + i] = ParseSize(kSizeNames[i], value->ToUtf8(), i == 0 ? 24 : 0, 200);
  }
  if (const Element* bitmaps = skin.FindChild("Bitmaps")) {
    if (const KString* file = bitmaps->FindAttribute("background"))
      next.background_ = std::make_shared<const KBitmap>(KBitmap::Load(folder + file->ToUtf8()));
  }
  *this = std::move(next);
}

KStyle KStyle::Load(const std::string& path) {
  KStyle style;
  if (path.empty()) return style;
  try {
    const std::optional<std::string> text = KPlatform::ReadFile(path);
    if (!text) return style;
    style.Apply(KXMLReader::Read(*text), path.substr(0, KPlatform::FileNameStart(path)));
  } catch (const KException& e) {
    KShowUserMessage(KFormat("The skin '{0}' could not be used, so the default skin is shown.\n\n{1}")
                         .Arg(KString::FromUtf8(path))
                         .Arg(e.Message())
                         .Text());
  }
  return style;
}

std::string KStyle::UserSkinPath() { return KModule::GetDataPath_Shared() + "skin.xml"; }
