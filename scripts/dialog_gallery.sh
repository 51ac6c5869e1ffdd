#!/bin/bash
# Makes the pictures of the dialogs as GTK shows them, at 100 and 150 percent:
#
#   dialog_gallery.sh BIN-DIR [OUTPUT-DIR]
#
# Needs Xvfb and ImageMagick, and gtk_gallery in BIN-DIR. All pictures come from one theme and a
# screen of one kind, whatever the user's own are.
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/common.sh"

max_bytes=30000

[ $# -ge 1 ] && [ -x "$1/gtk_gallery" ] || Fail "there is no gtk_gallery in ${1:-.}"
output=${2:-$source_dir/docs/gallery/dialogs}
mkdir -p "$output"

for percent in 100 150; do
    "$source_dir/tests/build/with_display.py" "$1/gtk_gallery" "$percent" "$output" linux- ||
        Fail "the dialogs could not be shown"
done
for picture in "$output"/linux-*.png; do
    convert "$picture" -strip -dither None -colors 64 "png8:$picture"
    bytes=$(stat -c %s "$picture")
    [ "$bytes" -le $max_bytes ] || Fail "$picture has $bytes bytes, more than $max_bytes"
done
Say "Made $(ls "$output"/linux-*.png | wc -l) pictures in $output"
