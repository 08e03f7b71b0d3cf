#!/usr/bin/env bash
# Installs the build tree into a fresh prefix and builds and runs the consumer programs against
# it (consume.sh). Usage: run.sh BUILD_DIR CONSUMER_DIR shared|static
set -euo pipefail
build_dir=$1
consumer_dir=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake --install "$build_dir" --prefix "$work/prefix" >/dev/null
"$(dirname "$0")/consume.sh" "$work/prefix" "$consumer_dir" "$3"
