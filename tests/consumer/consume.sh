#!/usr/bin/env bash
# Builds the consumer program against the jsonvalue installed in PREFIX twice, as C++20, with
# CMake's find_package and with pkg-config and plain g++, and runs both without
# LD_LIBRARY_PATH. The reading example is built the same way as the first and its output
# compared with what it must print. LINKAGE is how the installed libraries were built:
# "shared", and each program needs libjsonvalue.so, found through the run paths; "static", and
# none needs a shared library of jsonvalue's (pkg-config --static adds the companions).
# Usage: consume.sh PREFIX CONSUMER_DIR shared|static
set -euo pipefail
prefix=$1
consumer_dir=$2
linkage=$3
here=$(cd "$(dirname "$0")" && pwd)
source "$here/../support/missing.sh"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# run PROGRAM [ARGS...]: runs PROGRAM after checking which libraries of jsonvalue's it needs
run() {
    local ours expected=""
    ours=$(readelf -d "$1" | sed -n 's/.*(NEEDED).*\[\(libjsonvalue[^]]*\)\]/\1/p' | tr '\n' ' ')
    [ "$linkage" = shared ] && expected="libjsonvalue.so.0 "
    if [ "$ours" != "$expected" ]; then
        echo "$(basename "$1") needs '$ours' at run time, not '$expected' ($linkage libraries)"
        exit 1
    fi
    env -u LD_LIBRARY_PATH "$@"
}

cmake -S "$consumer_dir" -B "$work/cmake-build" -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/cmake-build" >/dev/null
run "$work/cmake-build/consumer"
# The reading example reads its configuration and prints what it found and each error.
run "$work/cmake-build/read_config" "$consumer_dir/../../examples/config.json" |
    diff - "$consumer_dir/read_config.expected"

if ! command -v pkg-config >/dev/null; then
    missing "pkg-config, for the pkg-config consumer," || exit 1
    exit 0
fi
export PKG_CONFIG_PATH
PKG_CONFIG_PATH=$(dirname "$(find "$prefix" -name jsonvalue.pc)")
static=()
[ "$linkage" = static ] && static=(--static)
# shellcheck disable=SC2046 # the flags are meant to split
g++ -std=c++20 -o "$work/pkg-config-consumer" "$consumer_dir/main.cpp" \
    $(pkg-config "${static[@]}" --cflags --libs jsonvalue)
run "$work/pkg-config-consumer"
