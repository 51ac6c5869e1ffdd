#!/bin/bash
# Fuzzes each target for some seconds: fuzz.sh BIN-DIR SECONDS. What a target learns stays in
# build/fuzz/corpus; an input that breaks it is named and ends the run with an error.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
bin_dir=$1
seconds=$2

for target in "$bin_dir"/fuzz_*; do
    [ -x "$target" ] || continue
    name=$(basename "$target")
    learned=build/fuzz/corpus/$name
    mkdir -p "$learned" build/fuzz/crashes
    printf '== %s\n' "$name"
    "$target" -max_total_time="$seconds" -max_len=65536 -timeout=10 -rss_limit_mb=2048 \
        -print_final_stats=1 -verbosity=0 -artifact_prefix="build/fuzz/crashes/$name-" \
        "$learned" "fuzz/seeds/$name"
done
