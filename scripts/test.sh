#!/usr/bin/env bash
# Builds and runs every test twice: with AddressSanitizer and UndefinedBehaviorSanitizer, and
# as a Release build with warnings as errors. Also checks formatting and clang-tidy, runs the
# thread test under ThreadSanitizer, the Release unit tests under valgrind, and each fuzzer
# for a minute.
set -euo pipefail
root=$(cd "$(dirname "$0")/.." && pwd)
cd "$root"

scripts/install-deps.sh
# Everything the set-up installs is there: a test that needs some of it fails, never skips.
export JSONVALUE_REQUIRE_SETUP=1

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

echo "== API reference (any Doxygen warning fails)"
cmake --build build/release --target docs

echo "== ThreadSanitizer"
cmake -S . -B build/tsan -DCMAKE_BUILD_TYPE=RelWithDebInfo -DJSONVALUE_TSAN=ON \
    -DJSONVALUE_BUILD_EXAMPLES=OFF >/dev/null
cmake --build build/tsan -j "$jobs" --target threads_test
build/tsan/tests/threads_test --gtest_brief=1

# The two 100,000-level tests write ~40 GB of pretty indentation each: too slow under
# valgrind, and covered by the runs above; so are the number-text tables, which run on a
# sample of 100,000 values each there. The allocation tests replace operator new
# themselves: valgrind is told to leave those replacements alone (it still sees the mallocs).
echo "== valgrind"
find build/release/tests -maxdepth 1 -type f -executable -name '*_test' | sort |
    JSONVALUE_NUMBER_TEXT_SAMPLES=100000 xargs -P "$jobs" -I{} sh -c 'valgrind --quiet \
        --error-exitcode=1 --leak-check=full --soname-synonyms=somalloc=nouserintercepts \
        --errors-for-leak-kinds=definite,indirect,possible "$1" --gtest_brief=1 \
        --gtest_filter=-DeepNesting.*HundredThousandDeep >"$1.valgrind" 2>&1 ||
        { cat "$1.valgrind"; echo "valgrind: $1 failed"; exit 255; }' _ {}
echo "valgrind: no error and no leak"

echo "== Debian package"
tests/package/check_deb.sh build/release tests/consumer

echo "== fuzzing"
scripts/fuzz.sh 60
