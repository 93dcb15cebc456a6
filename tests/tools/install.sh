#!/usr/bin/env bash
# Installs a build under a prefix, moves the prefix, and runs the installed `torvane` there:
# it must find the kernel beside it, the bundles must be under the prefix, and nothing may
# land in the user's ~/.vst3, not even for the prefix /usr/local (staged through DESTDIR).
set -euo pipefail
build=$1
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
export HOME="$work/home"
mkdir -p "$HOME"
cmake --install "$build" --prefix "$work/prefix" >/dev/null
mv "$work/prefix" "$work/moved"
"$work/moved/bin/torvane" --version | grep -q '^torvane '
ldd "$work/moved/bin/torvane" | grep -q "=> $work/moved/bin/../lib/libtorvane.so"
"$work/moved/bin/torvane" list | grep -q KCompressorPlugin
ls -d "$work"/moved/lib/vst3/*.vst3 >/dev/null
[ ! -e "$HOME/.vst3" ]
DESTDIR="$work/staged" cmake --install "$build" --prefix /usr/local >/dev/null
ls -d "$work"/staged/usr/local/lib/vst3/*.vst3 "$work/staged/usr/local/bin/torvane" >/dev/null
[ ! -e "$HOME/.vst3" ] && [ ! -e "$work/staged$HOME" ]
