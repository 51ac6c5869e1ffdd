#!/bin/bash
# Makes the folder in which 32-bit Windows programs run: a small i386 Debian with Wine. It lies in
# the cache, outside the tree; installing the 32-bit Wine into a 64-bit system breaks on package
# versions that differ between the two. Takes about one minute and 1.7 GB, once.
#
#   setup-wine.sh               make it unless it is there
#   setup-wine.sh --print-root  print where it lies
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"

packages=wine,wine32,fonts-dejavu-core,fonts-liberation,fonts-wine,xvfb,xauth
release=$(DebianRelease)
[ -n "$release" ] || Fail "this is not Debian; the Windows tests need Debian's debootstrap"
# The name changes with whatever decides the content; raise the number with the steps below.
recipe=$(printf '%s %s 2' "$release" "$packages" | sha256sum | cut -c 1-12)
root=$cache_dir/wine-$recipe

case ${1:-} in
    --print-root) printf '%s\n' "$root"; exit 0 ;;
    '') ;;
    *) Fail "unknown argument $1" ;;
esac

# The mark is written last, so a folder without it was left half-finished.
IsComplete() {
    [ -e "$root/.zalmo-complete" ]
}

IsComplete && exit 0
CanBeRoot || Fail "needs root or sudo to make the Wine folder $root"
TakeLock wine
IsComplete && exit 0

MakeRoot() {
    local mirror
    mirror=$(DebianMirror "$release")
    local arguments=(--arch=i386 --variant=minbase "--include=$packages")
    ExportPackageProxy
    # debootstrap mounts /proc and /sys in the folder; in a mount namespace of its own they go
    # away with it however it ends. Where namespaces are forbidden it runs without.
    local wrapper=()
    if AsRoot unshare -m true 2>/dev/null; then wrapper=(unshare -m); fi
    Say "Wine folder: downloading packages"
    AsRoot "${wrapper[@]}" debootstrap "${arguments[@]}" --download-only \
        "$release" "$root.partial" ${mirror:+"$mirror"} >"$log" 2>&1 ||
        { tail -n 5 "$log" >&2; FailDownload "the i386 packages of $release (log: $log)"; }
    Say "Wine folder: unpacking"
    AsRoot "${wrapper[@]}" debootstrap "${arguments[@]}" \
        "$release" "$root.partial" ${mirror:+"$mirror"} >>"$log" 2>&1 ||
        { tail -n 20 "$log" >&2; Fail "debootstrap failed (log: $log)"; }
    AsRoot chroot "$root.partial" apt-get clean
    Say "Wine folder: first start of Wine"
    AsRoot mkdir -p "$root.partial/var/lib/zalmo"
    local inside=(chroot "$root.partial" /usr/bin/env "${wine_environment[@]}")
    # A program that crashes prints its stack and ends; no dialog waits for a click.
    AsRoot "${wrapper[@]}" sh -c '"$@" wineboot -i &&
        "$@" wine reg add "HKCU\\Software\\Wine\\WineDbg" /v ShowCrashDialog /t REG_DWORD /d 0 /f &&
        "$@" wineserver -w' wine "${inside[@]}" >>"$log" 2>&1 </dev/null ||
        { tail -n 20 "$log" >&2; Fail "Wine does not start (log: $log)"; }
}

log=$cache_dir/setup-wine.log
mkdir -p "$cache_dir"
# Left from a run that was stopped: nothing in it can be trusted.
RemoveTree "$root.partial"
RemoveTree "$root"
MakeRoot
AsRoot mv "$root.partial" "$root"
AsRoot touch "$root/.zalmo-complete"
Say "Wine folder: ready in $root"
