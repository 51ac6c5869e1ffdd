#!/usr/bin/env python3
"""Checks the sizes that keep a file pleasant to read, and a few words that stay out of the tree.

    check_sizes.py [ROOT]
"""

import pathlib
import re
import sys

FOLDERS = ("actions", "bench", "engine", "examples", "fuzz", "host", "plugin", "tests")
MAX_COLUMNS = 100
MAX_SOURCE_LINES = 800
MAX_HEADER_LINES = 400
MAX_FUNCTION_LINES = 80
LONG_FUNCTION_LINES = 40
MAX_LONG_SHARE = 0.10

UNFINISHED = re.compile(r"\b(TODO|FIXME|XXX|HACK)\b|not implemented|for now\b", re.IGNORECASE)
# Strings, characters and comments hold braces that open nothing.
NOISE = re.compile(r'"(?:\\.|[^"\\])*"|\'(?:\\.|[^\'\\])+\'|//.*$|/\*.*?\*/')
NOT_A_FUNCTION = re.compile(r"\b(namespace|class|struct|union|enum)\b|=\s*(\{|$)|^\s*extern\b")
FLAT_LINE = re.compile(r"^\s*(case\b.*|default:.*|\{.*\},?|return [^;]*;|break;|\})?$")


def functions_of(lines):
    """Yields (first line number, its lines) of each outermost function body.

    A body starts at a brace whose statement is neither a type, a namespace nor an initializer;
    everything inside belongs to it, lambdas included.
    """
    depth = 0
    start = None
    statement = ""
    for number, line in enumerate(lines, 1):
        code = NOISE.sub('""', line)
        if code.lstrip().startswith("#"):
            continue
        for character in code:
            if character == "{":
                if start is None and "(" in statement and not NOT_A_FUNCTION.search(statement):
                    start, start_depth = number, depth
                depth += 1
                statement = ""
            elif character == "}":
                depth -= 1
                statement = ""
                if start is not None and depth == start_depth:
                    yield start, lines[start - 1:number]
                    start = None
            elif character == ";":
                statement = ""
            else:
                statement += character


def is_flat(body):
    """A table or a switch, long because the matter is."""
    flat = sum(1 for line in body if FLAT_LINE.match(line))
    return flat >= 0.7 * len(body)


def check_lines(name, lines):
    limit = MAX_HEADER_LINES if name.endswith(".h") else MAX_SOURCE_LINES
    if len(lines) > limit:
        yield f"{name}: {len(lines)} lines, more than {limit}"
    for number, line in enumerate(lines, 1):
        if len(line) > MAX_COLUMNS:
            yield f"{name}:{number}: {len(line)} columns, more than {MAX_COLUMNS}"
        if UNFINISHED.search(line):
            yield f"{name}:{number}: unfinished: {line.strip()}"


def main(arguments):
    root = pathlib.Path(arguments[0] if arguments else __file__).resolve()
    root = root if arguments else root.parents[1]
    faults = []
    lengths = []
    for folder in FOLDERS:
        for path in sorted((root / folder).rglob("*")):
            if path.suffix not in (".h", ".cpp"):
                continue
            name = path.relative_to(root).as_posix()
            lines = path.read_text(encoding="utf-8").splitlines()
            faults += check_lines(name, lines)
            for start, body in functions_of(lines):
                if is_flat(body):
                    continue
                lengths.append(len(body))
                if len(body) > MAX_FUNCTION_LINES:
                    faults.append(f"{name}:{start}: a function of {len(body)} lines, more than "
                                  f"{MAX_FUNCTION_LINES}")
    long_share = sum(1 for length in lengths if length > LONG_FUNCTION_LINES) / max(len(lengths), 1)
    if long_share > MAX_LONG_SHARE:
        faults.append(f"{long_share:.1%} of the functions are longer than "
                      f"{LONG_FUNCTION_LINES} lines")
    for fault in faults:
        print(fault)
    middle = sorted(lengths)[len(lengths) // 2] if lengths else 0
    print(f"sizes: {len(lengths)} functions, half of them up to {middle} lines, "
          f"{len(faults)} faults")
    return 1 if faults or not lengths else 0


if __name__ == "__main__":
    sys.exit(main(sys.argv[1:]))
