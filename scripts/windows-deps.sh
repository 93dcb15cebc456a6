#!/usr/bin/env bash
# Cross-builds the third-party libraries of the 64-bit Windows build from Debian's source
# packages, as static libraries, into a prefix outside the source tree (the toolchain file
# cmake/mingw-w64-x86_64.cmake finds them there):
#   bash scripts/windows-deps.sh [prefix]        (default ~/.cache/torvane-win/prefix)
# Each library is built once per pinned version and recipe (a stamp in the prefix remembers it). The audio
# file library reads and writes FLAC and Ogg as on Linux; MPEG is left out.
# Needs scripts/install-deps.sh --windows; adds Debian's source lists when they are missing.
set -euo pipefail
prefix=${1:-$HOME/.cache/torvane-win/prefix}
cache=$(dirname "$prefix")
host=x86_64-w64-mingw32
jobs=$(nproc)
SUDO=""
[ "$(id -u)" -eq 0 ] || SUDO="sudo"

# Source package, pinned version.
pins=(
  "zlib 1:1.2.13.dfsg-1"
  "libpng1.6 1.6.39-2+deb12u5"
  "libwebp 1.2.4-0.2+deb12u1"
  "freetype 2.12.1+dfsg-5+deb12u4"
  "libepoxy 1.5.10-1"
  "libogg 1.3.5-3"
  "libvorbis 1.3.7-1"
  "flac 1.4.2+ds-2"
  "opus 1.3.1-3"
  "libsndfile 1.2.0-1+deb12u1"
  "kissfft 131.1.0-4.1~deb12u1"
  "libsamplerate 0.2.2-3"
  "googletest 1.12.1-0.2"
)

if ! grep -rqs '^Types:.*deb-src\|^deb-src' /etc/apt/sources.list /etc/apt/sources.list.d/; then
  $SUDO tee /etc/apt/sources.list.d/torvane-deb-src.sources >/dev/null <<'LIST'
Types: deb-src
URIs: http://deb.debian.org/debian
Suites: bookworm bookworm-updates
Components: main
Signed-By: /usr/share/keyrings/debian-archive-keyring.gpg

Types: deb-src
URIs: http://deb.debian.org/debian-security
Suites: bookworm-security
Components: main
Signed-By: /usr/share/keyrings/debian-archive-keyring.gpg
LIST
  $SUDO apt-get -o DPkg::Lock::Timeout=900 update -q
fi

mkdir -p "$cache/src" "$prefix/lib/pkgconfig" "$prefix/include"
cat >"$cache/cross.txt" <<CROSS
[binaries]
c = '$host-gcc-posix'
cpp = '$host-g++-posix'
ar = '$host-ar'
strip = '$host-strip'
windres = '$host-windres'
pkgconfig = 'pkg-config'
[host_machine]
system = 'windows'
cpu_family = 'x86_64'
cpu = 'x86_64'
endian = 'little'
CROSS
export PKG_CONFIG_LIBDIR="$prefix/lib/pkgconfig" PKG_CONFIG_PATH=""
cmake_cross=(-G Ninja --no-warn-unused-cli -Wno-dev -Wno-deprecated -DCMAKE_BUILD_TYPE=Release -DCMAKE_SYSTEM_NAME=Windows -DCMAKE_SYSTEM_PROCESSOR=x86_64
  -DCMAKE_C_COMPILER=$host-gcc-posix -DCMAKE_CXX_COMPILER=$host-g++-posix -DCMAKE_RC_COMPILER=$host-windres
  -DCMAKE_FIND_ROOT_PATH="/usr/$host;$prefix" -DCMAKE_FIND_ROOT_PATH_MODE_PROGRAM=NEVER
  -DCMAKE_FIND_ROOT_PATH_MODE_LIBRARY=ONLY -DCMAKE_FIND_ROOT_PATH_MODE_INCLUDE=ONLY
  -DCMAKE_INSTALL_PREFIX="$prefix" -DBUILD_SHARED_LIBS=OFF)
configure_cross=(--host=$host --prefix="$prefix" --disable-shared --enable-static
  CC=$host-gcc-posix CXX=$host-g++-posix CPPFLAGS="-I$prefix/include" LDFLAGS="-L$prefix/lib")

