#include "plugins/KPluginEditors.h"

#include <string_view>

#include "core/KParameter.h"
#include "kernel/KCatalogue.h"
#include "ui/KDrawerOpenGL.h"
#include "ui/KHelpTexts.h"
#include "ui/editor/KEditorFactory.h"
#include "ui/platform/KOpenGLContext.h"
#include "plugins/KPluginHelp.h"
#include "plugins/KPluginHelpPage.h"

namespace {

// The host layer makes editors through the factory, which sees no plug-in: this maker is it.
[[maybe_unused]] const bool gRegistered = (KSetEditorMaker(&KMakePluginEditor), true);

// The name hosts list ("Compressor"), else the registry key.
KString TitleOf(const KAudioPlugin& plugin) {
  const KPluginDescription* description = KFindDescription(KProductCatalogue(), plugin.Identifier().ToUtf8());
  return description && description->name ? KString::Static(description->name) : plugin.Identifier();
}

}  // namespace

KString KPluginEditorHelp(KAudioPlugin& plugin, const KString& key) {
  const KPluginHelp* help = KFindPluginHelp(plugin.Identifier().ToUtf8());
  if (!help) return {};
  if (key.IsEmpty()) {
    KString markup(KHelpTexts::Section(KString::FromUtf8(help->title)));
    return markup.Append(KString::FromUtf8(help->overview)).Append(KString("<p>")).Append(KString::Static(KHelpTexts::kF1Hint));
  }
  if (const KAudioPluginBase::Parameter* parameter = plugin.FindParameter(key)) return KPluginHelpPage(plugin).ControlHelp(parameter->Index());
  for (const KButtonHelp& button : help->buttons)
    if (key.ToUtf8() == button.key) return KHelpTexts::ControlHelp(KString::FromUtf8(button.text), KHelpTexts::ButtonActions());
  return {};
}

std::unique_ptr<KEditor> KMakePluginEditor(KAudioPlugin& plugin, KEditorHost* host, KStyle style) {
  const KPluginDescription* plugged = KFindDescription(KProductCatalogue(), plugin.Identifier().ToUtf8());
  KEditorDescription description = plugged && plugged->editor ? plugged->editor() : KEditorDescription{};
  if (!description.help) description.help = &KPluginEditorHelp;
  return std::make_unique<KEditor>(plugin, TitleOf(plugin), description, host, std::move(style));
}

std::string KPluginEditorSnapshotPNG(KAudioPlugin& plugin, double scale, bool openGL) {
  const std::unique_ptr<KEditor> editor = KMakePluginEditor(plugin, nullptr);
  editor->SetScale(scale);
  editor->Tree().Tick();
  if (!openGL) return editor->Render().EncodePNG();
  const std::unique_ptr<KOpenGLContext> context = KOpenGLContext::CreateOffscreen(editor->PixelWidth(), editor->PixelHeight());
  KDrawerOpenGL drawer(*context, editor->Scale());
  drawer.Attach();
  drawer.BeginPaint();
  editor->PaintAll(drawer);
  const KBitmap picture = drawer.GetScreenShot();
  drawer.EndPaint();
  return picture.EncodePNG();
}
