#!/usr/bin/env python3
"""Runs a program on an X display that nobody sees, which ends with it:

    with_display.py PROGRAM [ARGUMENT...]

GTK has one theme there, one language, and neither settings nor services of the user's desktop.
"""

import os
import select
import subprocess
import sys
import tempfile

PATIENCE = 60  # seconds until the server is ready
# The last program to leave must not make the server start anew while the next one comes.
SERVER = ["Xvfb", "-screen", "0", "1280x1024x24", "-nolisten", "tcp", "-noreset"]
SURROUNDINGS = {
    "GDK_BACKEND": "x11", "GDK_SCALE": "1", "GDK_DPI_SCALE": "1", "GTK_THEME": "Adwaita",
    "GTK_USE_PORTAL": "0", "GTK_MODULES": "", "GTK_IM_MODULE": "gtk-im-context-simple",
    "GSETTINGS_BACKEND": "memory", "NO_AT_BRIDGE": "1", "LC_ALL": "C.UTF-8",
}
USER_FOLDERS = ("XDG_CACHE_HOME", "XDG_CONFIG_HOME", "XDG_DATA_HOME", "XDG_RUNTIME_DIR")


class Display:
    """An X server on a display number that it finds free itself; its name is in DISPLAY."""

    def __enter__(self):
        reader, writer = os.pipe()
        self.server = subprocess.Popen(
            [*SERVER, "-displayfd", str(writer)], pass_fds=[writer], stdin=subprocess.DEVNULL,
            stdout=subprocess.DEVNULL, stderr=subprocess.DEVNULL)
        os.close(writer)
        with os.fdopen(reader) as number:
            ready = select.select([number], [], [], PATIENCE)[0]
            name = number.readline().strip() if ready else ""
        if not name:
            self.__exit__()
            sys.exit("Xvfb does not start")
        os.environ["DISPLAY"] = ":" + name
        os.environ.pop("WAYLAND_DISPLAY", None)
        return self

    def __exit__(self, *_):
        self.server.terminate()
        try:
            self.server.wait(timeout=PATIENCE)
        except subprocess.TimeoutExpired:
            self.server.kill()
            self.server.wait()


def main(command):
    with tempfile.TemporaryDirectory() as folder, Display():
        own = {name: folder for name in USER_FOLDERS}
        return subprocess.run(command, env={**os.environ, **SURROUNDINGS, **own}).returncode


if __name__ == "__main__":
    if len(sys.argv) < 2:
        sys.exit("usage: with_display.py PROGRAM [ARGUMENT...]")
    status = main(sys.argv[1:])
    sys.exit(status if status >= 0 else 128 - status)
