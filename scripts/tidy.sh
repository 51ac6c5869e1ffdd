#!/bin/bash
# Runs clang-tidy over the sources that a build folder compiles: tidy.sh BUILD-DIR JOBS
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
build_dir=$1
jobs=$2

# The compiler's own warnings are the build's business, and the two compilers differ in them.
scripts/sources.sh | grep -z '\.cpp$' | grep -zv '/win32/' |
    xargs -0 -n 4 -P "$jobs" clang-tidy -p "$build_dir" --quiet --warnings-as-errors='*' \
        --extra-arg=-w 2> >(grep -v 'warnings\? generated' >&2)
