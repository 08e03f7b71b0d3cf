#!/usr/bin/env bash
# Checks what jsonfmt does for a person at a terminal: its colours (on a real terminal, which
# script(1) makes), --raw, the hint at --lines, and the context line shown around a failure.
# Usage: jsonfmt_terminal_test.sh JSONFMT CONFORMANCE_DIR
# CONFORMANCE_DIR holds the parsing test suite.
set -uo pipefail
jsonfmt=$1
conformance=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
source "$(dirname "$0")/support/cases.sh"
# same NAME EXPECTED GOT: the two files hold the same bytes
same() {
    if cmp -s "$2" "$3"; then
        pass "$1"
    else
        fail "$1"
        echo "--- expected:"; od -c "$2" | head -20; echo "--- got:"; od -c "$3" | head -20
    fi
}

# on_terminal OUT [VAR=VALUE...] -- ARGS...: jsonfmt ARGS with its standard output and error
# on a terminal, NO_COLOR unset unless set here; what the terminal showed goes to OUT, less the
# carriage return it puts before each newline. Returns jsonfmt's status.
on_terminal() {
    local out=$1 command=(env -u NO_COLOR)
    shift
    while [ "$1" != -- ]; do command+=("$1"); shift; done
    shift
    script -qfec "$(printf '%q ' "${command[@]}" "$jsonfmt" "$@")" /dev/null </dev/null >"$out.raw"
    local status=$?
    tr -d '\r' <"$out.raw" >"$out"
    return "$status"
}

# The colours: each token in its colour and then the reset; adjacent punctuation shares one.
esc=$'\033'
paint() { printf '%s[%sm%s%s[0m' "$esc" "$1" "$2" "$esc"; }
punct() { paint '1;39' "$1"; }
name() { paint '34;1' "\"$1\""; }
string() { paint '0;32' "$1"; }
number() { paint '0;39' "$1"; }
boolean() { paint '0;39' "$1"; }
null() { paint '1;30' null; }
uncolored() { sed "s/$esc\[[0-9;]*m//g" "$1"; }

# A document with every kind of token; a string that ends in an escaped backslash; a string
# after a comma in an array that follows an object, and names after nested containers close
printf '%s' '{"s": "x\"y\\", "list": [{"k": null}, "v", 1.5e-3, -0], "t": true, "f": false, "o": {}, "a": []}' >"$work/doc.json"
{
    punct '{'; name s; punct ':'; string '"x\"y\\"'; punct ','; name list; punct ':[{'; name k
    punct ':'; null; punct '},'; string '"v"'; punct ','; number 1.5e-3; punct ','; number -0
    punct '],'; name t; punct ':'; boolean true; punct ','; name f; punct ':'; boolean false
    punct ','; name o; punct ':{},'; name a; punct ':[]}'; echo
} >"$work/compact.expected"
{
    punct '{'; echo
    printf '  '; name s; punct ':'; printf ' '; string '"x\"y\\"'; punct ','; echo
    printf '  '; name list; punct ':'; printf ' '; punct '['; echo
    printf '    '; punct '{'; echo
    printf '      '; name k; punct ':'; printf ' '; null; echo
    printf '    '; punct '},'; echo
    printf '    '; string '"v"'; punct ','; echo
    printf '    '; number 1.5e-3; punct ','; echo
    printf '    '; number -0; echo
    printf '  '; punct '],'; echo
    printf '  '; name t; punct ':'; printf ' '; boolean true; punct ','; echo
    printf '  '; name f; punct ':'; printf ' '; boolean false; punct ','; echo
    printf '  '; name o; punct ':'; printf ' '; punct '{},'; echo
    printf '  '; name a; punct ':'; printf ' '; punct '[]'; echo
    punct '}'; echo
} >"$work/pretty.expected"
"$jsonfmt" "$work/doc.json" >"$work/plain.expected"

# Colour by default on a terminal, unless NO_COLOR is set to anything but empty or --color
# says never; into a pipe only with --color=always
on_terminal "$work/out" -- "$work/doc.json"
same color-terminal-pretty "$work/pretty.expected" "$work/out"
on_terminal "$work/out" -- -c "$work/doc.json"
same color-terminal-compact "$work/compact.expected" "$work/out"
on_terminal "$work/out" NO_COLOR=1 -- "$work/doc.json"
same color-no-color "$work/plain.expected" "$work/out"
on_terminal "$work/out" NO_COLOR= -- -c "$work/doc.json"
same color-no-color-empty "$work/compact.expected" "$work/out"
on_terminal "$work/out" -- --color=never "$work/doc.json"
same color-never-terminal "$work/plain.expected" "$work/out"
env -u NO_COLOR "$jsonfmt" "$work/doc.json" >"$work/out"
same color-auto-pipe "$work/plain.expected" "$work/out"
NO_COLOR=1 "$jsonfmt" -c --color=always "$work/doc.json" >"$work/out"
same color-always-pipe "$work/compact.expected" "$work/out"
# Files are written without colour, even from a terminal
on_terminal "$work/out" -- -o "$work/written.json" "$work/doc.json"
check color-output-file bash -c '[ ! -s "$0" ] && cmp -s "$1" "$2"' "$work/out" "$work/plain.expected" "$work/written.json"
cp "$work/doc.json" "$work/in-place.json"
on_terminal "$work/out" -- -i "$work/in-place.json"
check color-in-place bash -c '[ ! -s "$0" ] && cmp -s "$1" "$2"' "$work/out" "$work/plain.expected" "$work/in-place.json"

