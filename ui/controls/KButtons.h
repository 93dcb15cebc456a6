#pragma once

#include <functional>

#include "ui/controls/KControl.h"
#include "ui/controls/KParameterControl.h"

// An on / off parameter: a click flips it (one gesture, one undo step); it follows automation.
class KSwitch final : public KParameterControl {
public:
  using KParameterControl::KParameterControl;
  bool IsOn() const noexcept { return Link().Value() >= 0.5; }

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  bool OnKey(const KKeyEvent& event) override;
  bool IsFocusable() const noexcept override { return true; }

private:
  void Flip();
};

// A push button with a caption: runs its action when released over it. `enabled` (optional) is
// asked on every tick, so that a button such as undo greys out when there is nothing to undo.
class KButton final : public KControl {
public:
  using Action = std::function<void()>;
  using Enabled = std::function<bool()>;
  KButton(const KRect& bounds, KString caption, Action action, Enabled enabled = {}, KString helpKey = {});
  bool IsEnabled() const noexcept { return enabled_; }
  const KString& Caption() const noexcept { return caption_; }
  void SetCaption(const KString& caption);
  // A caption that follows something else, asked on every tick.
  void SetCaptionSource(std::function<KString()> source);

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  void OnMouseUp(const KMouseEvent& event) override;
  void OnTimer() override;
  KString HelpKey() const override { return helpKey_; }

private:
  KString caption_;
  Action action_;
  Enabled isEnabled_;
  std::function<KString()> captionSource_;
  KString helpKey_;
  bool enabled_ = true;
  bool pressed_ = false;
};

// A parameter with named steps as a drop-down: the present choice with an arrow; a click opens
// the list, the wheel steps through it.
class KDropDown final : public KParameterControl {
public:
  using KParameterControl::KParameterControl;
  int32_t Choice() const noexcept;

  void Paint(KDrawer& drawer, const KStyle& style) override;
  bool OnMouseDown(const KMouseEvent& event) override;
  bool OnWheel(const KMouseEvent& event) override;

private:
  void Choose(int32_t choice);
};
