#!/usr/bin/env bash
# The 64-bit Windows build: cross-built with MinGW-w64 against the libraries of
# scripts/windows-deps.sh, every test binary run under Wine, and the Windows bundles and program
# checked against a Linux build's:
#   bash scripts/windows-test.sh [<linux build>]      (needs scripts/install-deps.sh --windows)
# With a Linux build folder (default build/tests, built already), `torvane render` and the VST 3
# bundles' renders of both systems must agree byte for byte.
set -euo pipefail
cd "$(dirname "$0")/.."
linux=${1:-build/tests}
jobs=$(nproc)
start=$SECONDS
echo "=== windows"
bash scripts/windows-deps.sh
# A Wine prefix of the build's own, quiet, without a display.
export WINEPREFIX="$PWD/build/wine" WINEDEBUG=-all WINEDLLOVERRIDES="mscoree,mshtml=" DISPLAY=
wineboot_done="$WINEPREFIX/.initialised"
[ -f "$wineboot_done" ] || { /usr/lib/wine/wine64 wineboot --init >/dev/null 2>&1 || true; touch "$wineboot_done"; }
# Every run starts with no user data, as the Linux tests do in their fresh data folders.
rm -rf "$WINEPREFIX/drive_c/users/$(id -un)/AppData/Roaming/Torvane"
cmake -S . -B build/windows -G Ninja --toolchain cmake/mingw-w64-x86_64.cmake -DCMAKE_BUILD_TYPE=RelWithDebInfo \
  -DTORVANE_BENCHMARKS=OFF >/dev/null
cmake --build build/windows -j "$jobs"
log=build/windows/ctest.log
status=0
(cd build/windows && ctest -V -j "$jobs" --timeout 900) >"$log" 2>&1 || status=$?
grep -E '^[0-9]+/[0-9]+ Test|tests passed|tests failed|\*\*\*' "$log" || true
cases=$(sed -n 's/.*\[  PASSED  \] \([0-9]*\) tests\{0,1\}\..*/\1/p' "$log" | awk '{n += $1} END {print n + 0}')
failed=$(grep -c '\[  FAILED  \] [A-Za-z]' "$log" || true)
echo "windows: $cases test cases passed under Wine, $failed failed"
if [ "$status" -ne 0 ]; then
  grep -B2 -A20 '\[  FAILED  \]\|Failed\|Error' "$log" | head -200
fi

# The same input rendered by both systems' programs must give the same file (integer samples:
# a float file carries a PEAK chunk with the time of writing): a chain as WAV, and the
# convolution reverb (FFT, resampled impulse response) as FLAC.
if [ -x "$linux/tools/torvane" ]; then
  compare=build/windows/compare
  rm -rf "$compare" && mkdir -p "$compare"
  for render in "chain.wav s32 Compressor + Equalizer" "reverb.flac s24 ConvolutionReverb"; do
    read -r file format chain <<<"$render"
    "$linux/tools/torvane" render $chain --format "$format" --dither none -q "$compare/linux-$file"
    /usr/lib/wine/wine64 build/windows/torvane.exe render $chain --format "$format" --dither none -q "$compare/windows-$file"
    if cmp "$compare/linux-$file" "$compare/windows-$file"; then echo "windows: torvane render writes the same $file as on Linux"; else status=1; fi
  done
fi
# The VST 3 bundles of both systems, driven alike by the tests' host, render the same samples.
renders=0
for linux_render in "$linux"/vst3-render/*.f32; do
  [ -f "$linux_render" ] || continue
  if cmp "$linux_render" "build/windows/vst3-render/$(basename "$linux_render")"; then renders=$((renders + 1)); else status=1; fi
done
echo "windows: $renders VST 3 bundle renders identical to the Linux bundles'"
# A Linux build whose suite ran leaves renders: none at all compares nothing.
if [ -d "$linux" ] && [ "$renders" -eq 0 ]; then echo "windows: no Linux VST 3 renders in $linux/vst3-render"; status=1; fi
echo "windows stage: $((SECONDS - start)) s"
exit "$status"
