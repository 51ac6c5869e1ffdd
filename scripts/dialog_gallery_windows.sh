#!/bin/bash
# Makes the pictures of the dialogs as the Windows build shows them under Wine, at 100 and 150
# percent:
#
#   dialog_gallery_windows.sh BIN-DIR [OUTPUT-DIR]
#
# Needs the Wine folder, ImageMagick, and win32_gallery.exe in BIN-DIR.
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"
. "$source_dir/scripts/wine-display.sh"

max_bytes=30000

[ $# -ge 1 ] && [ -e "$1/win32_gallery.exe" ] || Fail "there is no win32_gallery.exe in ${1:-.}"
program=$(cd "$1" && pwd)/win32_gallery.exe
output=${2:-$source_dir/docs/gallery/dialogs}
mkdir -p "$output"
output=$(cd "$output" && pwd)

StartWineDisplay 1280x1024
for percent in 100 150; do
    "$source_dir/scripts/run-wine.sh" "$program" "$percent" "Z:$output" windows- </dev/null ||
        Fail "the dialogs could not be shown"
done
for picture in "$output"/windows-*.png; do
    convert "$picture" -strip -dither None -colors 64 "png8:$picture"
    bytes=$(stat -c %s "$picture")
    [ "$bytes" -le $max_bytes ] || Fail "$picture has $bytes bytes, more than $max_bytes"
done
Say "Made $(ls "$output"/windows-*.png | wc -l) pictures in $output"
