#!/usr/bin/env bash
# Checks jsonfmt's output, its error messages, its exit codes and the files it writes.
# Usage: jsonfmt_test.sh JSONFMT [sanitized|plain]
# "sanitized" skips the bounded-memory case: AddressSanitizer reserves terabytes of address
# space, which no `ulimit -v` admits.
set -uo pipefail
jsonfmt=$1
mode=${2:-plain}
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'chmod -R u+w "$work"; rm -rf "$work"' EXIT
# The read-only directory case runs as another user, who must reach the files.
chmod 755 "$work"
passed=0
failures=0

pass() { echo "ok   $1"; passed=$((passed + 1)); }
fail() { echo "FAIL $1"; failures=$((failures + 1)); }
skip() { echo "skip $1"; }
# check NAME COMMAND...: a case that passes when COMMAND succeeds
check() {
    local name=$1
    shift
    if "$@"; then pass "$name"; else fail "$name"; fi
}

# expect NAME STATUS STDOUT STDERR [PREFIX...] -- ARGS...: runs PREFIX jsonfmt ARGS (stdin from
# $work/stdin) and compares its status, its standard output and its standard error
expect() {
    local name=$1 status=$2 out=$3 err=$4 prefix=()
    shift 4
    while [ "$1" != -- ]; do prefix+=("$1"); shift; done
    shift
    "${prefix[@]}" "$jsonfmt" "$@" <"$work/stdin" >"$work/out" 2>"$work/err"
    local got=$?
    if [ "$got" != "$status" ] || [ "$(cat "$work/out")" != "$out" ] || [ "$(cat "$work/err")" != "$err" ]; then
        fail "$name: status $got"
        echo "--- stdout:"; cat "$work/out"; echo "--- stderr:"; cat "$work/err"
    else
        pass "$name"
    fi
}

# to_full WHAT ARGS...: jsonfmt ARGS writing to a full device must say so and exit 2
to_full() {
    "$jsonfmt" "$@" >/dev/full 2>"$work/err"
    local got=$?
    [ "$got" = 2 ] && [ "$(cat "$work/err")" = "jsonfmt: writing standard output: No space left on device" ]
}

# same_listing DIR LISTING: DIR holds exactly the names in LISTING (no temporary file left)
same_listing() { [ "$(ls -A "$1")" = "$2" ]; }

printf '{"b": [1, {}], "a": "x/y"}' >"$work/doc.json"
printf '{"a": 1}' >"$work/other.json"
printf '{\n  "a": [1,\n\t2 3]\n}' >"$work/bad.json"
printf '[[[1]]]' >"$work/deep.json"
printf '[1]' >"$work/stdin"
printf '{"a": 1}\n\n  \t\n[1, 2]\n{"b": {"c": 3}}\n"last"' >"$work/good.jsonl"
printf '[1]\n  [true,   x]\n{"b": 2}\n' >"$work/bad.jsonl"
printf '{"b": 1}\n{"a": 2}\n{"b": [2]}\n' >"$work/pointer.jsonl"
compact='{"a":"x\/y","b":[1,{}]}'
pretty=$'{\n    "a":"x\\/y",\n    "b":[\n        1,\n        {        }\n    ]\n}'
bad_error="$work/bad.json:3:4: error: No trailing ']' while parsing value of type array (possible missing comma?)
	2 3]
	  ^"
no_digit="error: Expected leading digit while parsing value of type number (no JSON value starts here)"

expect pretty 0 "$pretty" "" -- "$work/doc.json"
expect compact 0 "$compact" "" -- -c "$work/doc.json"
expect compact-long 0 "$compact" "" -- --compact "$work/doc.json"
expect stdin 0 $'[\n    1\n]' "" --
expect stdin-dash 0 '[1]' "" -- -c -
expect check-valid 0 "" "" -- --check "$work/doc.json"
expect check-invalid 1 "" "$bad_error" -- --check "$work/bad.json"
expect invalid 1 "" "$bad_error" -- "$work/bad.json"
expect valid-and-invalid 1 "$compact" "$bad_error" -- -c "$work/doc.json" "$work/bad.json"
expect too-deep 1 "" "$work/deep.json:1:3: error: No trailing ']' while parsing value of type array (possible missing comma?) (the document is nested deeper than the maximum depth)
[[[1]]]
  ^" -- --max-depth 2 "$work/deep.json"
