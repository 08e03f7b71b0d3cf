#!/usr/bin/env bash
# Installs the Debian packages that scripts/format-sample.sh and scripts/test.sh need, on top
# of a minimal Debian 12 (what debootstrap --variant=minbase installs), and the de_DE.UTF-8
# locale that the locale tests use. Further packages may be named as arguments. Does nothing
# when everything is already there. Run as root.
set -euo pipefail

packages=(
    g++ binutils cmake make libboost1.81-dev # the library, jsonfmt; nm and c++filt for tests
    libdragonbox-dev                         # the number-text companion's shortest digits
    libcli11-dev man-db                      # jsonfmt's options; its man page checked
    libgtest-dev locales                     # the unit tests; locale-gen for de_DE.UTF-8
    git clang-format clang-tidy              # formatting check over `git ls-files`, clang-tidy
    doxygen valgrind                         # API reference; memcheck of the unit tests
    clang-14 libclang-rt-14-dev              # the fuzzers (libFuzzer, sanitizer runtimes)
    file dpkg-dev pkg-config                 # cpack -G DEB (file, dpkg-shlibdeps); the consumers
    time                                     # jsonfmt's shell test measures resident memory
    "$@")

missing=()
for package in "${packages[@]}"; do
    dpkg-query -W -f='${Status}' "$package" 2>/dev/null | grep -q 'install ok installed' ||
        missing+=("$package")
done
if ((${#missing[@]})); then
    export DEBIAN_FRONTEND=noninteractive
    apt-get update -qq
    apt-get install -y -qq --no-install-recommends "${missing[@]}"
fi

if ! locale -a 2>/dev/null | grep -qi '^de_DE\.utf-\?8$'; then
    sed -i 's/^# *\(de_DE.UTF-8 UTF-8\)/\1/' /etc/locale.gen
    grep -q '^de_DE.UTF-8 UTF-8' /etc/locale.gen || echo 'de_DE.UTF-8 UTF-8' >>/etc/locale.gen
    locale-gen >/dev/null
fi
