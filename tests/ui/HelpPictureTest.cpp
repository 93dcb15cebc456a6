// The help of every catalogue plug-in drawn by both drawers: the same picture within the drawers'
// tolerance, at scale 1 and 2; and the sheet of the built-in icons. Pictures land in the build
// folder for a person to look at.
#include <gtest/gtest.h>

#include <memory>
#include <set>
#include <string>
#include <vector>

#include "kernel/KCatalogue.h"
#include "kernel/KEntryPoints.h"
#include "plugins/KPluginHelpPage.h"
#include "tests/ui/DrawerTestSupport.h"
#include "ui/KDrawerToKBitmap.h"
#include "ui/KRichTextLayout.h"
#include "ui/KVectorIcons.h"

namespace {

// Text and shapes are coverage masks shared by both drawers; they differ by a step of rounding
// where the blend is computed (see SceneAgreementTest).
constexpr uint32_t kTolerance = 2;
constexpr int32_t kWidth = 480;

void DrawBoth(const char* key, double scale) {
  const std::unique_ptr<KAudioPlugin> plugin(CreateTorvanePlugin(KString::Static(key)));
  const KPluginHelpPage page(*plugin);
  const KBitmap software = page.Picture(kWidth, scale);
  const std::string name = std::string("help_") + key + (scale == 1 ? "" : "_x2");
  software.Store(KPicturePath(name + ".png"));

  const KRichTextDocument document = page.Document();
  const KRichTextLayout layout(document, kWidth - 2 * KPluginHelpPage::kMargin, scale);
  KOpenGLPainter gl;
  KOPEN_GL_OR_SKIP(gl, software.Width(), software.Height(), scale);
  gl.drawer->FillRectangle({0, 0, kWidth - 1, software.Height() - 1}, KRichTextLook().paper, 255, kDrawCopy);
  layout.Draw(*gl.drawer, {KPluginHelpPage::kMargin, KPluginHelpPage::kMargin});
  const KBitmap hardware = gl.drawer->GetScreenShot();
  gl.drawer->EndPaint();
  ASSERT_EQ(hardware.Height(), software.Height());
  const KPictureDifference d = KCompare(software, hardware, kTolerance);
  if (d.beyond) d.picture.Store(KPicturePath(name + "_difference.png"));
  EXPECT_EQ(d.beyond, 0) << key << " at scale " << scale << ": largest difference " << d.largest;
  // Ink on the page: dark text and the green of the controls.
  int64_t dark = 0, green = 0;
  for (int32_t y = 0; y < software.Height(); ++y)
    for (int32_t x = 0; x < software.Width(); ++x) {
      const KColor c = software.Pixel(x, y);
      dark += KRedOf(c) < 64 && KGreenOf(c) < 64 && KBlueOf(c) < 64;
      green += KGreenOf(c) > 100 && KRedOf(c) < 40 && KBlueOf(c) < 40;
    }
  EXPECT_GT(dark, int64_t(software.Width()) * software.Height() / 50);
  EXPECT_GT(green, 100 * scale * scale);
}

TEST(HelpPicture, EveryCataloguePluginDrawsTheSameOnBothDrawers) {
  for (const KPluginDescription& entry : KProductCatalogue().plugins) DrawBoth(entry.key, 1);
  DrawBoth("KCompressorPlugin", 2);
}

TEST(HelpPicture, EveryIconDrawsItsOwnShape) {
  // The icons help texts use with <img icon=...>.
  const std::vector<std::string> expected = {
      "add", "analyse", "arrow", "cancel", "clipboardcopy", "clipboardpaste", "collapse", "delete",
      "down", "downthick", "dragndrop", "duplicate", "enable", "export", "eye", "graph",
      "heartfull", "import", "invertphase", "left", "lefttriangle", "list", "load", "lock",
      "maximize", "menu", "minus", "network", "normalize", "ok", "panic", "parallel",
      "pause", "pencil", "play", "plus", "presets", "process", "randomize", "record",
      "redo", "repeat", "replace", "reset", "rewindright", "right", "righttriangle", "rotate",
      "save", "search", "settings", "sound", "start", "tap", "undo", "up",
      "www", "zoomdefault", "zoomin", "zoomout"};
  const auto names = KVectorIcons::Names();
  ASSERT_EQ(std::vector<std::string>(names.begin(), names.end()), expected);
  const int32_t columns = 8, cell = 40;
  const int32_t rows = int32_t(names.size() + columns - 1) / columns;
  KBitmap sheet(columns * cell * 2, rows * cell * 2);
  KDrawerToKBitmap drawer(sheet, 2);
  drawer.FillRectangle(sheet.Bounds(), 0xFFFFFFFF, 255, kDrawCopy);
  std::set<std::string> shapes;
  for (size_t i = 0; i < names.size(); ++i) {
    const KString name = KString::Static(names[i]);
    const int32_t x = int32_t(i % columns) * cell, y = int32_t(i / columns) * cell;
    const KRect box{x + 4, y + 4, x + 35, y + 35};
    ASSERT_TRUE(KVectorIcons::Paint(drawer, name, box, 0xFF000000, 255)) << names[i];
    // Each icon leaves ink of its own in its box.
    std::string ink;
    int32_t inked = 0;
    for (int32_t py = box.top * 2; py <= box.bottom * 2 + 1; ++py)
      for (int32_t px = box.left * 2; px <= box.right * 2 + 1; ++px) {
        const bool on = KRedOf(sheet.Pixel(px, py)) < 128;
        ink.push_back(on ? '#' : '.');
        inked += on;
      }
    EXPECT_GT(inked, 60) << names[i];
    EXPECT_TRUE(shapes.insert(ink).second) << names[i] << " looks like another icon";
  }
  EXPECT_FALSE(KVectorIcons::Paint(drawer, KString("nosuchicon"), {0, 0, 15, 15}, 0xFF000000, 255));
  sheet.Store(KPicturePath("icons.png"));
}

}  // namespace
