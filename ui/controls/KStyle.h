#pragma once

#include <cstdint>
#include <memory>
#include <string>

#include "core/Element.h"
#include "kernel/KString.h"
#include "ui/KBitmap.h"
#include "ui/KFont.h"
#include "ui/KGeometry.h"

// The look of the editors: colours, font sizes, measures and optional bitmaps, read from a skin
// file (XML through the settings tree):
//   <Skin Name="...">
//     <Colors background="16191e" panel="1f242b" accent="f5a524" .../>   RRGGBB or RRGGBBAA
//     <Fonts label="11" value="12" title="17"/>                          logical pixels
//     <Sizes knob="52" radius="6" meter="10"/>
//     <Bitmaps background="brushed.png"/>                                PNG or WebP, beside the file
//   </Skin>
// Anything a skin leaves out keeps the default skin's value.
class KStyle {
public:
  // Colour roles, in the order of their attribute names.
  enum Color : int32_t {
    kBackground,   // the window behind the sections
    kHeader,       // the title bar
    kPanel,        // a section's face
    kPanelBorder,  // a section's outline
    kText,         // labels and titles
    kTextDim,      // units, captions, disabled buttons
    kValueText,    // the value under a knob
    kAccent,       // a knob's value arc, an active switch, a graph's node
    kKnobBody,     // a knob's cap
    kKnobTrack,    // the knob's track under the value arc
    kControlFace,  // buttons, switches and lists at rest
    kControlHover, // the same when pressed or open
    kMeterLow,     // meter segments up to -12 dBFS
    kMeterMid,     // up to -3 dBFS
    kMeterHigh,    // above
    kMeterReduction,
    kGraphBack,    // a graph's face
    kGraphGrid,
    kGraphCurve,
    kGraphFill,
    kColorCount
  };
  enum Size : int32_t { kLabelFont, kValueFont, kTitleFont, kKnob, kRadius, kMeterWidth, kSizeCount };

  // The built-in skin.
  KStyle();
  static const char* DefaultSkinText() noexcept;

  KColor Get(Color role) const noexcept { return colors_[role]; }
  double Get(Size size) const noexcept { return sizes_[size]; }
  KFont LabelFont() const noexcept { return KFont(sizes_[kLabelFont]); }
  KFont ValueFont() const noexcept { return KFont(sizes_[kValueFont]); }
  KFont TitleFont() const noexcept { return KFont(sizes_[kTitleFont], KFontStyle::Bold); }
  // The background texture, when the skin has one (tiled over the window).
  const KBitmap* BackgroundBitmap() const noexcept { return background_.get(); }
  const KString& Name() const noexcept { return name_; }

  // Takes what a skin document sets over the present values; `folder` (ending in a separator,
  // or empty for the working folder) is where its bitmaps lie. KException for an unknown root, a bad colour or size, or a bitmap that cannot be read.
  void Apply(const Element& skin, const std::string& folder);
  // The skin for the editors: the built-in one, overridden by the file at `path` when it exists.
  // A file that cannot be read leaves the default in place and says so with a user message.
  static KStyle Load(const std::string& path);
  // Where a user's skin lives: "skin.xml" in the shared data folder.
  static std::string UserSkinPath();

private:
  KColor colors_[kColorCount];
  double sizes_[kSizeCount];
  std::shared_ptr<const KBitmap> background_;
  KString name_;
};
