#include <algorithm>
#include <cmath>
#include <memory>
#include <string>

#include "core/KParameter.h"
#include "kernel/KException.h"
#include "kernel/KFormat.h"
#include "kernel/KUserMessage.h"
#include "kernel/platform/KPlatform.h"
#include "plugins/KPluginEditors.h"
#include "plugins/convolutionreverb/KConvolutionReverbPlugin.h"
#include "ui/controls/KButtons.h"
#include "ui/controls/KControlTree.h"
#include "ui/controls/KFileChooser.h"
#include "ui/controls/KStyle.h"
#include "ui/controls/KTimeGraph.h"

namespace {
using R = KConvolutionReverbPlugin;

constexpr KEditorSection kSections[] = {
    {"Space", "impulse", 1},
    {"Mix", "mix wetlevel width", 3},
};
constexpr int32_t kRowHeight = 26;

// The envelope of what plays, from the first tap to the last.
std::unique_ptr<KControl> EnvelopeGraph(const KRect& bounds, R& reverb) {
  KTimeGraph::Callbacks callbacks;
  callbacks.span = [&reverb] {
    const auto envelope = reverb.PlayingEnvelope();
    return envelope ? envelope->seconds : 1.0;
  };
  // The loudest slice within half a sample of the graph's either side, so that no peak falls
  // between two samples.
  callbacks.level = [&reverb](double seconds) {
    const auto envelope = reverb.PlayingEnvelope();
    if (!envelope || envelope->decibels.empty() || !(envelope->seconds > 0.0)) return -180.0;
    const double reach = 0.5 * KTimeGraph::RoundSpan(envelope->seconds) * (1 + KGraph::kLead) / (KGraph::kSamples - 1);
    const double slices = double(envelope->decibels.size());
    const double from = std::max((seconds - reach) / envelope->seconds * slices, 0.0);
    const double to = std::min((seconds + reach) / envelope->seconds * slices, slices);
    double level = -180.0;
    for (auto s = static_cast<size_t>(from); double(s) < to; ++s) level = std::max(level, envelope->decibels[s]);
    return level;
  };
  callbacks.caption = [&reverb] {
    const auto envelope = reverb.PlayingEnvelope();
    return KFormat("{0.2} s").Arg(envelope ? envelope->seconds : 0.0).Text();
  };
  return std::make_unique<KTimeGraph>(bounds, std::move(callbacks), KString("impulse"));
}

// Where the chooser starts: the loaded file's folder, else the user's home.
std::string StartFolder(const R& reverb) {
  const KString path = reverb.ImpulseResponseFile();
  if (!path.IsEmpty()) return KPlatform::ParentFolder(path.ToUtf8());
  try {
    return KPlatform::HomeFolder();
  } catch (const KException&) {
    return KPlatform::ParentFolder(KPlatform::KernelFolder());
  }
}

void OpenChooser(KControl& from, R& reverb) {
  KControlTree* tree = from.Tree();
  if (!tree) return;
  auto chooser = std::make_unique<KFileChooser>(tree->Root().Bounds(), KString("Load impulse response"), StartFolder(reverb),
                                                std::vector<std::string>{".wav", ".flac"}, [&reverb](const std::string& path) {
                                                  // Read here, on the editor's thread; the audio thread takes it when ready.
                                                  try {
                                                    reverb.SetImpulseResponseFile(KString::FromUtf8(path));
                                                  } catch (const KException& e) {
                                                    KShowUserMessage(e.Message());
                                                  }
                                                });
  tree->SetFocus(&tree->Root().Add(std::move(chooser)));
}

// What plays, by name: the file's, or the built-in space's; it follows state loads too.
class FileName final : public KControl {
public:
  FileName(const KRect& bounds, R& reverb) : KControl(bounds), reverb_(reverb), text_(Now()) {}
  void OnTimer() override {
    if (KString now = Now(); now != text_) {
      text_ = std::move(now);
      Invalidate();
    }
  }
  void Paint(KDrawer& drawer, const KStyle& style) override {
    drawer.AlignedTextOut(Bounds(), text_, style.LabelFont(), style.Get(KStyle::kText), kAlignLeft | kAlignMiddle, 255, kDrawBlend);
  }
  KString HelpKey() const override { return KString("impulsefile"); }

private:
  KString Now() const {
    const std::string path = reverb_.ImpulseResponseFile().ToUtf8();
    if (!path.empty()) return KString::FromUtf8(path.substr(KPlatform::ParentFolder(path).size()));
    const KAudioPluginBase::Parameter& space = reverb_.GetParameter(R::kImpulse);
    return space.TextForNormalized(space.Normalized());
  }
  R& reverb_;
  KString text_;
};

// The envelope above a row with the file's buttons and its name.
std::unique_ptr<KControl> SpaceGraph(const KRect& bounds, KAudioPlugin& plugin, KEditorHost*) {
  auto& reverb = static_cast<R&>(plugin);
  auto panel = std::make_unique<KControl>(bounds);
  KControl& owner = *panel;
  const int32_t rowTop = bounds.bottom - kRowHeight + 1;
  panel->Add(EnvelopeGraph({bounds.left, bounds.top, bounds.right, rowTop - 7}, reverb));
  KButton& load = panel->Emplace<KButton>(KRect{bounds.left, rowTop, bounds.left + 189, bounds.bottom}, KString("Load impulse response..."),
                                          [&owner, &reverb] { OpenChooser(owner, reverb); }, KButton::Enabled{}, KString("impulsefile"));
  panel->Emplace<KButton>(KRect{load.Bounds().right + 7, rowTop, load.Bounds().right + 126, bounds.bottom}, KString("Built-in space"),
                          [&reverb] { reverb.SetImpulseResponseFile(KString()); },
                          [&reverb] { return !reverb.ImpulseResponseFile().IsEmpty(); }, KString("builtinspace"));
  panel->Emplace<FileName>(KRect{load.Bounds().right + 136, rowTop, bounds.right, bounds.bottom}, reverb);
  return panel;
}
}  // namespace

KEditorDescription KConvolutionReverbEditor() { return KEditorDescription::Of(kSections, KEditorDescription::kGraphTop, &SpaceGraph); }
