#!/usr/bin/env bash
# Builds the benchmark (installing Google Benchmark and the peer libraries), runs it with 10
# repetitions in random order, and prints the ratio tables from the medians of this one run.
# The build directory is build/bench unless JSONVALUE_BENCH_BUILD names another.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"
build=${JSONVALUE_BENCH_BUILD:-build/bench}

scripts/install-deps.sh libbenchmark-dev nlohmann-json3-dev rapidjson-dev libboost-json1.81-dev \
    libjsoncpp-dev libsimdjson-dev python3 >/dev/null
cmake -S . -B "$build" -DCMAKE_BUILD_TYPE=Release -DJSONVALUE_BUILD_BENCHMARKS=ON \
    -DJSONVALUE_BUILD_TESTS=OFF -DJSONVALUE_BUILD_EXAMPLES=OFF >/dev/null
cmake --build "$build" -j "$(nproc)" --target json_bench >/dev/null
"$build"/bench/json_bench --benchmark_repetitions=10 --benchmark_min_time=0.05 \
    --benchmark_enable_random_interleaving=true --benchmark_report_aggregates_only=true \
    --benchmark_out="$build"/results.json --benchmark_out_format=json "$@" >/dev/null
python3 bench/ratios.py "$build"/results.json