# Messages are never coloured: on one terminal, each comes plain between the lines around it
printf '{"a": 1}\n[true, x]\n"z"\n' >"$work/lines.jsonl"
{
    punct '{'; name a; punct ':'; number 1; punct '}'; echo
    printf '%s:2:8: error: %s\n[true, x]\n       ^\n' "$work/lines.jsonl" \
        "Expected leading digit while parsing value of type number (no JSON value starts here)"
    string '"z"'; echo
} >"$work/lines.expected"
on_terminal "$work/out" -- -l "$work/lines.jsonl"
same color-messages-plain "$work/lines.expected" "$work/out"

# A document that fails is taken back with its colours, though the writer handed part of it on
# (more than its 16 KiB buffer): the next one is coloured from its start
long=$(head -c 20000 /dev/zero | tr '\0' a)
printf '{"k": "v"}\n["%s", x]\n{"k": 2}\n' "$long" >"$work/taken-back.jsonl"
{ punct '{'; name k; punct ':'; string '"v"'; punct '}'; echo; punct '{'; name k; punct ':'; number 2; punct '}'; echo; } >"$work/taken-back.expected"
"$jsonfmt" --color=always -l "$work/taken-back.jsonl" >"$work/out" 2>/dev/null
same color-taken-back "$work/taken-back.expected" "$work/out"
# One longer than the output buffer went out in part: the colour ends where its text stops
printf '["%s", x]' "$(head -c 1100000 /dev/zero | tr '\0' a)" >"$work/cut.json"
"$jsonfmt" --color=always "$work/cut.json" >"$work/out" 2>/dev/null
check color-cut-ends-colour [ "$(tail -c 5 "$work/out" | od -An -c | tr -s ' ')" = " 033 [ 0 m \n" ]

# Every layout, mode and filter writes the same text coloured as plain
printf '{"list": [1]}\n"v"\n' >"$work/two.jsonl"
printf '{"list": null, "e": "\xc3\xa9/"}' >"$work/merge.json"
printf '[{"op": "add", "path": "/n", "value": {"m": [null]}}]' >"$work/patch.json"
printf '{"s": 1, "t": [true]}' >"$work/target.json"
for flags in "--tab" "--indent 0" "--library-layout" "--ascii" "--sort-keys" "-p /list" \
    "--lines $work/two.jsonl" "--merge-patch $work/merge.json" "--patch $work/patch.json" \
    "--diff $work/doc.json $work/target.json" "--merge-diff $work/doc.json $work/target.json"; do
    file=$work/doc.json
    [[ "$flags" = --lines* || "$flags" = --*diff* ]] && file=
    "$jsonfmt" $flags $file >"$work/plain" 2>&1
    "$jsonfmt" --color=always $flags $file >"$work/colored" 2>&1
    uncolored "$work/colored" >"$work/uncolored"
    check "color-same-text: ${flags//"$work/"/}" bash -c '! cmp -s "$0" "$1" && cmp -s "$0" "$2"' \
        "$work/plain" "$work/colored" "$work/uncolored"
done

# What would write a file that is not JSON, or an escape into a raw string, is refused
for usage in "--color=always -i $work/doc.json|--color=always writes a terminal's colour codes: it cannot rewrite a JSON file (--in-place)" \
    "--color=sometimes|--color: sometimes not in {auto,always,never}" \
    "-r -i $work/doc.json|--raw writes a string as text that is not JSON: it cannot rewrite a JSON file (--in-place)" \
    "-r --ascii|--ascii excludes --raw"; do
    read -ra arguments <<<"${usage%%|*}"
    "$jsonfmt" "${arguments[@]}" </dev/null >"$work/out" 2>"$work/err"
    status=$?
    check "usage: ${arguments[*]//"$work/"/}" bash -c '[ "$0" = 2 ] && [ ! -s "$1" ] && [ "$(cat "$2")" = "$3" ]' \
        "$status" "$work/out" "$work/err" "jsonfmt: ${usage#*|} (try --help)"
done

