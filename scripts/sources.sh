#!/bin/bash
# Prints the C++ sources and headers of the tree, each ended by a zero byte.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
find actions bench engine examples fuzz host plugin tests -name '*.cpp' -print0 -o \
    -name '*.h' -print0 | sort -z
