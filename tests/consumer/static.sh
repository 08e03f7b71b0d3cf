#!/usr/bin/env bash
# Builds the library and its companions static from the source tree (Release, nothing else),
# installs them into a fresh prefix, which must then hold their three archives and no shared
# library, and builds and runs the consumer programs against it (consume.sh).
# Usage: static.sh SOURCE_DIR CONSUMER_DIR
set -euo pipefail
source_dir=$1
consumer_dir=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

cmake -S "$source_dir" -B "$work/build" -DCMAKE_BUILD_TYPE=Release -DBUILD_SHARED_LIBS=OFF \
    -DJSONVALUE_BUILD_TESTS=OFF -DJSONVALUE_BUILD_EXAMPLES=OFF -DJSONVALUE_BUILD_TOOLS=OFF \
    -DJSONVALUE_BUILD_DOCS=OFF >/dev/null
cmake --build "$work/build" --parallel 2 >/dev/null
cmake --install "$work/build" --prefix "$work/prefix" >/dev/null
libraries=$(cd "$work/prefix" && find . -name 'libjsonvalue*' -printf '%f\n' | sort | tr '\n' ' ')
if [ "$libraries" != "libjsonvalue.a libjsonvalue_number_text.a libjsonvalue_text_encoding.a " ]; then
    echo "the static build installed these libraries: $libraries"
    exit 1
fi
"$(dirname "$0")/consume.sh" "$work/prefix" "$consumer_dir" static
