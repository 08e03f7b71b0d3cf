#!/usr/bin/env bash
# Installs the build tree into a fresh prefix, then builds and runs the consumer project
# against it with find_package, without LD_LIBRARY_PATH.
set -euo pipefail
build_dir=$1
consumer_dir=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --install "$build_dir" --prefix "$work/prefix" >/dev/null
cmake -S "$consumer_dir" -B "$work/build" -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
cmake --build "$work/build" >/dev/null
env -u LD_LIBRARY_PATH "$work/build/consumer"
