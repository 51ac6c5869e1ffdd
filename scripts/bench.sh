#!/bin/bash
# Measures speed: bench.sh BIN-DIR [BENCHMARK-OPTION...]. First the engine's own benchmarks, with
# memcpy of the same bytes as the yardstick of the same run; then a table of them beside what other
# libraries take, where these are installed; then whole jobs with qvrun.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."
bin_dir=$1
shift
results=build/bench/zmbench.json
mkdir -p build/bench

# The other libraries are packages of the system, which a Python of another origin does not see.
python=python3
for candidate in python3 /usr/bin/python3; do
    if "$candidate" -c 'import cv2, PIL' 2>/dev/null; then
        python=$candidate
        break
    fi
done

"$bin_dir/zmbench" --benchmark_out="$results" --benchmark_out_format=json "$@"
"$python" bench/peers.py "$results"
python3 scripts/bench_jobs.py "$bin_dir" build/bench
