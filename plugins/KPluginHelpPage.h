#pragma once

#include <cstdint>
#include <string>

#include "core/KAudioPlugin.h"
#include "kernel/KExport.h"
#include "kernel/KString.h"
#include "plugins/KPluginHelp.h"
#include "ui/KBitmap.h"
#include "ui/KRichTextDocument.h"

// The help of one plug-in instance: its help data with the placeholders filled from the
// parameters' own ranges, as mark-up for the help window, as a document, as plain text and as
// the HTML page of the help export.
class TORVANE_API KPluginHelpPage {
public:
  // Throws KException "No help is written for {0}." when the plug-in's key has none.
  explicit KPluginHelpPage(KAudioPlugin& plugin);

  const KPluginHelp& Help() const noexcept { return help_; }
  // A parameter's help with its range filled in, or empty when none is written.
  KString ParameterText(int32_t index) const;
  // What the help window shows on F1 over the parameter's control.
  KString ControlHelp(int32_t index) const;
  // The whole help as one mark-up text: title, overview and a section per parameter.
  KString Markup() const;
  KRichTextDocument Document() const;
  std::string PlainText() const;
  std::string Html() const;
  // The help as the help window draws it: `width` logical units wide (margins included), all of
  // it, at `scale` pixels per unit, by the software drawer.
  KBitmap Picture(int32_t width, double scale) const;
  std::string PicturePNG(int32_t width, double scale) const;  // the same as PNG file bytes
  static constexpr int32_t kMargin = 12;

private:
  KAudioPlugin& plugin_;
  const KPluginHelp& help_;
};
