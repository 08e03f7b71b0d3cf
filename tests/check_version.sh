#!/usr/bin/env bash
# Checks that each place where the version shows says the project's VERSION: installs the build
# tree into a fresh prefix and reads the installed json/version.hpp (its macros, as the compiler
# sees them), the pkg-config file and the CMake package's version file, and with "jsonfmt" also
# `jsonfmt --version` and the installed man page's header.
# Usage: check_version.sh VERSION BUILD_DIR CXX [jsonfmt]
set -euo pipefail
version=$1
build_dir=$2
cxx=$3
tools=${4:-}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix
cmake --install "$build_dir" --prefix "$prefix" >/dev/null
failures=0

# says WHERE FOUND: WHERE says version FOUND, which must be VERSION
says() {
    if [ "$2" = "$version" ]; then
        echo "ok   $1: $2"
    else
        echo "FAIL $1: '$2', not $version"
        failures=$((failures + 1))
    fi
}

header=$(find "$prefix" -path '*/json/version.hpp')
read -r major minor patch text < <(printf '%s\n' '#include <json/version.hpp>' \
    'JSONVALUE_VERSION_MAJOR JSONVALUE_VERSION_MINOR JSONVALUE_VERSION_PATCH JSONVALUE_VERSION_STRING' |
    "$cxx" -E -P -I "$(dirname "$(dirname "$header")")" -x c++ -)
says "json/version.hpp: MAJOR.MINOR.PATCH" "$major.$minor.$patch"
says "json/version.hpp: STRING" "${text//\"/}"

pc=$(find "$prefix" -name jsonvalue.pc)
says jsonvalue.pc "$(sed -n 's/^Version: //p' "$pc")"
# shellcheck disable=SC2016 # a CMake variable, for cmake to expand
printf 'include("%s")\nmessage("${PACKAGE_VERSION}")\n' \
    "$(find "$prefix" -name jsonvalueConfigVersion.cmake)" >"$work/package_version.cmake"
says jsonvalueConfigVersion.cmake "$(cmake -P "$work/package_version.cmake" 2>&1)"

if [ "$tools" = jsonfmt ]; then
    output=$("$prefix/bin/jsonfmt" --version)
    says "jsonfmt --version" "${output#jsonfmt }"
    says "jsonfmt.1 header" "$(sed -n 's/^\.TH .*"jsonvalue \([^"]*\)".*/\1/p' "$(find "$prefix" -name jsonfmt.1)")"
fi
[ "$failures" -eq 0 ]
