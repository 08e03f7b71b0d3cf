# shellcheck shell=bash
# Sourced by the shell tests. missing WHAT: a check left out for want of WHAT, which only
# scripts/install-deps.sh sets up. Says so and how to get it, and returns 0 (skipped); returns 1
# (failed) when JSONVALUE_REQUIRE_SETUP=1, which scripts/test.sh sets after the set-up.
missing() {
    if [ "${JSONVALUE_REQUIRE_SETUP:-}" = 1 ]; then
        echo "FAIL $1 is missing, and JSONVALUE_REQUIRE_SETUP=1 requires it (scripts/install-deps.sh)"
        return 1
    fi
    echo "skip $1 is missing: scripts/install-deps.sh (as root) installs it"
}
