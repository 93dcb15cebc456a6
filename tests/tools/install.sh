#!/usr/bin/env bash
# Installs a build under a prefix, moves the prefix, and runs the installed `torvane` there:
# it must find the kernel beside it, the bundles and modules must be under the prefix, and nothing
# may land in the user's ~/.vst3, ~/.lv2 or ~/.lxvst, not even for the prefix /usr/local (staged through DESTDIR).
set -euo pipefail
build=$1
# Matches read the whole of their input: `grep -q` stops at the first match, and the writer's
# broken pipe would fail the pipeline.
has() { grep -e "$1" >/dev/null; }
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
export HOME="$work/home"
mkdir -p "$HOME"
cmake --install "$build" --prefix "$work/prefix" >/dev/null
mv "$work/prefix" "$work/moved"
"$work/moved/bin/torvane" --version | has '^torvane '
ldd "$work/moved/bin/torvane" | has "=> $work/moved/bin/../lib/libtorvane.so"
"$work/moved/bin/torvane" list | has KCompressorPlugin
ls -d "$work"/moved/lib/vst3/*.vst3 "$work"/moved/lib/lv2/*.lv2/manifest.ttl "$work"/moved/lib/lxvst/Torvane/*.so "$work"/moved/lib/lxvst/Torvane/libtorvane.so.* >/dev/null
[ ! -e "$HOME/.vst3" ] && [ ! -e "$HOME/.lv2" ] && [ ! -e "$HOME/.lxvst" ]
DESTDIR="$work/staged" cmake --install "$build" --prefix /usr/local >/dev/null
ls -d "$work"/staged/usr/local/lib/vst3/*.vst3 "$work"/staged/usr/local/lib/lv2/*.lv2 "$work"/staged/usr/local/lib/lxvst/Torvane/Compressor.so "$work/staged/usr/local/bin/torvane" >/dev/null
[ ! -e "$HOME/.vst3" ] && [ ! -e "$HOME/.lv2" ] && [ ! -e "$HOME/.lxvst" ] && [ ! -e "$work/staged$HOME" ]
