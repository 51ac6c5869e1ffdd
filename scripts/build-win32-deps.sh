#!/bin/bash
# Builds the libraries of the 32-bit Windows module: zlib, libpng, libjpeg-turbo and Highway,
# GoogleTest for the tests and CLI11 for qvrun, static, into a folder of the cache outside the
# tree. The sources are Debian's own. Takes about one minute, once; made anew only when the
# recipe (this file, the toolchain file, the release) changes.
#
#   build-win32-deps.sh                 build them unless they are there
#   build-win32-deps.sh --print-prefix  print where they lie
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"

toolchain=$source_dir/cmake/toolchain-mingw32.cmake
release=$(DebianRelease)
[ -n "$release" ] || Fail "this is not Debian; the sources of the libraries come from Debian"
recipe=$( (printf '%s\n' "$release"; cat "${BASH_SOURCE[0]}" "$toolchain") |
    sha256sum | cut -c 1-12)
prefix=$cache_dir/win32-deps-$recipe

case ${1:-} in
    --print-prefix) printf '%s\n' "$prefix"; exit 0 ;;
    '') ;;
    *) Fail "unknown argument $1" ;;
esac

# The finished folder appears by a rename, so it is whole when it exists.
[ -d "$prefix" ] && exit 0
TakeLock win32-deps
[ -d "$prefix" ] && exit 0

work=$cache_dir/win32-deps.work
stage=$work/stage
log=$cache_dir/build-win32-deps.log

# Debian's source packages of the main suite, through a private package configuration: the
# machine's own may have no source entries, and is not touched. The security suite is left out
# because its sources are not on every mirror.
FetchSources() {
    local mirror apt_dir=$work/apt
    mirror=$(DebianMirror "$release")
    [ -n "$mirror" ] || FailDownload "no mirror of $release is configured"
    mkdir -p "$apt_dir/lists/partial" "$apt_dir/cache/archives/partial" "$work/download"
    printf 'deb-src %s %s main\n' "$mirror" "$release" >"$apt_dir/sources.list"
    local apt=(apt-get -q -o "Dir::Etc::SourceList=$apt_dir/sources.list"
        -o Dir::Etc::SourceParts=/dev/null -o "Dir::State::Lists=$apt_dir/lists"
        -o "Dir::Cache=$apt_dir/cache" -o APT::Sandbox::User= -o Acquire::Retries=3)
    Say "Windows libraries: downloading sources"
    "${apt[@]}" update >>"$log" 2>&1 && (cd "$work/download" &&
        "${apt[@]}" source --download-only libpng1.6 libjpeg-turbo highway >>"$log" 2>&1) ||
        FailDownload "the library sources from the main suite of $release (log: $log)"
}

# Unpack NAME PATTERN: the source package's tree, Debian's patches applied.
Unpack() {
    dpkg-source --no-check -x "$work"/download/$2 "$work/$1" >>"$log" 2>&1 ||
        Fail "cannot unpack the source of $1 (log: $log)"
}

# Build NAME SOURCE OPTIONS...: configures, builds and installs one library into the stage.
Build() {
    local name=$1 source=$2
    shift 2
    Say "Windows libraries: building $name"
    cmake -S "$source" -B "$work/build-$name" -G Ninja -DCMAKE_TOOLCHAIN_FILE="$toolchain" \
        -DZM_WIN32_DEPS="$stage" -DCMAKE_INSTALL_PREFIX="$stage" -DCMAKE_INSTALL_LIBDIR:STRING=lib \
        -DCMAKE_BUILD_TYPE=Release -DBUILD_SHARED_LIBS=OFF "$@" >>"$log" 2>&1 &&
        cmake --build "$work/build-$name" >>"$log" 2>&1 &&
        cmake --install "$work/build-$name" >>"$log" 2>&1 ||
        { tail -n 20 "$log" >&2; Fail "building $name failed (log: $log)"; }
}

# MinGW's zlib package holds an import library too, which the linker must not find.
CopyZlib() {
    mkdir -p "$stage/include" "$stage/lib"
    cp /usr/i686-w64-mingw32/include/{zlib,zconf}.h "$stage/include/"
    cp /usr/i686-w64-mingw32/lib/libz.a "$stage/lib/"
}

# Header-only: the same files serve every target.
CopyCli11() {
    cp -r /usr/include/CLI "$stage/include/"
    mkdir -p "$stage/share/cmake"
    cp -r /usr/share/cmake/CLI11 "$stage/share/cmake/" 2>/dev/null ||
        cp -r /usr/lib/*/cmake/CLI11 "$stage/share/cmake/"
}

mkdir -p "$cache_dir"
: >"$log"
RemoveTree "$work"
mkdir -p "$work"
FetchSources
Unpack libpng 'libpng1.6_*.dsc'
Unpack libjpeg-turbo 'libjpeg-turbo_*.dsc'
Unpack highway 'highway_*.dsc'

CopyZlib
CopyCli11
Build libpng "$work/libpng" -DPNG_SHARED=OFF -DPNG_STATIC=ON -DPNG_TESTS=OFF
Build libjpeg-turbo "$work/libjpeg-turbo" -DENABLE_SHARED=OFF -DENABLE_STATIC=ON \
    -DWITH_TURBOJPEG=OFF -DREQUIRE_SIMD=ON
Build highway "$work/highway" -DHWY_ENABLE_TESTS=OFF -DHWY_ENABLE_EXAMPLES=OFF \
    -DHWY_ENABLE_CONTRIB=OFF
Build googletest /usr/src/googletest -DBUILD_GMOCK=ON

rm -rf -- "$stage/bin" "$stage/lib/pkgconfig" "$stage/share/man" "$stage/share/doc"
for library in libz libpng16 libjpeg libhwy libgtest libgmock; do
    [ -f "$stage/lib/$library.a" ] || Fail "$library.a did not arrive in the stage (log: $log)"
done
mv "$stage" "$prefix"
RemoveTree "$work"
Say "Windows libraries: ready in $prefix"
