# shellcheck shell=bash
# Sourced by jsonfmt's shell tests: the cases' count and the checks they share. The sourcing
# script sets $jsonfmt (the program), $work (its scratch directory) and, for check_agrees,
# $conformance (the parsing test suite).
passed=0
failures=0

pass() { echo "ok   $1"; passed=$((passed + 1)); }
fail() { echo "FAIL $1"; failures=$((failures + 1)); }
# check NAME COMMAND...: a case that passes when COMMAND succeeds
check() {
    local name=$1
    shift
    if "$@"; then pass "$name"; else fail "$name"; fi
}
# outcome NAME STATUS STDOUT STDERR GOT: the run that just wrote $work/out and $work/err and
# exited with GOT had that status, standard output and standard error
outcome() {
    local name=$1 status=$2 out=$3 err=$4 got=$5
    if [ "$got" != "$status" ] || [ "$(cat "$work/out")" != "$out" ] || [ "$(cat "$work/err")" != "$err" ]; then
        fail "$name: status $got"
        echo "--- stdout:"; cat "$work/out"; echo "--- stderr:"; cat "$work/err"
    else
        pass "$name"
    fi
}
# check_agrees FLAGS...: with each set of flags, --check over the conformance suite gives every
# document the verdict and message of the run it stands for, and writes nothing else
check_agrees() {
    local flags run_status check_status
    for flags in "$@"; do
        # shellcheck disable=SC2086 # each set of flags is split into its words
        "$jsonfmt" $flags "$conformance"/* >/dev/null 2>"$work/run.err"
        run_status=$?
        # shellcheck disable=SC2086
        "$jsonfmt" --check $flags "$conformance"/* >"$work/check.out" 2>"$work/check.err"
        check_status=$?
        check "check-agrees: ${flags:-no flags}" bash -c '[ "$0" = "$1" ] && cmp -s "$2" "$3" && [ ! -s "$4" ]' \
            "$run_status" "$check_status" "$work/run.err" "$work/check.err" "$work/check.out"
    done
}
# finish: the count of the cases, and the script's status
finish() {
    echo "$passed passed, $failures failed"
    [ "$failures" -eq 0 ]
}
