#!/usr/bin/env bash
# Builds the libFuzzer targets with clang and runs each for SECONDS (default 60), seeded from
# the parsing test suite and the benchmark documents (tests/data/JSONTestSuite/test_parsing and
# bench/data, read in place; new inputs go to build/fuzz/corpus/TARGET, which later runs start
# from). Usage: fuzz.sh [SECONDS]
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"
seconds=${1:-60}

scripts/install-deps.sh >/dev/null
CXX=clang++-14 cmake -S . -B build/fuzz -DCMAKE_BUILD_TYPE=RelWithDebInfo \
    -DJSONVALUE_BUILD_FUZZERS=ON -DJSONVALUE_BUILD_TESTS=OFF -DJSONVALUE_BUILD_EXAMPLES=OFF \
    -DJSONVALUE_BUILD_TOOLS=OFF >/dev/null
cmake --build build/fuzz -j "$(nproc)" >/dev/null

for target in validate_fuzzer writer_fuzzer utf16_fuzzer; do
    corpus=build/fuzz/corpus/$target
    mkdir -p "$corpus"
    log=build/fuzz/$target.log
    if ! build/fuzz/fuzz/$target -max_total_time="$seconds" -max_len=8192 -timeout=10 \
        -rss_limit_mb=4096 -print_final_stats=1 -artifact_prefix=build/fuzz/ \
        "$corpus" tests/data/JSONTestSuite/test_parsing bench/data >"$log" 2>&1; then
        tail -40 "$log"
        echo "$target failed: the input that failed is in build/fuzz/"
        exit 1
    fi
    echo "$target: $(grep -o 'stat::number_of_executed_units: [0-9]*' "$log" | grep -o '[0-9]*$') runs," \
        "$(grep -o 'cov: [0-9]*' "$log" | tail -1)"
done
