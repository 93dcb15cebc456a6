#pragma once

#include <memory>
#include <string>

#include "core/KAudioPlugin.h"
#include "kernel/KExport.h"
#include "ui/controls/KCycleGraph.h"
#include "ui/controls/KStyle.h"
#include "ui/editor/KEditor.h"
#include "ui/editor/KEditorDescription.h"

// The editor of every catalogue plug-in: its description (sections, graph, meters) and its help
// on F1, both beside the plug-in. A plug-in without a description gets the generated editor
// with every parameter in one section.
TORVANE_API std::unique_ptr<KEditor> KMakePluginEditor(KAudioPlugin& plugin, KEditorHost* host, KStyle style = KStyle());

// The editor as a host would first show it (after one tick of its timer), painted without a
// host at `scale` by the software drawer or, with `openGL`, by the OpenGL drawer on an
// off-screen context; the picture as PNG file bytes. KException when OpenGL is missing.
TORVANE_API std::string KPluginEditorSnapshotPNG(KAudioPlugin& plugin, double scale, bool openGL);

// The help-window mark-up of a control's help key: a parameter's help, or the plug-in's
// overview for an empty key; empty when none is written.
KString KPluginEditorHelp(KAudioPlugin& plugin, const KString& key);

// What an LFO-driven plug-in's LFO means at a value in [-1, 1], in the units of its graph.
using KLFOMeaning = double (*)(const KAudioPlugin& plugin, double lfo);
// A graph of two cycles of what the LFO moves, for an editor description of a plug-in built on
// KLFOPlugin, with its help under `helpKey`.
KEditorDescription::GraphFactory KLFOGraph(KCycleGraph::Axes axes, KLFOMeaning meaning, const char* helpKey);
// The axes of a frequency swept by an LFO, as log2 of hertz over the audible range.
KCycleGraph::Axes KFrequencyCycleAxes();

