#!/bin/bash
# Installs the Debian packages that a purpose needs, and only those that are missing:
#
#   setup-linux.sh build|test|bench|fuzz|check|windows...
#
# Touches no network when nothing is missing. Needs root or sudo otherwise.
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"

# PackagesFor PURPOSE: what it needs, one list a purpose.
PackagesFor() {
    case $1 in
        build)
            echo g++ cmake ninja-build libpng-dev libjpeg62-turbo-dev zlib1g-dev libhwy-dev \
                libcli11-dev libpango1.0-dev pkg-config libxcb1-dev libgtk-3-dev ;;
        # ImageMagick is the independent eye that opens what the module wrote; the X server and
        # its programs are the other side of the clipboard.
        test) PackagesFor build; echo libgtest-dev libgmock-dev googletest python3 imagemagick \
            libjpeg-turbo-progs pngcheck fonts-dejavu-core fonts-noto-color-emoji \
            xvfb xauth xclip python3-xlib ;;
        bench) PackagesFor build; echo libbenchmark-dev libjpeg-turbo-progs python3 ;;
        fuzz) PackagesFor build; echo clang libclang-rt-dev ;;
        check) PackagesFor test; echo clang-format clang-tidy ;;
        windows)
            PackagesFor test
            echo g++-mingw-w64-i686-posix libz-mingw-w64-dev nasm dpkg-dev debootstrap ;;
        *) return 1 ;;
    esac
}

[ $# -ge 1 ] || Fail "say what for: build, test, bench, fuzz, check or windows"
command -v dpkg-query >/dev/null && command -v apt-get >/dev/null ||
    Fail "this is not a Debian system; install these yourself: $(PackagesFor test | xargs)"
wanted=$(for purpose in "$@"; do
    PackagesFor "$purpose" || Fail "unknown purpose $purpose"
done | xargs -n 1 | sort -u)
missing=$(MissingPackages $wanted)
[ -n "$missing" ] || exit 0

Say "Missing packages: $missing"
CanBeRoot || Fail "neither root nor sudo; have an administrator run: apt-get install $missing"

export DEBIAN_FRONTEND=noninteractive
# DEBIAN_FRONTEND must pass through sudo, which clears the environment.
Apt() {
    AsRoot env DEBIAN_FRONTEND=noninteractive apt-get -q -o DPkg::Lock::Timeout=300 \
        -o Acquire::Retries=3 "$@" </dev/null
}

# First with the package lists at hand; they may be old or missing, so once more with new ones.
Download() {
    Apt install -y --no-install-recommends --download-only $missing
}

log=$(mktemp)
trap 'rm -f "$log"' EXIT
Say "Downloading and installing them"
Download >"$log" 2>&1 || { Apt update >>"$log" 2>&1; Download >>"$log" 2>&1; } ||
    { tail -n 5 "$log" >&2; FailDownload "packages $missing"; }
Apt install -y --no-install-recommends $missing >"$log" 2>&1 ||
    { tail -n 20 "$log" >&2; Fail "apt-get could not install: $missing"; }
