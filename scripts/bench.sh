#!/usr/bin/env bash
# Builds the benchmark (installing Google Benchmark and the peer libraries), runs it with 10
# repetitions in random order, and prints the ratio tables from the medians of this one run.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"

scripts/install-deps.sh libbenchmark-dev nlohmann-json3-dev rapidjson-dev libboost-json1.81-dev \
    libjsoncpp-dev libsimdjson-dev python3 >/dev/null
cmake -S . -B build/bench -DCMAKE_BUILD_TYPE=Release -DJSONVALUE_BUILD_BENCHMARKS=ON \
    -DJSONVALUE_BUILD_TESTS=OFF -DJSONVALUE_BUILD_EXAMPLES=OFF >/dev/null
cmake --build build/bench -j "$(nproc)" --target json_bench >/dev/null
build/bench/bench/json_bench --benchmark_repetitions=10 --benchmark_min_time=0.05 \
    --benchmark_enable_random_interleaving=true --benchmark_report_aggregates_only=true \
    --benchmark_out=build/bench/results.json --benchmark_out_format=json "$@" >/dev/null
python3 bench/ratios.py build/bench/results.json
