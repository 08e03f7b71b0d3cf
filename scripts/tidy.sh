#!/usr/bin/env bash
# Runs clang-tidy over the library, companions, tools and examples of a configured build.
# Usage: tidy.sh BUILD_DIR (configured with CMAKE_EXPORT_COMPILE_COMMANDS=ON)
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"
if ! output=$(git ls-files 'src/*.cpp' 'companions/*.cpp' 'tools/*.cpp' 'examples/*.cpp' |
    xargs -P "$(nproc)" -n 1 clang-tidy -p "$1" --quiet 2>&1); then
    echo "$output" | grep -v -E '^[0-9]+ warnings? generated\.$'
    exit 1
fi
