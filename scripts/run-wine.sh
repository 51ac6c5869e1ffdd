#!/bin/bash
# Runs a 32-bit Windows program in the Wine folder and passes on its exit status:
#
#   run-wine.sh PROGRAM.exe [ARGUMENT...]
#
# This machine's folders are visible to the program at the same paths, on drive Z. The bind
# mounts for that live in a mount namespace of this run and end with it. Where mounts are
# forbidden the tree and its photos are copied into the folder instead; what the program writes
# then stays there. ZM_WINE_DISPLAY names an X display for programs that open windows.
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"

[ $# -ge 1 ] || Fail "name the program to run"
root=${ZM_WINE_ROOT:-$("$source_dir/scripts/setup-wine.sh" --print-root)}
[ -e "$root/.zalmo-complete" ] || Fail "the Wine folder is missing; run scripts/setup-wine.sh"

# As root only, and in one process: whoever stops this script stops the program.
if [ "$(id -u)" != 0 ]; then
    CanBeRoot || Fail "needs root or sudo to enter the Wine folder"
    exec sudo --preserve-env ZM_WINE_ROOT="$root" "${BASH_SOURCE[0]}" "$@"
fi

# The folder's own system; everything else comes from this machine.
IsSystemFolder() {
    case $1 in
        /bin | /boot | /dev | /etc | /lib | /lib32 | /lib64 | /libx32 | /lost+found) return 0 ;;
        /media | /mnt | /proc | /run | /sbin | /sys | /usr | /var) return 0 ;;
    esac
    return 1
}

Bind() {
    mkdir -p "$root$1"
    mount --rbind "$1" "$root$1"
}

# The same folders are bound for every tree, because runs share one Wine server, which opens the
# files and sees what its first run saw. A tree inside a system folder is bound by itself.
BindFolders() {
    local folder
    mount -t proc proc "$root/proc" 2>/dev/null || true
    mount --rbind /dev "$root/dev" 2>/dev/null || true
    for folder in /*; do
        if [ -d "$folder" ] && [ ! -L "$folder" ] && ! IsSystemFolder "$folder"; then
            Bind "$folder"
        fi
    done
    for folder in "$source_dir" "$PWD"; do
        if IsSystemFolder "/$(cut -d / -f 2 <<<"$folder")"; then Bind "$folder"; fi
    done
}

# CopyFolder FOLDER [FIND-TEST...]: only files that are newer, and never into a running program.
CopyFolder() {
    local folder=$1
    shift
    [ -d "$folder" ] || return 0
    mkdir -p "$root$folder"
    (cd "$folder" && find . "$@" -type f ! -name '*.[oa]' -print0 |
        xargs -0r cp --update --parents --remove-destination --preserve=mode,timestamps \
            -t "$root$folder")
}

CopyFolders() {
    exec 8>"$root.copy.lock"
    flock 8
    CopyFolder "$source_dir" \( -name .git -o -path ./build \) -prune -o
    CopyFolder "$source_dir/../shared/corpus"
    CopyFolder "$PWD" -name CMakeFiles -prune -o
    CopyFolder "$(cd "$(dirname "$1")" && pwd)" -name CMakeFiles -prune -o
    flock -u 8
    exec 8>&-
}

EnterFolder() {
    exec chroot "$root" /usr/bin/env --chdir="$PWD" "${wine_environment[@]}" \
        ${ZM_WINE_DISPLAY:+"DISPLAY=$ZM_WINE_DISPLAY"} wine "$@"
}

if [ "${ZM_WINE_INSIDE:-}" = 1 ]; then
    BindFolders
    EnterFolder "$@"
elif unshare -m true 2>/dev/null; then
    ZM_WINE_INSIDE=1 ZM_WINE_ROOT=$root exec unshare -m "${BASH_SOURCE[0]}" "$@"
else
    CopyFolders "$1"
    EnterFolder "$@"
fi
