#!/bin/bash
# Measures speed: bench.sh BIN-DIR [BENCHMARK-OPTION...]. First the engine's own benchmarks, with
# memcpy of the same bytes as the yardstick of the same run, and what other libraries take where
# they are installed; then whole jobs with qvrun.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
bin_dir=$1
shift

"$bin_dir/zmbench" "$@"
python3 bench/peers.py
python3 scripts/bench_jobs.py "$bin_dir" build/bench
