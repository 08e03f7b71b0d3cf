#!/usr/bin/env bash
# Builds the library and runs the example that writes a document compact and pretty.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"

scripts/install-deps.sh >/dev/null
cmake -S . -B build/release -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build/release -j "$(nproc)" --target write_document >/dev/null
build/release/examples/write_document
