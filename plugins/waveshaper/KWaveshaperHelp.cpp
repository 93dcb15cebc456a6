#include "plugins/KPluginHelp.h"
#include "plugins/waveshaper/KWaveshaperPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"drive",
     "<control>Drive</control> is how far the signal is pushed along the curve: the further, the more of the curve's "
     "character and the more distortion. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: low drive with the <value>Cubic</value> curve adds warmth, high drive with <value>Hard clip</value> fuzz."},
    {"shape",
     "<control>Shape</control> chooses the curve: <value>Hard clip</value> cuts the peaks off flat, <value>Cubic</value> "
     "rounds them off, <value>Sine fold</value> folds loud peaks back down for a hollow, metallic sound, "
     "<value>Rectify</value> turns the lower half of the wave upwards and adds the octave above. Default "
     "<value>{2}</value>.<p>Tip: <value>Sine fold</value> on a synthesizer bass, with the drive automated, makes it sweep."},
    {"bias",
     "<control>Bias</control> shifts the signal off the centre of the curve, so that the two halves of the wave are shaped "
     "differently; this adds the even harmonics of valves and fuzz pedals. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: a little bias makes the distortion sound rounder and "
     "more natural."},
    {"outputgain",
     "<control>Output gain</control> sets the level after the curve and the mix. Range <range>{0}</range> to "
     "<range>{1}</range>, default <value>{2}</value>.<p>Tip: turn it down as you raise the drive, to compare the sound "
     "and not the loudness."},
    {"mix",
     "<control>Dry/wet</control> blends the shaped signal with the original. Range <range>{0}</range> to <range>{1}</range>, "
     "default <value>{2}</value>.<p>Tip: blend heavy shaping in at <example>20 to 40 %</example> to keep the attack of "
     "the original."},
};

constexpr KPluginHelp kHelp{
    "KWaveshaperPlugin",
    "Waveshaper",
    "The <name>Waveshaper</name> bends the waveform through one of four curves, from gentle rounding to hard clipping, "
    "folding and rectifying. Each sample takes the curve's average between the previous input and the present one, "
    "which keeps hard curves from adding harsh aliasing tones, with no added latency.",
    kParameters,
};
}  // namespace

const KPluginHelp& KWaveshaperHelp() { return kHelp; }
