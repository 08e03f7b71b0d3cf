#!/usr/bin/env bash
# Installs the build tree into a fresh prefix, then builds the consumer program against it
# twice, as C++20, with CMake's find_package and with pkg-config and plain g++, and runs both
# without LD_LIBRARY_PATH: the installed libraries find each other through their RUNPATH. The
# reading example is built the same way and its output compared with what it must print.
set -euo pipefail
build_dir=$1
consumer_dir=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --install "$build_dir" --prefix "$work/prefix" >/dev/null
libdir=$(find "$work/prefix" -name 'jsonvalue.pc' -printf '%h')/..

cmake -S "$consumer_dir" -B "$work/cmake-build" -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
cmake --build "$work/cmake-build" >/dev/null
env -u LD_LIBRARY_PATH "$work/cmake-build/consumer"
# The reading example reads its configuration and prints what it found and each error.
env -u LD_LIBRARY_PATH "$work/cmake-build/read_config" "$consumer_dir/../../examples/config.json" |
    diff - "$consumer_dir/read_config.expected"

export PKG_CONFIG_PATH="$libdir/pkgconfig"
# shellcheck disable=SC2046 # the flags are meant to split
g++ -std=c++20 -o "$work/pkg-config-consumer" "$consumer_dir/main.cpp" \
    $(pkg-config --cflags --libs jsonvalue)
env -u LD_LIBRARY_PATH "$work/pkg-config-consumer"
