#include "plugins/KPluginHelp.h"
#include "plugins/compressor/KCompressorPlugin.h"

namespace {
constexpr KParameterHelp kParameters[] = {
    {"gain",
     "<control>Gain</control> raises or lowers the level going into the compressor. More gain pushes the signal further over the "
     "<reference>Threshold</reference>, so it is compressed harder; the level change also reaches the output. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: to compress a quiet recording the same way as a loud one, match their levels here instead of moving the threshold."},
    {"outputgain",
     "<control>Output gain</control> sets the level leaving the plug-in, after compression. Use it to make up the loudness the "
     "compression took away, so you can compare with the bypassed sound at equal volume. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: switch the plug-in on and off while you set this; louder almost always sounds better, so only judge at matched levels."},
    {"attack",
     "<control>Attack</control> is how fast the compressor reacts when the level rises over the threshold. Short times catch "
     "every peak; longer times let the start of each note through before the gain comes down. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: on drums, try <example>10 to 30 ms</example> to keep the stick's snap while taming the body of the hit."},
    {"release",
     "<control>Release</control> is how fast the gain recovers once the level falls back under the threshold. Short times sound "
     "lively and can pump; long times sound smooth and even. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: let the gain recover in time with the music, for example just before the next beat, so the compression breathes with it."},
    {"rmslength",
     "<control>RMS length</control> is the window over which the detector averages the level. Very short windows follow every peak "
     "of the waveform; longer ones follow the loudness you hear. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: for vocals and mixes, <example>5 to 30 ms</example> gives a natural, loudness-driven response."},
    {"threshold",
     "<control>Threshold</control> is the level above which compression starts, as a share of full scale (<value>1</value> is "
     "0 dB). Everything quieter passes unchanged. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: lower it until the meter shows a few dB of gain reduction on the loudest parts only."},
    {"ratio",
     "<control>Ratio</control> sets how strongly levels above the threshold are reduced: at <value>4&nbsp;:&nbsp;1</value>, a signal 8 dB "
     "over the threshold comes out only 2 dB over it. "
     "Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: <example>2&nbsp;:&nbsp;1</example> glues a mix gently; <example>8&nbsp;:&nbsp;1</example> and above behave like a limiter."},
    {"kneemode",
     "<control>Knee mode</control> shapes the change from no compression to full compression around the threshold: "
     "<value>Hard</value> switches at once, <value>Linear</value> and <value>Soft</value> blend over the "
     "<reference>Knee size</reference>. Default <value>{2}</value>.<p>"
     "Tip: a soft knee makes even high ratios sound transparent on vocals and acoustic instruments."},
    {"kneesize",
     "<control>Knee size</control> is how wide the blended region around the threshold is, when the <reference>Knee mode</reference> "
     "is not hard. Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>.<p>"
     "Tip: widen the knee until you no longer hear the compressor grab, then stop."},
    {"linkchannels",
     "<control>Link channels</control> makes all channels share one gain, driven by the loudest. Without it each channel is "
     "compressed on its own. Default <value>{2}</value>.<p>"
     "Tip: keep it on for stereo sources, or a loud sound on one side will pull the stereo image to the other."},
    {"maximize",
     "<control>Maximize to 0dB</control> adds make-up gain automatically, so that a full-scale input comes out at full scale "
     "again however you set threshold and ratio. Default <value>{2}</value>.<p>"
     "Tip: with it on, the threshold works as a loudness control: lower it and the track gets denser and louder."},
    {"customshape",
     "<control>Custom shape</control> replaces threshold, ratio and knee with the transfer graph you draw in the editor: each point "
     "maps an input level to an output level. Default <value>{2}</value>.<p>"
     "Tip: a graph that rises more steeply than the diagonal at low levels works as an upward compressor, lifting quiet detail."},
    {"SideChainInput",
     "<control>Side-chain input</control> lets the plug-in's second input drive the detector instead of the signal itself. The "
     "gain still acts on the main signal. Default <value>{2}</value>.<p>"
     "Tip: feed the kick drum here and compress the bass with it, so the two make room for each other."},
    {"SideChainPlay",
     "<control>Side-chain play</control> lets you hear what the detector hears, with its band limits applied, in place of the "
     "output. Default <value>{2}</value>.<p>"
     "Tip: switch it on while you tune the side-chain frequencies, and off again before you mix."},
    {"SideChainMinFrequency",
     "<control>Side-chain min frequency</control> removes everything below this frequency from what the detector hears (a high-pass "
     "filter). At the lowest setting, <range>{0}</range>, the filter is off; the highest is <range>{1}</range>, the default <value>{2}</value>.<p>"
     "Tip: around <example>100 Hz</example> it stops the bass from pumping a whole mix."},
    {"SideChainMaxFrequency",
     "<control>Side-chain max frequency</control> removes everything above this frequency from what the detector hears (a low-pass "
     "filter). Range <range>{0}</range> to <range>{1}</range>, default <value>{2}</value>; at the highest setting the filter is off.<p>"
     "Tip: set both limits around <example>5 to 8 kHz</example> and the compressor works as a de-esser."},
};

constexpr KPluginHelp kHelp{
    "KCompressorPlugin",
    "Compressor",
    "The <name>Compressor</name> evens out the level of a track: when the signal rises above the "
    "<reference>Threshold</reference>, its gain comes down by the <reference>Ratio</reference>, with the speed set by "
    "<reference>Attack</reference> and <reference>Release</reference>. Loud parts get quieter, so the whole can be made louder "
    "with the <reference>Output gain</reference>. A second input can drive the compression (side-chain), and a graph you draw can "
    "replace the usual curve.",
    kParameters,
};
}  // namespace

const KPluginHelp& KCompressorHelp() { return kHelp; }
