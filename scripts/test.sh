#!/usr/bin/env bash
# Builds and runs every test twice: with AddressSanitizer and UndefinedBehaviorSanitizer, and
# as a Release build with warnings as errors. Also checks formatting and clang-tidy.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"

scripts/install-deps.sh

echo "== clang-format"
git ls-files '*.cpp' '*.hpp' | xargs clang-format --dry-run --Werror

jobs=$(nproc)
run_build() {
    local name=$1
    shift
    echo "== $name build"
    cmake -S . -B "build/$name" -DJSONVALUE_WERROR=ON "$@" >/dev/null
    cmake --build "build/$name" -j "$jobs"
    ctest --test-dir "build/$name" --output-on-failure -j "$jobs"
}

run_build sanitize -DCMAKE_BUILD_TYPE=Debug -DJSONVALUE_SANITIZE=ON
run_build release -DCMAKE_BUILD_TYPE=Release -DCMAKE_EXPORT_COMPILE_COMMANDS=ON

echo "== clang-tidy"
scripts/tidy.sh build/release
