#!/bin/bash
# Runs the tests of the Windows build in the Wine folder, with a display that nobody sees for
# those that open windows: test-windows.sh [CTEST-OPTION...]
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"
. "$source_dir/scripts/wine-display.sh"

StartWineDisplay 1024x768
cd "$source_dir"
ctest --preset win32 "$@"
