# A display that nobody sees, for programs of the Wine folder that open windows; sourced after
# common.sh.

# StartWineDisplay WIDTHxHEIGHT: sets ZM_WINE_DISPLAY, and ends the display with the script. Wine's
# programs share one server, which must not see windows of two displays: scripts wait here for one
# another, until the other's server has ended.
StartWineDisplay() {
    local root display
    mkdir -p "$cache_dir"
    exec 9>"$cache_dir/wine-display.lock"
    if ! flock -n 9; then
        Say "another run uses Wine's display; waiting for it"
        flock -w 3600 9 || Fail "Wine's display is still in use after an hour"
    fi
    root=$("$source_dir/scripts/setup-wine.sh" --print-root)
    CanBeRoot || Fail "needs root or sudo to enter the Wine folder"
    wine_display_state=$(mktemp -d)
    wine_desktop_pid=
    # The server chooses a free number and writes it when it is ready.
    mkfifo "$wine_display_state/display"
    AsRoot sh -c 'echo $$ >"$1/pid"; exec chroot "$2" Xvfb -displayfd 3 -screen 0 "$3x24" \
        -nolisten tcp 3>"$1/display" >"$1/log" 2>&1 </dev/null' - \
        "$wine_display_state" "$root" "$1" &
    trap StopWineDisplay EXIT
    read -r -t 30 display <"$wine_display_state/display" ||
        { cat "$wine_display_state/log" >&2; Fail "Xvfb did not start"; }
    export ZM_WINE_DISPLAY=:$display
    StartWineDesktop
}

# The first program to need a desktop starts Wine's desktop process, which inherits and keeps
# open what that program has open, so that a test could not remove its own files. Started here,
# it inherits nothing and serves all programs.
StartWineDesktop() {
    "$source_dir/scripts/run-wine.sh" 'C:\windows\system32\explorer.exe' /desktop \
        </dev/null >/dev/null 2>&1 &
    wine_desktop_pid=$!
    # It starts while this small program runs; the pause covers what it does after, and is longer
    # where programs start slowly. There is no window manager: with the setting Wine does not wait
    # two seconds for its answer each time that a window closes.
    local start=$SECONDS
    "$source_dir/scripts/run-wine.sh" 'C:\windows\system32\reg.exe' add \
        'HKCU\Software\Wine\X11 Driver' /v Managed /t REG_SZ /d N /f </dev/null >/dev/null 2>&1
    sleep $((2 + SECONDS - start))
}

StopWineDisplay() {
    [ -z "$wine_desktop_pid" ] || AsRoot kill "$wine_desktop_pid" 2>/dev/null || true
    AsRoot kill "$(cat "$wine_display_state/pid")" 2>/dev/null || true
    wait 2>/dev/null || true
    rm -rf "$wine_display_state"
}
