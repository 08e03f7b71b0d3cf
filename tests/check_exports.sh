#!/usr/bin/env bash
# Lists the dynamic symbols a library defines that fall outside the names it may export.
# Usage: check_exports.sh LIBRARY ALLOWED_REGEX (matched against the mangled names).
set -euo pipefail
library=$1
allowed=$2
stray=$(nm -D --defined-only "$library" | awk '{print $3}' | grep -v -E "$allowed" || true)
if [ -n "$stray" ]; then
    echo "symbols exported outside the allowed names:"
    echo "$stray" | c++filt
    exit 1
fi
echo "all exported symbols of $(basename "$library") are allowed"
