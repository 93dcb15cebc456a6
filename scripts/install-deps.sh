#!/usr/bin/env bash
# Installs every package the build, the tests and the benchmarks need (Debian 12); chromium
# opens the exported help pages headless; Xvfb and xdotool drive editor windows in the tests;
# the LV2 headers, validator (sordi) and command-line hosts (lilv-utils, lv2file) build and test
# the LV2 bundles; zita-convolver and FFTW are the peers the convolution benchmark measures against.
# With --hosts also a real plug-in host (Ardour) whose scanner the tests load our bundles in;
# with --peers other makers' plug-ins that the VST 3 timing host and the LV2 comparison set
# beside ours (bench/README.md, bench/lv2_peers.sh).
# With --windows the MinGW-w64 cross compiler (posix threads), Wine and what
# scripts/windows-deps.sh needs to cross-build the third-party libraries from Debian's sources.
set -euo pipefail
SUDO=""
[ "$(id -u)" -eq 0 ] || SUDO="sudo"
export DEBIAN_FRONTEND=noninteractive
packages=(ca-certificates g++ cmake ninja-build pkg-config
  libgtest-dev libgmock-dev libbenchmark-dev libsndfile1-dev libkissfft-dev libsamplerate0-dev
  clang libclang-rt-14-dev
  libpng-dev libwebp-dev libfreetype-dev fonts-dejavu-core fonts-dejavu-extra
  libepoxy-dev libegl-dev libegl1-mesa-dev libgl1-mesa-dri libcairo2-dev
  libx11-dev xvfb xauth xdotool
  chromium lv2-dev sordi lilv-utils lv2file
  libzita-convolver-dev libfftw3-dev)
for option in "$@"; do
  case "$option" in
    --hosts) packages+=(ardour) ;;
    --peers) packages+=(zam-plugins lsp-plugins-lv2) ;;
    --windows) packages+=(g++-mingw-w64-x86-64-posix gcc-mingw-w64-x86-64-posix binutils-mingw-w64-x86-64
                 mingw-w64-x86-64-dev wine64 dpkg-dev autoconf automake libtool meson) ;;
    *) echo "unknown option $option" >&2; exit 2 ;;
  esac
done
# Wait for another package manager run (an unattended upgrade, say) instead of failing at once.
apt_options=(-o DPkg::Lock::Timeout=900)
$SUDO apt-get "${apt_options[@]}" update -q
$SUDO apt-get "${apt_options[@]}" install -y -q --no-install-recommends "${packages[@]}"
