#!/usr/bin/env bash
# Builds the project and runs jsonfmt on the bundled sample document.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"

scripts/install-deps.sh >/dev/null
cmake -S . -B build/release -DCMAKE_BUILD_TYPE=Release >/dev/null
cmake --build build/release -j "$(nproc)" >/dev/null
build/release/tools/jsonfmt examples/sample.json