# unpack PACKAGE VERSION: the unpacked source folder, printed. When the mirror lacks the Debian
# part of a source package, the upstream tarball alone is unpacked (without Debian's patches).
unpack() {
  local package=$1 version=$2 upstream=${2#*:}
  upstream=${upstream%-*}
  local folder="$cache/src/$package-${upstream%+dfsg*}"
  if [ ! -d "$folder" ]; then
    (cd "$cache/src" && apt-get source -q --download-only "$package=$version" >&2) || true
    if [ -f "$cache/src/${package}_${version#*:}.dsc" ] && (cd "$cache/src" && dpkg-source -x ./"${package}_${version#*:}.dsc" "$folder" >&2); then
      :
    else
      local tarball
      tarball=$(ls "$cache/src/${package}_${upstream}".orig.tar.* 2>/dev/null | head -1)
      [ -n "$tarball" ] || return 1
      mkdir -p "$folder" && tar -xf "$tarball" -C "$folder" --strip-components=1
    fi
  fi
  echo "$folder"
}

build_zlib() {
  (cd "$1" && CHOST=$host CC=$host-gcc-posix ./configure --static --prefix="$prefix" >/dev/null && make -j"$jobs" install >/dev/null)
}

build_autotools() {
  local source=$1
  shift
  rm -rf "$source/_win" && mkdir "$source/_win"
  (cd "$source/_win" && ../configure "${configure_cross[@]}" "$@" >/dev/null && make -j"$jobs" >/dev/null && make install >/dev/null)
}

build_cmake() {
  local source=$1
  shift
  rm -rf "$source/_win"
  cmake -S "$source" -B "$source/_win" "${cmake_cross[@]}" "$@" >/dev/null
  cmake --build "$source/_win" -j"$jobs" >/dev/null
  cmake --install "$source/_win" >/dev/null
}

build_libpng1.6() { build_autotools "$1" --disable-tests --without-binconfigs; }
build_libwebp() {
  build_cmake "$1" -DWEBP_BUILD_ANIM_UTILS=OFF -DWEBP_BUILD_CWEBP=OFF -DWEBP_BUILD_DWEBP=OFF -DWEBP_BUILD_GIF2WEBP=OFF \
    -DWEBP_BUILD_IMG2WEBP=OFF -DWEBP_BUILD_VWEBP=OFF -DWEBP_BUILD_WEBPINFO=OFF -DWEBP_BUILD_WEBPMUX=OFF -DWEBP_BUILD_EXTRAS=OFF
}
build_freetype() {
  build_cmake "$1" -DFT_REQUIRE_ZLIB=ON -DFT_DISABLE_BZIP2=ON -DFT_DISABLE_PNG=ON -DFT_DISABLE_HARFBUZZ=ON -DFT_DISABLE_BROTLI=ON
}
build_libepoxy() {
  rm -rf "$1/_win"
  meson setup "$1/_win" "$1" --cross-file "$cache/cross.txt" --prefix "$prefix" --libdir lib --buildtype release \
    -Ddefault_library=static -Degl=no -Dglx=no -Dx11=false -Dtests=false -Ddocs=false >/dev/null
  ninja -C "$1/_win" -j"$jobs" install >/dev/null
}
# The audio-file library reads FLAC only with all of its Xiph codecs (Ogg, Vorbis, FLAC, Opus):
# the libraries alone, without programs, tests, documents or stack-protector runtime.
build_libogg() { build_cmake "$1" -DBUILD_TESTING=OFF -DINSTALL_DOCS=OFF; }
build_libvorbis() { build_cmake "$1" -DBUILD_TESTING=OFF; }
build_flac() {
  build_cmake "$1" -DBUILD_CXXLIBS=OFF -DBUILD_PROGRAMS=OFF -DBUILD_EXAMPLES=OFF -DBUILD_TESTING=OFF -DBUILD_DOCS=OFF \
    -DINSTALL_MANPAGES=OFF -DWITH_STACK_PROTECTOR=OFF -DWITH_FORTIFY_SOURCE=OFF -DWITH_OGG=ON
}
# Debian's Opus source lacks a file its CMake build includes: autotools, without the fortified
# string calls that would need the stack-protector runtime (its configure adds them unless the
# level is given).
build_opus() {
  build_autotools "$1" --disable-doc --disable-extra-programs --disable-stack-protector CPPFLAGS="-I$prefix/include -D_FORTIFY_SOURCE=0"
}
# FLAC's headers declare DLL imports unless told that the library is static.
build_libsndfile() {
  build_cmake "$1" -DENABLE_EXTERNAL_LIBS=ON -DCMAKE_C_FLAGS=-DFLAC__NO_DLL -DENABLE_MPEG=OFF -DBUILD_PROGRAMS=OFF \
    -DBUILD_EXAMPLES=OFF -DBUILD_TESTING=OFF -DENABLE_CPACK=OFF -DINSTALL_PKGCONFIG_MODULE=ON -DINSTALL_MANPAGES=OFF
}
# The FFT of the convolution engine, in single precision as on Linux (kissfft-float). Its build
# skips GNUInstallDirs outside Unix, so the folders are given.
build_kissfft() {
  build_cmake "$1" -DKISSFFT_DATATYPE=float -DKISSFFT_STATIC=ON -DKISSFFT_TEST=OFF -DKISSFFT_TOOLS=OFF -DKISSFFT_PKGCONFIG=ON \
    -DCMAKE_INSTALL_LIBDIR=lib -DCMAKE_INSTALL_INCLUDEDIR=include -DCMAKE_INSTALL_BINDIR=bin
}
build_libsamplerate() { build_cmake "$1" -DBUILD_TESTING=OFF -DLIBSAMPLERATE_EXAMPLES=OFF; }
build_googletest() { build_cmake "$1" -DBUILD_GMOCK=ON -Dgtest_disable_pthreads=OFF; }

for pin in "${pins[@]}"; do
  read -r package version <<<"$pin"
  stamp="$prefix/.built-$package"
  # The pinned version and the recipe that built it: a changed recipe builds again.
  recipe="$version $(declare -f "build_$package" | md5sum | cut -c1-12)"
  if [ "$(cat "$stamp" 2>/dev/null)" = "$recipe" ]; then continue; fi
  echo "=== $package $version"
  source=$(unpack "$package" "$version")
  "build_$package" "$source"
  echo "$recipe" >"$stamp"
done
echo "Windows libraries in $prefix"
