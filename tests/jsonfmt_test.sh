#!/usr/bin/env bash
# Checks jsonfmt's output, its error messages and its exit codes.
# Usage: jsonfmt_test.sh JSONFMT
set -uo pipefail
jsonfmt=$1
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
failures=0

# expect NAME STATUS STDOUT STDERR -- ARGS...: runs jsonfmt with ARGS (stdin from $work/stdin)
expect() {
    local name=$1 status=$2 out=$3 err=$4
    shift 5
    "$jsonfmt" "$@" <"$work/stdin" >"$work/out" 2>"$work/err"
    local got=$?
    if [ "$got" != "$status" ] || [ "$(cat "$work/out")" != "$out" ] || [ "$(cat "$work/err")" != "$err" ]; then
        echo "FAIL $name: status $got"
        echo "--- stdout:"; cat "$work/out"; echo "--- stderr:"; cat "$work/err"
        failures=$((failures + 1))
    else
        echo "ok   $name"
    fi
}

printf '{"b": [1, {}], "a": "x/y"}' >"$work/doc.json"
printf '{\n  "a": [1,\n\t2 3]\n}' >"$work/bad.json"
printf '[[[1]]]' >"$work/deep.json"
printf '[1]' >"$work/stdin"
pretty=$'{\n    "a":"x\\/y",\n    "b":[\n        1,\n        {        }\n    ]\n}'

expect pretty 0 "$pretty" "" -- "$work/doc.json"
expect compact 0 '{"a":"x\/y","b":[1,{}]}' "" -- -c "$work/doc.json"
expect compact-long 0 '{"a":"x\/y","b":[1,{}]}' "" -- --compact "$work/doc.json"
expect stdin 0 $'[\n    1\n]' "" --
expect stdin-dash 0 '[1]' "" -- -c -
expect check-valid 0 "" "" -- --check "$work/doc.json"
expect invalid 1 "" "$work/bad.json:3:4: error: No trailing ']' while parsing value of type array (possible missing comma?)
	2 3]
	  ^" -- "$work/bad.json"
expect valid-and-invalid 1 '{"a":"x\/y","b":[1,{}]}' "$work/bad.json:3:4: error: No trailing ']' while parsing value of type array (possible missing comma?)
	2 3]
	  ^" -- -c "$work/doc.json" "$work/bad.json"
expect too-deep 1 "" "$work/deep.json:1:3: error: No trailing ']' while parsing value of type array (possible missing comma?) (the document is nested deeper than the maximum depth)
[[[1]]]
  ^" -- --max-depth 2 "$work/deep.json"
expect deep-enough 0 '[[[1]]]' "" -- -c --max-depth 3 "$work/deep.json"
expect missing-file 2 "" "jsonfmt: $work/none.json: No such file or directory" -- "$work/none.json"
expect bad-depth 2 "" "jsonfmt: --max-depth needs a positive number" -- --max-depth 0
expect unknown-option 2 "" "jsonfmt: unknown option '--pretty' (try --help)" -- --pretty
expect version 0 "jsonfmt 0.1.0" "" -- --version

if "$jsonfmt" --help | grep -q '^Usage: jsonfmt'; then echo "ok   help"; else echo "FAIL help"; failures=$((failures + 1)); fi

echo "$((15 - failures)) passed, $failures failed"
[ "$failures" -eq 0 ]
