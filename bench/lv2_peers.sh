#!/usr/bin/env bash
# Whole-process renders of one minute of stereo through three LV2 compressors with lv2file at
# blocks of 64 frames, and with lv2apply: ours and two Debian-packaged peers (ZamCompX2 from
# zam-plugins, the LSP stereo compressor from lsp-plugins-lv2), each the best of three runs, with wall, user and
# system times and their ratios to ours. The peers are installed here (install-deps.sh --peers),
# for comparisons only.
#
#   bash bench/lv2_peers.sh [build dir]     (default build/tests; the LV2 bundles must be built)
set -euo pipefail
cd "$(dirname "$0")/.."
build=${1:-build/tests}
[ -d "$build/lv2/Compressor.lv2" ] || { echo "no LV2 bundles in $build/lv2: build first" >&2; exit 1; }
dpkg -s zam-plugins lsp-plugins-lv2 >/dev/null 2>&1 || bash scripts/install-deps.sh --peers >/dev/null

work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
# One minute of 16-bit noise at 48 kHz, written as a WAV file of CHANNELS channels: the noise in
# the first two, silence in any further ones (lv2apply feeds every audio input, side-chains
# too, from a channel of the file).
frames=$((48000 * 60))
head -c $((frames * 4)) /dev/urandom > "$work/noise.raw"
bytes() { local value=$1 count=$2; for ((i = 0; i < count; ++i)); do printf "\\x$(printf %02x $((value >> 8 * i & 255)))"; done; }
wav() {
  local channels=$1 size=$((frames * $1 * 2))
  { printf 'RIFF'; bytes $((36 + size)) 4; printf 'WAVEfmt '; bytes 16 4; bytes 1 2; bytes "$channels" 2; bytes 48000 4
    bytes $((48000 * channels * 2)) 4; bytes $((channels * 2)) 2; bytes 16 2; printf 'data'; bytes "$size" 4
    perl -e 'binmode STDIN; binmode STDOUT; my $pad = "\0" x (2 * ($ARGV[0] - 2)); while (read(STDIN, my $frame, 4) == 4) { print $frame, $pad }' "$channels" < "$work/noise.raw"
  } > "$work/input-$channels.wav"
}
for channels in 2 3 4; do wav $channels; done

export LV2_PATH="$PWD/$build/lv2:/usr/lib/lv2:/usr/lib/x86_64-linux-gnu/lv2"
# name  URI  the two main input ports  the file lv2apply reads (every audio input a channel)
plugins=("Torvane Compressor|urn:torvane:KCompressorPlugin|in_1 in_2|input-4.wav"
         "ZamCompX2|urn:zamaudio:ZamCompX2|lv2_audio_in_1 lv2_audio_in_2|input-3.wav"
         "LSP Compressor Stereo|http://lsp-plug.in/plugins/lv2/compressor_stereo|in_l in_r|input-2.wav")
# time_render COMMAND...: the best of three whole-process runs as "wall user system", or
# "failed" when the tool does not finish.
time_render() {
  local best="" times
  for run in 1 2 3; do
    rm -f "$work/out.wav" "$work/failed"
    times=$( { TIMEFORMAT='%R %U %S'; time { "$@" >/dev/null 2>&1 || touch "$work/failed"; }; } 2>&1 | tail -n 1)
    if [ -e "$work/failed" ] || ! [[ $times =~ ^[0-9.]+\ [0-9.]+\ [0-9.]+$ ]]; then echo "failed"; return; fi
    if [ -z "$best" ] || awk "BEGIN{exit !(${times%% *} < ${best%% *})}"; then best=$times; fi
  done
  echo "$best"
}

# table TITLE TOOL: one row per plug-in, ratios to ours.
table() {
  local title=$1 tool=$2 base_wall="" base_cpu=""
  echo "== $title"
  printf '%-24s %9s %9s %9s %11s %11s\n' plug-in wall user system "wall ratio" "cpu ratio"
  for entry in "${plugins[@]}"; do
    IFS='|' read -r name uri ports applied <<< "$entry"
    read -r in1 in2 <<< "$ports"
    if [ "$tool" = lv2file ]; then
      result=$(time_render lv2file --ignore-clipping -b 64 -c "1:$in1" -c "2:$in2" -i "$work/input-2.wav" -o "$work/out.wav" "$uri")
    else
      result=$(time_render lv2apply -i "$work/$applied" -o "$work/out.wav" "$uri")
    fi
    if [ "$result" = failed ]; then printf '%-24s %s\n' "$name" "failed: $tool did not finish"; continue; fi
    read -r wall user sys <<< "$result"
    cpu=$(awk "BEGIN{print $user + $sys}")
    [ -n "$base_wall" ] || { base_wall=$wall; base_cpu=$cpu; }
    printf '%-24s %8.3fs %8.3fs %8.3fs %11.2f %11.2f\n' "$name" "$wall" "$user" "$sys" \
      "$(awk "BEGIN{print $wall / $base_wall}")" "$(awk "BEGIN{print $cpu / $base_cpu}")"
  done
}

table "lv2file -b 64, one minute of stereo" lv2file
# lv2file offers its plug-ins no host features: a plug-in that requires urid:map (LSP) crashes
# there. lilv's lv2apply offers urid:map but not options, which ZamCompX2 cannot do without.
table "lv2apply (one frame per run), one minute of stereo" lv2apply
echo "ratios: the peer's time over ours (above 1: ours is faster)"
