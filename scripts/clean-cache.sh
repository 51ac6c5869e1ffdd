#!/bin/bash
# Removes what the Windows leg keeps outside the tree: it is made again when needed.
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"
for path in "$cache_dir"/{win32-deps,wine,build-win32-deps,setup-wine}*; do
    RemoveTree "$path"
done
Say "Removed the Windows libraries and the Wine folder from $cache_dir"
