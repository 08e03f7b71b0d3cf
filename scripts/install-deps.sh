#!/usr/bin/env bash
# Installs the Debian packages the build and tests need, and the de_DE.UTF-8 locale that the
# locale tests use. Does nothing when everything is already there.
set -euo pipefail

packages=(g++ cmake make pkg-config libboost1.81-dev libgtest-dev clang-format clang-tidy clang-14 libclang-rt-14-dev
    valgrind dpkg-dev doxygen locales "$@")

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