# --raw: a string is written as its text (any bytes it holds included), every other value as
# JSON (raw NAME STATUS INPUT OUTPUT ARGS...: INPUT and OUTPUT are printf formats)
raw() {
    printf "$3" >"$work/raw.json"
    printf "$4" >"$work/raw.expected"
    "$jsonfmt" -r "${@:5}" "$work/raw.json" >"$work/out" 2>"$work/err"
    local status=$?
    if [ "$status" = "$2" ] && cmp -s "$work/raw.expected" "$work/out"; then
        pass "raw-$1"
    else
        fail "raw-$1: status $status"; od -c "$work/out" | head -5; cat "$work/err"
    fi
}
printf '"z"' >"$work/string-patch.json"
printf '[{"op": "add", "path": "/n", "value": "new\\n"}]' >"$work/add-string.json"
raw escapes 0 '"a\\tb\\u00e9\\\\\\n"' 'a\tb\xc3\xa9\\\n\n'
raw nul 0 '"a\\u0000b"' 'a\0b\n'
raw empty 0 '""' '\n'
raw pointer 0 '{"x": "s/\\"q\\""}' 's/"q"\n' -p /x
raw object 0 '{"x": "s"}' '{"x":"s"}\n' -c
raw pointer-object 0 '{"x": ["s"]}' '[\n  "s"\n]\n' -p /x
raw number 0 '1.50' '1.50\n'
raw lines 0 '"a"\n\n{"b": "c"}\n"d\\ne"\n' 'a\n{"b":"c"}\nd\ne\n' -l
raw not-utf8 0 '"\xff"' '\xff\n' --lossy
raw lone-surrogate 0 '"\\ud800"' '\xef\xbf\xbd\n' --lossy
raw sort-keys 0 '"s"' 's\n' --sort-keys
raw fails-after 1 '"a" x' ''
raw check 0 '"a"' '' --check
raw merge-patch 0 '{"a": 1}' 'z\n' --merge-patch "$work/string-patch.json"
raw patch 0 '{"a": 1}' 'new\n\n' --patch "$work/add-string.json" -p /n
raw colors 0 '"a"\n[1]\n' "a\n$(punct '['; number 1; punct ']')\n" -l --color=always

# --check gives the verdict and message of the same run
check_agrees "--raw" "--raw -l" "--raw -p /0" "--raw --lossy" "--color=always" "--color=always -l"

# A second value that starts a line of its own is a hint at --lines; one on the same line, or
# anything but a value, is not (hint NAME INPUT LINE:COLUMN SHOWN CARET HINT ARGS...)
goes_on="Unexpected end of input (the text goes on after the JSON value)"
try_lines=" (the text looks like JSON Lines: try --lines)"
hint() {
    printf "$2" >"$work/hint.json"
    "$jsonfmt" "${@:7}" "$work/hint.json" >/dev/null 2>"$work/err"
    check "hint-$1" [ "$(cat "$work/err")" = "$work/hint.json:$3: error: $goes_on$6
$4
$5^" ]
}
hint new-line '[1]\n[2]\n' 2:1 '[2]' '' "$try_lines"
hint carriage-return '{"a": 1}\r"b"' 2:1 '"b"' '' "$try_lines"
hint blank-lines '1\n\n \t-2' 3:3 $' \t-2' $' \t' "$try_lines"
hint pointer '{"a": 1}\n{"a": 2}' 2:1 '{"a": 2}' '' "$try_lines" -p /a
hint same-line '[1] 2' 1:5 '[1] 2' '    ' ''
hint not-a-value '[1]\n]' 2:1 ']' '' ''
printf '[1] [2]\n' >"$work/hint.jsonl"
"$jsonfmt" -l "$work/hint.jsonl" 2>"$work/err" >/dev/null
check hint-not-with-lines [ "$(head -n 1 "$work/err")" = "$work/hint.jsonl:1:5: error: $goes_on" ]

# The failing line: up to 60 bytes before the failure and 60 from it on, "..." where it goes
# on beyond them (context NAME TEXT-BEFORE TEXT-FROM SHOWN-BEFORE SHOWN-FROM)
context() {
    printf '[%s%s\n' "$2" "$3" >"$work/context.json"
    "$jsonfmt" "$work/context.json" >/dev/null 2>"$work/err"
    check "context-$1" [ "$(tail -n 2 "$work/err")" = "$4$5
$(printf "%$((${#4}))s^")" ]
}
ones=$(printf '1,%.0s' $(seq 100))
twos=$(printf ', 2%.0s' $(seq 50))
x59=x$(printf 'y%.0s' $(seq 59))
context both-sides "$ones" "x$twos]" "...${ones:140}" "x${twos:0:59}..."
context to-line-end "" "$x59" "[" "$x59"
context past-line-end "" "${x59}z" "[" "$x59..."

# --help names the options
for option in '--color WHEN:{auto,always,never}' -r,--raw; do
    check "help: $option" grep -qF -- "$option" <("$jsonfmt" --help)
done

finish
