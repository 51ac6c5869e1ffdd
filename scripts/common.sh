# Shared by the scripts of this folder; sourced, never run. Bash only.
#
# Exit status: 0 done; 1 failed; 2 wrong use; $ZM_NO_DOWNLOAD when something could not be
# downloaded, so that a caller can tell a missing network from a fault of ours.

ZM_NO_DOWNLOAD=75

source_dir=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
cache_dir=${ZM_CACHE_DIR:-${XDG_CACHE_HOME:-${HOME:-/root}/.cache}/zalmo-graphics}

# What Wine programs run with inside the Wine folder: no desktop entries, no offers to download
# browsers, a home of their own, and file names in UTF-8. Wine finds its libraries by /proc, which
# may be missing there; the path tells it without.
wine_environment=(HOME=/var/lib/zalmo PATH=/usr/bin:/bin TMPDIR=/tmp LC_ALL=C.UTF-8
    WINEPREFIX=/var/lib/zalmo/wine "WINEDEBUG=${WINEDEBUG:--all}"
    WINEDLLPATH=/usr/lib/i386-linux-gnu/wine/i386-unix
    'WINEDLLOVERRIDES=winemenubuilder.exe,mscoree,mshtml=d')

Say() {
    printf '== %s\n' "$*"
}

Fail() {
    printf '%s: %s\n' "$(basename "$0")" "$*" >&2
    exit 1
}

FailDownload() {
    printf '%s: cannot download: %s\n' "$(basename "$0")" "$*" >&2
    exit "$ZM_NO_DOWNLOAD"
}

# True when commands can run as root, directly or through sudo. Without a terminal sudo must not
# ask for a password: nobody is there to type it.
CanBeRoot() {
    [ "$(id -u)" = 0 ] && return 0
    command -v sudo >/dev/null 2>&1 || return 1
    if [ -t 0 ]; then sudo -v; else sudo -n true 2>/dev/null; fi
}

AsRoot() {
    if [ "$(id -u)" = 0 ]; then "$@"; else sudo "$@"; fi
}

# Prints the packages of the arguments that are not installed.
MissingPackages() {
    local package
    for package in "$@"; do
        dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q ' installed$' ||
            printf '%s ' "$package"
    done
}

# The Debian release of this machine; its packages fit each other.
DebianRelease() {
    (
        . /etc/os-release
        if [ "${ID:-}" = debian ]; then printf '%s\n' "${VERSION_CODENAME:-}"; fi
    )
}

# The mirror that this machine's own package configuration names for the release's main suite;
# prints nothing when there is none.
DebianMirror() {
    apt-get update --print-uris 2>/dev/null |
        sed -n "s|^'\\([^']*\\)/dists/$1/InRelease'.*|\\1|p" | head -n 1
}

# Programs that know nothing of the package manager's proxy setting get it by the environment.
ExportPackageProxy() {
    local proxy=
    eval "$(apt-config shell proxy Acquire::http::Proxy 2>/dev/null)"
    if [ -n "$proxy" ] && [ "$proxy" != DIRECT ] && [ -z "${http_proxy:-}" ]; then
        export http_proxy=$proxy
    fi
}

# Runs the rest of the calling script alone: waits until no other holds the named lock.
TakeLock() {
    mkdir -p "$cache_dir"
    exec 9>"$cache_dir/$1.lock"
    if ! flock -n 9; then
        Say "another run prepares $1; waiting for it"
        flock 9
    fi
}

# Removes a folder tree, but never reaches through a mount below it.
RemoveTree() {
    [ -e "$1" ] || return 0
    if awk -v dir="$1/" 'index($5, dir) == 1 { found = 1 } END { exit !found }' \
        /proc/self/mountinfo; then
        Fail "something is mounted below $1; unmount it first"
    fi
    AsRoot rm -rf --one-file-system -- "$1"
}
