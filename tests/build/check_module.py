#!/usr/bin/env python3
"""Checks a built file as a host meets it: what it exports and what it needs.

    check_module.py linux NM FILE        a shared object: InitQVPlugin is the only exported name
    check_module.py win32 OBJDUMP FILE   a DLL: the same, i386, no library outside the system
    check_module.py win32-program OBJDUMP FILE   a program: i386, no library outside the system
"""

import re
import subprocess
import sys

ENTRY = "InitQVPlugin"
# Libraries that every Windows has, in lower case.
SYSTEM_LIBRARIES = {
    "advapi32.dll", "comctl32.dll", "comdlg32.dll", "gdi32.dll", "kernel32.dll", "msvcrt.dll",
    "ntdll.dll", "ole32.dll", "oleaut32.dll", "shell32.dll", "shlwapi.dll", "user32.dll",
    "version.dll", "windowscodecs.dll", "winspool.drv",
}


def linux_exports(nm_text):
    """Names of `nm -D --defined-only`: the last word of each line, without a version."""
    return [line.split()[-1].partition("@")[0] for line in nm_text.splitlines() if line.strip()]


def windows_exports(objdump_text):
    """Names of the export table in `objdump -p`."""
    table = objdump_text.partition("[Ordinal/Name Pointer] Table")[2].partition("\n\n")[0]
    return re.findall(r"^\s*\[\s*\d+\]\s+(?:\+base\[\s*\d+\]\s+\w+\s+)?(\S+)", table, re.MULTILINE)


def windows_imports(objdump_text):
    return re.findall(r"DLL Name: (\S+)", objdump_text)


def export_faults(names):
    if sorted(names) != [ENTRY]:
        yield f"exports {sorted(names)}, not {ENTRY} alone"


def windows_faults(objdump_text, is_module):
    if "file format pei-i386" not in objdump_text:
        yield "is no 32-bit Windows file"
    imports = windows_imports(objdump_text)
    if not imports:
        yield "has no import table that could be read"
    for library in imports:
        if library.lower() not in SYSTEM_LIBRARIES:
            yield f"needs {library}, which is no part of the system"
    if is_module:
        yield from export_faults(windows_exports(objdump_text))


def faults_of(kind, tool, path):
    options = ["-D", "--defined-only"] if kind == "linux" else ["-p"]
    text = subprocess.run([tool, *options, path], check=True, capture_output=True,
                          encoding="utf-8", env={"LC_ALL": "C", "PATH": "/usr/bin:/bin"}).stdout
    if kind == "linux":
        return list(export_faults(linux_exports(text)))
    return list(windows_faults(text, is_module=kind == "win32"))


def main(arguments):
    if len(arguments) != 3 or arguments[0] not in ("linux", "win32", "win32-program"):
        print(__doc__)
        return 2
    faults = faults_of(*arguments)
    for fault in faults:
        print(f"{arguments[2]}: {fault}")
    return 1 if faults else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