expect deep-enough 0 '[[[1]]]' "" -- -c --max-depth 3 "$work/deep.json"
expect missing-file 2 "" "jsonfmt: $work/none.json: No such file or directory" -- "$work/none.json"
expect bad-depth 2 "" "jsonfmt: --max-depth: needs a positive number (try --help)" -- --max-depth 0
expect bad-depth-text 2 "" "jsonfmt: --max-depth: needs a positive number (try --help)" -- --max-depth x
expect unknown-option 2 "" "jsonfmt: The following argument was not expected: --pretty (try --help)" -- --pretty
expect version 0 "jsonfmt 0.1.0" "" -- --version

# --pointer
expect pointer-compact 0 '[1,{}]' "" -- -c -p /b "$work/doc.json"
expect pointer-pretty 0 $'[\n    1,\n    {    }\n]' "" -- --pointer /b "$work/doc.json"
expect pointer-empty 0 "$compact" "" -- -c -p "" "$work/doc.json"
expect pointer-missing 1 '[1,{}]' "$work/other.json: no value at /b: /b: no member \"b\"" -- -c -p /b "$work/other.json" "$work/doc.json"
expect pointer-malformed 2 "" "jsonfmt: --pointer: JSON Pointer \"b\" does not start with '/' (try --help)" -- -p b "$work/doc.json"
expect pointer-bad-escape 2 "" "jsonfmt: --pointer: JSON Pointer \"/a~2\" has a '~' not followed by '0' or '1' (try --help)" -- -p /a~2 "$work/doc.json"

# --lines: blank lines skipped, the last line has no newline; a bad line gets its own column
expect lines 0 $'{"a":1}\n[1,2]\n{"b":{"c":3}}\n"last"' "" -- --lines "$work/good.jsonl"
expect lines-bad 1 $'[1]\n{"b":2}' "$work/bad.jsonl:2:12: $no_digit
  [true,   x]
           ^" -- -l "$work/bad.jsonl"
expect lines-check 1 "" "$work/bad.jsonl:2:12: $no_digit
  [true,   x]
           ^" -- -l --check "$work/bad.jsonl"
expect lines-pointer 1 $'1\n[2]' "$work/pointer.jsonl:2: no value at /b: /b: no member \"b\"" -- -l -p /b "$work/pointer.jsonl"

# --output
expect output 0 "" "" -- -o "$work/written.json" "$work/doc.json"
check output-content [ "$(cat "$work/written.json")" = "$pretty" ]
expect output-long 0 "" "" -- -c --output "$work/written.json" "$work/doc.json"
check output-long-content [ "$(cat "$work/written.json")" = "$compact" ]
expect output-unwritable 2 "" "jsonfmt: $work/none/out.json: No such file or directory" -- -o "$work/none/out.json" "$work/doc.json"
expect output-full 2 "" "jsonfmt: writing /dev/full: No space left on device" -- -o /dev/full "$work/doc.json"
expect output-no-file 2 "" "jsonfmt: --output: 1 required FILE missing (try --help)" -- -o
expect output-is-input 2 "" "jsonfmt: --output $work/./doc.json is also an input: writing it would destroy it (use --in-place) (try --help)" -- -o "$work/./doc.json" "$work/doc.json"
check output-is-input-kept [ "$(cat "$work/doc.json")" = '{"b": [1, {}], "a": "x/y"}' ]

