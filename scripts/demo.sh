#!/bin/bash
# Runs an example job on a photo and tells where the result lies:
#
#   demo.sh BIN-DIR [PHOTO] [JOB-FILE]
#
# Without a photo it works on a picture that make_sample draws.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

bin_dir=$1
photo=${2:-}
job=${3:-examples/framed-photo.qvjob}
result_dir=build/demo

mkdir -p "$result_dir"
if [ -z "$photo" ]; then
    photo=$result_dir/sample.jpg
    echo "== Drawing a sample picture: $photo"
    "$bin_dir/make_sample" "$photo"
elif [ ! -f "$photo" ]; then
    echo "demo.sh: there is no photo $photo" >&2
    exit 1
fi

echo "== Running $job on $photo"
started=$result_dir/.started
touch "$started"
"$bin_dir/qvrun" run --verbose --output "$result_dir" "$job" "$photo"
echo "== Result:"
find "$PWD/$result_dir" -type f -newer "$started" -printf '   %p (%s bytes)\n'
