#!/usr/bin/env python3
"""Checks the include graph: calls go downward only.

host -> plugin -> actions -> engine; inside the engine the load and save driver, proc and canvas
-> codecs -> io and metadata -> bitmap -> foundation and platform. No circle of files anywhere, and
nothing outside engine/platform knows which system it runs on.

    check_layering.py [ROOT]    the tree to check, by default this one
"""

import pathlib
import re
import sys

FOLDERS = ("actions", "bench", "engine", "examples", "fuzz", "host", "plugin", "tests")

# The height of each room. A file includes files of its own height or lower ones; rooms of the
# same height may know each other, but never in a circle.
HEIGHTS = {
    "engine/foundation": 0,
    "engine/platform": 0,
    "engine/bitmap": 1,
    "engine/io": 2,  # file parameters own metadata stores, which read through io's readers
    "engine/metadata": 2,
    "engine/codecs": 4,
    "engine/canvas": 5,
    "engine/proc": 5,
    "actions": 6,
    "plugin": 7,
    "host": 8,
}
OUTSIDE = 9  # programs and tests: they include everything and are included by none of the above
# The load and save driver lies in engine/io above the codecs that it calls.
DRIVER = re.compile(r"^engine/io/(zalmoio|zmxBitmaps_io)")
DRIVER_HEIGHT = 5

INCLUDE = re.compile(r'^\s*#\s*include\s*(["<])([^">]+)[">]')
SYSTEM_MACRO = re.compile(
    r"^\s*#\s*(?:el)?if.*\b(_WIN32|_WIN64|WIN32|__MINGW32__|__linux__|__unix__|__gnu_linux__)\b")
SYSTEM_HEADER = re.compile(
    r"^(windows|winbase|winuser|wingdi|shlobj|commdlg|unistd|fcntl|dlfcn|pthread|sys/.*)\.h$",
    re.IGNORECASE)


def height_of(path):
    if DRIVER.match(path):
        return DRIVER_HEIGHT
    folder = path.rpartition("/")[0]
    while folder:
        if folder in HEIGHTS:
            return HEIGHTS[folder]
        folder = folder.rpartition("/")[0]
    return OUTSIDE


def read_sources(root):
    """Every source and header by its path from the root, with its lines."""
    sources = {}
    for folder in FOLDERS:
        for path in sorted((root / folder).rglob("*")):
            if path.suffix in (".h", ".cpp"):
                name = path.relative_to(root).as_posix()
                sources[name] = path.read_text(encoding="utf-8").splitlines()
    return sources


def includes_of(lines):
    for number, line in enumerate(lines, 1):
        match = INCLUDE.match(line)
        if match:
            yield number, match.group(1) == '"', match.group(2)


def check_directions(sources):
    for name, lines in sources.items():
        for number, quoted, target in includes_of(lines):
            if not quoted:
                continue
            if target not in sources:
                yield f"{name}:{number}: includes {target}, which is no path from the root"
            elif height_of(target) > height_of(name):
                yield f"{name}:{number}: includes {target}, which lies higher"
            elif height_of(target) == OUTSIDE and (
                    target.partition("/")[0] != name.partition("/")[0]):
                yield f"{name}:{number}: includes {target} of another program"


def may_know_system(name):
    """The platform room, views, and test sources that are built for one system, as their names
    say."""
    return name.startswith(
        ("engine/platform/", "actions/views/win32/", "host/views/win32/")) or re.match(
            r"tests/.*(linux|win32)", name)


def check_systems(sources):
    for name, lines in sources.items():
        if may_know_system(name):
            continue
        for number, line in enumerate(lines, 1):
            match = SYSTEM_MACRO.match(line)
            if match:
                yield f"{name}:{number}: tests {match.group(1)} outside engine/platform"
        for number, quoted, target in includes_of(lines):
            if not quoted and SYSTEM_HEADER.match(target):
                yield f"{name}:{number}: includes <{target}> outside engine/platform"


def check_circles(sources):
    """Depth-first: an edge back to a file that is still open closes a circle."""
    graph = {name: [target for _, quoted, target in includes_of(lines)
                    if quoted and target in sources] for name, lines in sources.items()}
    done = set()

    def visit(name, road):
        if name in road:
            yield "circle: " + " -> ".join(road[road.index(name):] + [name])
        elif name not in done:
            for target in graph[name]:
                yield from visit(target, road + [name])
            done.add(name)

    for name in graph:
        yield from visit(name, [])


def check_tree(root):
    sources = read_sources(root)
    if not any(name.startswith("engine/") for name in sources):
        return ["no sources found below " + str(root)]
    return [*check_directions(sources), *check_systems(sources), *check_circles(sources)]


def main(arguments):
    default_root = pathlib.Path(__file__).resolve().parents[2]
    faults = check_tree(pathlib.Path(arguments[0]) if arguments else default_root)
    for fault in faults:
        print(fault)
    print(f"layering: {len(faults)} faults")
    return 1 if faults else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