# --in-place: the rewrite keeps the permission bits; a broken file stays byte for byte; no
# temporary file (.NAME.jsonfmt-XXXXXX) is left beside either
mkdir "$work/edit"
cp "$work/doc.json" "$work/edit/doc.json"
chmod 640 "$work/edit/doc.json"
cp "$work/bad.json" "$work/edit/bad.json"
listing=$(ls -A "$work/edit")
expect in-place 0 "" "" -- -c -i "$work/edit/doc.json"
check in-place-content [ "$(cat "$work/edit/doc.json")" = "$compact" ]
check in-place-mode [ "$(stat -c %a "$work/edit/doc.json")" = 640 ]
ln -s doc.json "$work/edit/link.json"
expect in-place-link 0 "" "" -- -i "$work/edit/link.json"
check in-place-link-kept [ -L "$work/edit/link.json" ]
check in-place-link-target [ "$(cat "$work/edit/doc.json")" = "$pretty" ]
rm "$work/edit/link.json"
expect in-place-broken 1 "" "${bad_error//"$work/"/"$work/edit/"}" -- --in-place "$work/edit/bad.json"
check in-place-broken-unchanged cmp -s "$work/bad.json" "$work/edit/bad.json"
check in-place-nothing-left same_listing "$work/edit" "$listing"
expect in-place-stdin 2 "" "jsonfmt: --in-place needs files: it cannot rewrite standard input (try --help)" -- -i
expect in-place-dash 2 "" "jsonfmt: --in-place needs files: it cannot rewrite standard input (try --help)" -- -i -
expect in-place-output 2 "" "jsonfmt: --in-place writes back into each FILE: it does not go with --output (try --help)" -- -i -o "$work/out.json" "$work/doc.json"
expect in-place-pointer 2 "" "jsonfmt: --in-place rewrites whole files: it goes with neither --check nor --pointer (try --help)" -- -i -p /b "$work/doc.json"

# --in-place in a read-only directory; root ignores directory permissions, so as root this
# runs as nobody
mkdir "$work/locked"
cp "$work/doc.json" "$work/locked/doc.json"
chmod 644 "$work/locked/doc.json"
chmod 555 "$work/locked"
unprivileged=()
if [ "$(id -u)" = 0 ]; then unprivileged=(setpriv --reuid=65534 --regid=65534 --clear-groups); fi
if [ "${#unprivileged[@]}" -ne 0 ] && ! command -v setpriv >/dev/null; then
    skip "in-place-read-only-dir: running as root without setpriv"
elif ! "${unprivileged[@]}" test -r "$work/locked/doc.json"; then
    skip "in-place-read-only-dir: $work is out of the unprivileged user's reach"
else
    expect in-place-read-only-dir 2 "" "jsonfmt: $work/locked/doc.json: creating a temporary file: Permission denied" "${unprivileged[@]}" -- -i "$work/locked/doc.json"
    check in-place-read-only-unchanged cmp -s "$work/doc.json" "$work/locked/doc.json"
    check in-place-read-only-nothing-left same_listing "$work/locked" doc.json
fi

# A full device: the failed write is an error, for documents and for --help and --version alike
check stdout-full to_full "$work/doc.json"
check help-full to_full --help
check version-full to_full --version

# A NUL byte: the context line goes on past it
printf '[1,\0 2 x]\n' >"$work/nul.json"
{ printf '%s:1:4: %s\n' "$work/nul.json" "$no_digit"; printf '[1,\0 2 x]\n   ^\n'; } >"$work/nul.expected"
"$jsonfmt" "$work/nul.json" >"$work/out" 2>"$work/err"
check nul-status [ $? = 1 ]
check nul-context cmp "$work/nul.expected" "$work/err"

# Bounded memory: a 1 MB document nested 500 deep pretty-prints to 1.3 GB within 300 MB of
# address space, the output streaming out as it is made
if [ "$mode" = sanitized ]; then
    skip "bounded-memory: AddressSanitizer's reservations exceed any ulimit -v"
else
    { head -c 500 /dev/zero | tr '\0' '['; yes '[1,2],' | head -n 166000 | tr -d '\n' | head -c -1
      head -c 500 /dev/zero | tr '\0' ']'; } >"$work/big.json"
    bytes=$(ulimit -v 300000 && "$jsonfmt" "$work/big.json" | wc -c)
    check bounded-memory-status [ $? = 0 ]
    check bounded-memory-bytes [ "$bytes" = 1331987999 ]
fi

# --help names every option
for option in -h,--help -c,--compact --check -l,--lines '-p,--pointer PTR' '-o,--output FILE' \
    -i,--in-place '--max-depth N' --version 'Usage: jsonfmt'; do
    check "help: $option" grep -qF -- "$option" <("$jsonfmt" --help)
done

# The manual page renders without warnings
if command -v man >/dev/null; then
    check man-page [ -z "$(man --warnings -l "$here/../tools/jsonfmt.1" 2>&1 >/dev/null)" ]
else
    skip "man-page: man is not installed"
fi

echo "$passed passed, $failures failed"
[ "$failures" -eq 0 ]
