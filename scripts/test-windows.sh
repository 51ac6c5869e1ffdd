#!/bin/bash
# Runs the tests of the Windows build in the Wine folder, with a display that nobody sees for
# those that open windows: test-windows.sh [CTEST-OPTION...]
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"

root=$("$source_dir/scripts/setup-wine.sh" --print-root)
CanBeRoot || Fail "needs root or sudo to enter the Wine folder"

# The server chooses a free number and writes it when it is ready.
state=$(mktemp -d)
mkfifo "$state/display"
AsRoot sh -c 'echo $$ >"$1/pid"; exec chroot "$2" Xvfb -displayfd 3 -screen 0 1024x768x24 \
    -nolisten tcp 3>"$1/display" >"$1/log" 2>&1 </dev/null' - "$state" "$root" &

desktop_pid=
StopDisplay() {
    [ -z "$desktop_pid" ] || AsRoot kill "$desktop_pid" 2>/dev/null || true
    AsRoot kill "$(cat "$state/pid")" 2>/dev/null || true
    wait 2>/dev/null || true
    rm -rf "$state"
}
trap StopDisplay EXIT

read -r -t 30 display <"$state/display" || { cat "$state/log" >&2; Fail "Xvfb did not start"; }
export ZM_WINE_DISPLAY=:$display
cd "$source_dir"

# The first program to need a desktop starts Wine's desktop process, which inherits and keeps
# open what that program has open, so that a test could not remove its own files. Started here,
# it inherits nothing and serves all tests.
scripts/run-wine.sh 'C:\windows\system32\explorer.exe' /desktop </dev/null >/dev/null 2>&1 &
desktop_pid=$!
# It starts while this small program does; the pause covers what it does after.
scripts/run-wine.sh 'C:\windows\system32\cmd.exe' /c exit </dev/null >/dev/null 2>&1
sleep 2

ctest --preset win32 "$@"
