#pragma once

#include <functional>
#include <memory>
#include <span>

#include "kernel/KString.h"
#include "ui/controls/KControl.h"

class KAudioPlugin;
class KEditorHost;

// One framed group of an editor: its title and its parameters by key, separated by blanks.
// Each parameter becomes the control its kind asks for: two steps a switch, more a drop-down,
// continuous a knob, laid out in `columns` columns (switches take whole rows below).
struct KEditorSection {
  const char* title;
  const char* keys;
  int32_t columns;
};

// What a plug-in adds to the editor generated from its parameters: the sections, its own graph,
// a gain-reduction meter, and the help shown on F1. Plug-ins without one get a section with
// every parameter.
struct KEditorDescription {
  enum GraphPlace { kNoGraph, kGraphLeft, kGraphTop };
  using GraphFactory = std::function<std::unique_ptr<KControl>(const KRect& bounds, KAudioPlugin& plugin, KEditorHost* host)>;

  static KEditorDescription Of(std::span<const KEditorSection> sections, GraphPlace place = kNoGraph, GraphFactory graph = {}) {
    KEditorDescription description;
    description.sections = sections;
    description.graphPlace = place;
    description.graph = std::move(graph);
    return description;
  }

  std::span<const KEditorSection> sections;
  GraphPlace graphPlace = kNoGraph;
  GraphFactory graph;
  // Gain reduction in dB (0 or below), read lock-free from what the audio thread published.
  std::function<double(const KAudioPlugin&)> gainReduction;
  // The help-window mark-up for a control's help key (a parameter key, or a button's name).
  std::function<KString(KAudioPlugin&, const KString& key)> help;
};
