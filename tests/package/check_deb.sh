#!/usr/bin/env bash
# Builds the Debian package from a Release build tree, installs it with apt-get (which
# resolves its dependencies), builds and runs the consumer as C++20 against the system
# installation with find_package and with pkg-config, then removes the package again.
# Usage: check_deb.sh BUILD_DIR CONSUMER_DIR
set -euo pipefail
build_dir=$(cd "$1" && pwd)
consumer_dir=$(cd "$2" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"; apt-get remove -y -qq jsonvalue >/dev/null 2>&1 || true' EXIT

(cd "$build_dir" && cpack -G DEB >/dev/null)
deb=$(ls "$build_dir"/jsonvalue_*.deb)
echo "package: $(basename "$deb")"
dpkg-deb --field "$deb" Depends
DEBIAN_FRONTEND=noninteractive apt-get install -y -qq "$deb" >/dev/null

cmake -S "$consumer_dir" -B "$work/cmake-build" >/dev/null
cmake --build "$work/cmake-build" >/dev/null
"$work/cmake-build/consumer"
# shellcheck disable=SC2046 # the flags are meant to split
g++ -std=c++20 -o "$work/pkg-config-consumer" "$consumer_dir/main.cpp" \
    $(pkg-config --cflags --libs jsonvalue)
"$work/pkg-config-consumer"
jsonfmt --version
