#!/bin/bash
# Brings all that the Windows build and its tests need: the compiler, the libraries, and with
# `test` the Wine folder. Ends with 75 when something cannot be downloaded.
#
#   setup-windows.sh [test]
set -euo pipefail
scripts=$(dirname "${BASH_SOURCE[0]}")
"$scripts/setup-linux.sh" windows
"$scripts/build-win32-deps.sh"
[ "${1:-}" != test ] || "$scripts/setup-wine.sh"
