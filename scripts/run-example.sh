#!/usr/bin/env bash
# Builds the library and runs the example that builds a document and writes it pretty.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"

scripts/install-deps.sh >/dev/null
cmake -S . -B build/release -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build/release -j "$(nproc)" --target build_document >/dev/null
build/release/examples/build_document
