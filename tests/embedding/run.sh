#!/usr/bin/env bash
# Builds a host project that takes jsonvalue's source tree in, once with add_subdirectory
# (jsonvalue shared, its default) and once with FetchContent (static, as the host asks), in a
# configuration where looking for CLI11, GoogleTest, Google Benchmark or Doxygen fails: an
# embedded jsonvalue needs none of them. Runs each host's program, checks that it needs
# libjsonvalue.so at run time when jsonvalue was built shared and no library of jsonvalue's when
# static, and installs each host: its program must be all that lands in the prefix.
# Usage: run.sh SOURCE_DIR EMBEDDING_DIR
set -euo pipefail
source_dir=$1
embedding_dir=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# Required and disabled at once, a package stops the configuration at any find_package call
# for it, an optional one too.
refused=()
for package in CLI11 GTest benchmark Doxygen; do
    refused+=("-DCMAKE_DISABLE_FIND_PACKAGE_$package=ON" "-DCMAKE_REQUIRE_FIND_PACKAGE_$package=ON")
done

# embed WAY SHARED_LIBRARIES [CMAKE_ARGS...]: the host built with jsonvalue taken in by WAY;
# SHARED_LIBRARIES is how many shared libraries of jsonvalue's its program needs (1 or 0)
embed() {
    local way=$1 shared=$2 build=$work/$1
    shift 2
    cmake -S "$embedding_dir" -B "$build" -DJSONVALUE_SOURCE_DIR="$source_dir" \
        -DJSONVALUE_EMBED="$way" "${refused[@]}" --no-warn-unused-cli "$@" >/dev/null
    cmake --build "$build" --parallel 2 >/dev/null
    "$build/jsonvalue_host"
    local needed
    needed=$(readelf -d "$build/jsonvalue_host" | grep -c 'NEEDED.*\[libjsonvalue' || true)
    if [ "$needed" != "$shared" ]; then
        echo "$way: the host's program needs $needed shared libraries of jsonvalue's, not $shared"
        exit 1
    fi
    cmake --install "$build" --prefix "$work/$way-prefix" >/dev/null
    local installed
    installed=$(cd "$work/$way-prefix" && find . ! -type d)
    if [ "$installed" != ./bin/jsonvalue_host ]; then
        printf '%s: the host installed more than its program:\n%s\n' "$way" "$installed"
        exit 1
    fi
    echo "$way: built without CLI11, GoogleTest, Google Benchmark and Doxygen; installs only the host's program"
}

embed add_subdirectory 1
embed FetchContent 0 -DBUILD_SHARED_LIBS=OFF
