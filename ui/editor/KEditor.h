#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "core/KAudioPlugin.h"
#include "kernel/KString.h"
#include "ui/KBitmap.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KStyle.h"
#include "ui/editor/KEditorDescription.h"

class KButton;
class KEditorHost;
class KPopupMenu;

// A plug-in's editor, generated from its parameter table and its description: a title bar with
// the preset menu, undo and redo, the size and the help button; the sections of knobs, lists
// and switches; the plug-in's graph; level meters. It owns its control tree and knows nothing of
// windows: a platform view feeds it events and ticks and paints it through a drawer, and a
// snapshot paints it into a bitmap.
class KEditor {
public:
  static constexpr double kScales[] = {1.0, 1.5, 2.0};
  static constexpr int32_t kHeaderHeight = 46;
  static constexpr int32_t kMargin = 12;

  // `host` may be null (no host: gestures and resizing go nowhere).
  KEditor(KAudioPlugin& plugin, const KString& title, const KEditorDescription& description, KEditorHost* host,
          KStyle style = KStyle());
  ~KEditor();

  KAudioPlugin& Plugin() noexcept { return plugin_; }
  KControlTree& Tree() noexcept { return *tree_; }
  const KStyle& Style() const noexcept { return style_; }
  // The size at scale 1, in logical units, and in pixels at the present scale.
  int32_t Width() const noexcept { return width_; }
  int32_t Height() const noexcept { return height_; }
  int32_t PixelWidth() const noexcept;
  int32_t PixelHeight() const noexcept;
  double Scale() const noexcept { return scale_; }
  // Asks the host for the frame size of `scale`; answers whether the editor now has it. Without
  // a host the scale is taken at once.
  bool SetScale(double scale);

  // ---- what the title bar and the keys do (Ctrl+Z, Ctrl+Y or Ctrl+Shift+Z, F1, Ctrl+F1, Ctrl+H)
  // Undo and redo tell the host every parameter they moved, each in a gesture of its own.
  void Undo();
  void Redo();
  // The help window for the control under `at` (its help key, or the nearest parent's).
  void ShowHelpAt(KPoint at);
  void ShowHelp(const KString& key);
  // Loads the preset at `index` of KAudioPlugin::ListPresets() (factory presets first).
  void SelectPreset(int32_t index);

  // Paints what changed since the last paint through a drawer at the present scale; answers the
  // logical area painted. PaintAll paints everything.
  KRect Paint(KDrawer& drawer) { return tree_->Paint(drawer); }
  KRect PaintAll(KDrawer& drawer);
  // The whole editor painted into a new bitmap at the present scale by the software drawer.
  KBitmap Render();

private:
  class Body;
  class Header;
  void Build(const KEditorDescription& description, const KString& title);
  // Runs a change of many parameters (undo, redo, a preset) and tells the host what moved.
  template <class F>
  void ChangeAll(F&& change);
  // Runs a user's action; a KException becomes a message to the user.
  template <class F>
  void Guarded(F&& action);
  KPopupMenu& OpenMenu(const KRect& anchor, std::vector<KString> items, int32_t current, std::function<void(int32_t)> choose);
  void OpenSizeMenu();
  void OpenPresetMenu();

  KAudioPlugin& plugin_;
  KEditorHost* host_;
  KStyle style_;
  KEditorDescription description_;
  std::unique_ptr<KControlTree> tree_;
  int32_t width_ = 0;
  int32_t height_ = 0;
  double scale_ = 1;
  KButton* sizeButton_ = nullptr;
  KButton* presetButton_ = nullptr;
};
