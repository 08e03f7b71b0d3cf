#!/usr/bin/env bash
# Checks jsonfmt's output, its error messages, its exit codes and the files it writes, and that
# its man page renders.
# Usage: jsonfmt_test.sh JSONFMT MAN_PAGE sanitized|plain FAILING_READ FEED_IN_PIECES
#        CONFORMANCE_DIR
# "sanitized" skips the cases under ulimit -v: AddressSanitizer reserves terabytes of address
# space, which no `ulimit -v` admits. FAILING_READ is a library for LD_PRELOAD that makes
# read(2) fail after $FAILING_READ_AFTER bytes; FEED_IN_PIECES runs a command on a non-blocking
# pipe fed in pieces; CONFORMANCE_DIR holds the parsing test suite.
set -uo pipefail
jsonfmt=$1
man_page=$2
mode=$3
failing_read=$4
feed_in_pieces=$5
conformance=$6
here=$(cd "$(dirname "$0")" && pwd)
source "$here/support/missing.sh"
source "$here/support/cases.sh"
work=$(mktemp -d)
trap 'chmod -R u+w "$work"; rm -rf "$work"' EXIT
# The read-only directory case runs as another user, who must reach the files.
chmod 755 "$work"
skip() { echo "skip $1"; }
# absent NAME WHAT: a case that needs WHAT, which only scripts/install-deps.sh installs
absent() { missing "$1: $2" || failures=$((failures + 1)); }
# expect NAME STATUS STDOUT STDERR [PREFIX...] -- ARGS...: runs PREFIX jsonfmt ARGS (stdin from
# $work/stdin) and compares its status, its standard output and its standard error
expect() {
    local name=$1 status=$2 out=$3 err=$4 prefix=()
    shift 4
    while [ "$1" != -- ]; do prefix+=("$1"); shift; done
    shift
    "${prefix[@]}" "$jsonfmt" "$@" <"$work/stdin" >"$work/out" 2>"$work/err"
    outcome "$name" "$status" "$out" "$err" $?
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
# Members come out in the order they came in
compact='{"b":[1,{}],"a":"x/y"}'
pretty=$'{\n  "b": [\n    1,\n    {}\n  ],\n  "a": "x/y"\n}'
# The library's own pretty text, which jsonfmt wrote before it took up the common layout
library_pretty=$'{\n    "b":[\n        1,\n        {        }\n    ],\n    "a":"x\\/y"\n}'
bad_error="$work/bad.json:3:4: error: No trailing ']' while parsing value of type array (possible missing comma?)
	2 3]
	  ^"
no_digit="error: Expected leading digit while parsing value of type number (no JSON value starts here)"
lines_error="$work/bad.jsonl:2:12: $no_digit
  [true,   x]
           ^"

expect pretty 0 "$pretty" "" -- "$work/doc.json"
expect compact 0 "$compact" "" -- -c "$work/doc.json"
expect compact-long 0 "$compact" "" -- --compact "$work/doc.json"
expect stdin 0 $'[\n  1\n]' "" --
expect stdin-dash 0 '[1]' "" -- -c -
expect check-valid 0 "" "" -- --check "$work/doc.json"
expect check-invalid 1 "" "$bad_error" -- --check "$work/bad.json"
expect invalid 1 "" "$bad_error" -- "$work/bad.json"
expect valid-and-invalid 1 "$compact" "$bad_error" -- -c "$work/doc.json" "$work/bad.json"
expect too-deep 1 "" "$work/deep.json:1:3: error: the document is nested deeper than 2 levels; --max-depth sets the limit
[[[1]]]
  ^" -- --max-depth 2 "$work/deep.json"
expect deep-enough 0 '[[[1]]]' "" -- -c --max-depth 3 "$work/deep.json"
expect missing-file 2 "" "jsonfmt: $work/none.json: No such file or directory" -- "$work/none.json"
expect bad-depth 2 "" "jsonfmt: --max-depth: needs a positive number (try --help)" -- --max-depth 0
expect bad-depth-text 2 "" "jsonfmt: --max-depth: needs a positive number (try --help)" -- --max-depth x
expect unknown-option 2 "" "jsonfmt: The following argument was not expected: --pretty (try --help)" -- --pretty

# Layout: the common pretty text by default, its indentation chosen; the library's own text
printf '{"e": "caf\xc3\xa9 \xf0\x9f\x98\x80", "n": [[]]}' >"$work/wide.json"
expect library-layout 0 "$library_pretty" "" -- --library-layout "$work/doc.json"
expect indent-0 0 $'{\n"b": [\n1,\n{}\n],\n"a": "x/y"\n}' "" -- --indent 0 "$work/doc.json"
expect indent-16 0 $'[\n                1\n]' "" -- --indent 16
expect tab 0 $'{\n\t"e": "caf\xc3\xa9 \xf0\x9f\x98\x80",\n\t"n": [\n\t\t[]\n\t]\n}' "" -- --tab "$work/wide.json"
expect ascii 0 $'{\n  "e": "caf\\u00e9 \\ud83d\\ude00",\n  "n": [\n    []\n  ]\n}' "" -- --ascii "$work/wide.json"
expect ascii-compact 0 '{"e":"caf\u00e9 \ud83d\ude00","n":[[]]}' "" -- --ascii -c "$work/wide.json"
expect ascii-lines 0 '"caf\u00e9"' "" -- --ascii -l <(printf '"caf\xc3\xa9"\n')
for usage in "--indent 17|--indent: Value 17 not in range 0 to 16" "--tab --indent 3|--indent excludes --tab" \
    "-c --tab|--compact excludes --tab" "--library-layout --ascii|--ascii excludes --library-layout" \
    "-l --indent 2|--indent excludes --lines"; do
    read -ra arguments <<<"${usage%%|*}"
    expect "layout-usage: ${usage%%|*}" 2 "" "jsonfmt: ${usage#*|} (try --help)" -- "${arguments[@]}"
done

# What cannot be written as it was read is refused where it stands, the file's line given
# (refused NAME TEXT COLUMN MESSAGE [ARGS...]), and accepted with --lossy or the flag named
# (accepted NAME TEXT OUTPUT ARGS...)
refused() {
    printf '%s' "$2" >"$work/refused.json"
    expect "refused-$1" 1 "" "$work/refused.json:1:$3: error: $4
$2
$(printf "%$(($3 - 1))s^")" -- "${@:5}" "$work/refused.json"
}
accepted() {
    printf '%s' "$2" >"$work/accepted.json"
    expect "accepted-$1" 0 "$3" "" -- -c "${@:4}" "$work/accepted.json"
}
would_change="valid JSON, but jsonfmt would change it:"
refused not-utf8 $'"\xff\xfe"' 2 "a string holds bytes that are not well-formed UTF-8; --lossy keeps them as they are"
refused not-utf8-check $'"\xff\xfe"' 2 "a string holds bytes that are not well-formed UTF-8; --lossy keeps them as they are" --check
refused lone-surrogate '"\ud800"' 2 "$would_change \\ud800 is half of a surrogate pair without its other half; --lossy makes it U+FFFD"
refused comment '[1 // one]' 4 "comments are not JSON; --allow-comments accepts them"
refused trailing-comma '{"a":1,}' 8 "a trailing comma is not JSON; --allow-trailing-commas accepts one"
accepted not-utf8 $'"\xff\xfe"' $'"\xff\xfe"' --lossy
accepted lone-surrogate '"\ud800"' $'"\xef\xbf\xbd"' --lossy
accepted comments $'[1, // one\n/* two */ 2]' '[1,2]' --allow-comments
accepted trailing-comma '{"a":[1,],}' '{"a":[1]}' --allow-trailing-commas
# Number literals, repeated names and member order pass through as they are, whatever the
# layout or mode (kept NAME TEXT ARGS...: compact output is TEXT without its spaces)
kept() {
    printf '%s' "$2" >"$work/kept-literals.json"
    expect "kept-$1" 0 "${2// /}" "" -- -c "${@:3}" "$work/kept-literals.json"
}
kept numbers '[1e400, -1e-400, 1234567890123456789, 1.50, 1E2, -0, 0.10000000000000001]'
kept repeated-names '{"z": 1, "a": {"k": 1, "k": [2]}, "z": 3}'
kept lines '{"id": 1234567890123456789, "id": 1.50}' --lines
kept sorted-literals '{"a": 1e400, "b": 1.50}' --sort-keys
expect kept-check 0 "" "" -- --check "$work/kept-literals.json"
printf '[1]\n{"a": "\\ud800"}\n' >"$work/refused.jsonl"
expect lines-refused 1 '[1]' "$work/refused.jsonl:2:8: error: $would_change \\ud800 is half of a surrogate pair without its other half; --lossy makes it U+FFFD
{\"a\": \"\\ud800\"}
       ^" -- -l "$work/refused.jsonl"
# --ascii cannot write bytes that --lossy let through: that document is reported and nothing of
# it written (not even the text of a long string before them), the documents before it are
{ printf '["'; head -c 100000 /dev/zero | tr '\0' x; printf '", "\xff"]'; } >"$work/latin1.json"
expect ascii-not-utf8 1 "$compact" "$work/latin1.json: --ascii: json: byte 0 of a string is not well-formed UTF-8, which ASCII-only text cannot write" -- --lossy --ascii -c "$work/doc.json" "$work/latin1.json"

# --sort-keys: members in byte order of their names (é, 0xc3, after z), the same names in
# their order, literals kept; the text is the one the same members written in order give
printf '{"b": {"y": [1, {"d": 1, "c": 2}], "x": null}, "\xc3\xa9": 1, "z": 2, "a": 1e400, "a": 1.50, "B": []}' >"$work/unsorted.json"
printf '{"B": [], "a": 1e400, "a": 1.50, "b": {"x": null, "y": [1, {"c": 2, "d": 1}]}, "z": 2, "\xc3\xa9": 1}' >"$work/presorted.json"
for layout in "" -c --library-layout --tab --ascii; do
    "$jsonfmt" $layout "$work/presorted.json" >"$work/sorted.expected"
    "$jsonfmt" --sort-keys $layout "$work/unsorted.json" >"$work/sorted"
    check "sort-keys: ${layout:-pretty}" cmp -s "$work/sorted.expected" "$work/sorted"
done
expect sort-keys-array 0 '[{"a":2,"b":1},3,{"c":3,"d":[{"e":2,"f":1}]}]' "" -- -c --sort-keys <(printf '[{"b":1,"a":2},3,{"d":[{"f":1,"e":2}],"c":3}]')
expect sort-keys-lines 0 $'{"a":2,"b":1}\n[{"a":[],"b":{}}]' "" -- -l --sort-keys <(printf '{"b":1,"a":2}\n[{"b":{},"a":[]}]\n')
expect sort-keys-pointer 0 '{"c":2,"d":1}' "" -- -c --sort-keys -p /b/y/1 "$work/unsorted.json"

# --pointer
expect pointer-compact 0 '[1,{}]' "" -- -c -p /b "$work/doc.json"
expect pointer-pretty 0 $'[\n  1,\n  {}\n]' "" -- --pointer /b "$work/doc.json"
expect pointer-empty 0 "$compact" "" -- -c -p "" "$work/doc.json"
expect pointer-missing 1 '[1,{}]' "$work/other.json: no value at /b: no member \"b\"" -- -c -p /b "$work/other.json" "$work/doc.json"
expect pointer-malformed 2 "" "jsonfmt: --pointer: JSON Pointer \"b\" does not start with '/' (try --help)" -- -p b "$work/doc.json"
expect pointer-bad-escape 2 "" "jsonfmt: --pointer: JSON Pointer \"/a~2\" has a '~' not followed by '0' or '1' (try --help)" -- -p /a~2 "$work/doc.json"

# --pointer follows the path through the events: each way it can leave the document is said
# as json::Value::at_pointer says it, and a name the path takes twice is ambiguous
printf '{"a": {"y": 1}, "b": [1, 2], "c": "s", "d": [{"e": 1}, {"e": 2}], "f": 0, "f": {"g": 1}, "~/": 5}' >"$work/path.json"
for miss in '/a/x|no value at /a/x: no member "x"' '/b/5|no value at /b/5: index 5 out of range for a JSON array of 2 elements' \
    '/b/x|no value at /b/x: "x" is no index of a JSON array' '/b/-|no value at /b/-: "-" is no index of a JSON array' \
    '/b/01|no value at /b/01: "01" is no index of a JSON array: it has a leading zero' '/c/d|no value at /c/d: expected JSON object or array, found JSON string' \
    '/f/g|no single value at /f: the object has more than one member "f"' \
    '/b/99999999999999999999999|no value at /b/99999999999999999999999: index 99999999999999999999999 out of range for a JSON array of 2 elements'; do
    expect "pointer-miss ${miss%%|*}" 1 "" "$work/path.json: ${miss#*|}" -- -c -p "${miss%%|*}" "$work/path.json"
done
for hit in '/d/1/e|2' '/d/1|{"e":2}' '/~0~1|5' '/a|{"y":1}'; do
    expect "pointer-hit ${hit%%|*}" 0 "${hit#*|}" "" -- -c -p "${hit%%|*}" "$work/path.json"
done
expect pointer-check 1 "" "$work/path.json: no value at /a/x: no member \"x\"" -- --check -p /a/x "$work/path.json"
# The rest of the document is read after the value is written: a later error still counts
expect pointer-then-invalid 1 "" "$work/bad.json:3:4: error: No trailing ']' while parsing value of type array (possible missing comma?)
	2 3]
	  ^" -- -c -p /a/0 "$work/bad.json"

# --lines: blank lines skipped, the last line has no newline; a bad line gets its own column
expect lines 0 $'{"a":1}\n[1,2]\n{"b":{"c":3}}\n"last"' "" -- --lines "$work/good.jsonl"
expect lines-bad 1 $'[1]\n{"b":2}' "$lines_error" -- -l "$work/bad.jsonl"
expect lines-check 1 "" "$lines_error" -- -l --check "$work/bad.jsonl"
# Onto one terminal (here one file), a message comes after the text of the lines before it
"$jsonfmt" -l "$work/bad.jsonl" >"$work/both" 2>&1
check lines-in-order [ "$(cat "$work/both")" = $'[1]\n'"$lines_error"$'\n{"b":2}' ]
expect lines-pointer 1 $'1\n[2]' "$work/pointer.jsonl:2: no value at /b: no member \"b\"" -- -l -p /b "$work/pointer.jsonl"

# A failure far into a stream is shown from the pieces read last, from a file and from a
# pipe alike: on a long line a window around it, "..." where the line goes on before it; on a
# later line that line, counted across the pieces
{ printf '['; yes '1,' | head -n 150000 | tr -d '\n'; printf 'x, 2, 3, 4, 5, 6, 7, 8, 9]'; } >"$work/long-line.json"
{ printf '[\n'; yes '1,' | head -n 100000; printf '  x]\n'; } >"$work/many-lines.json"
from_pipe=(bash -c 'cat "$1" | "$0" -c -' )
window="$(printf '1,%.0s' $(seq 30))"
expect stream-long-line 1 "" "$work/long-line.json:1:300002: $no_digit
...${window}x, 2, 3, 4, 5, 6, 7, 8, 9]
$(printf '%63s')^" -- "$work/long-line.json"
expect stream-long-line-pipe 1 "" "<stdin>:1:300002: $no_digit
...${window}x, 2, 3, 4, 5, 6, 7, 8, 9]
$(printf '%63s')^" "${from_pipe[@]}" -- "$work/long-line.json"
expect stream-later-line-pipe 1 "" "<stdin>:100002:3: $no_digit
  x]
  ^" "${from_pipe[@]}" -- "$work/many-lines.json"

# A document that fails is taken back whole while its text fits the 1 MiB output buffer (the
# cases above); a longer one has gone out in part: its text up to the failure stays, ended by
# a newline, and the message says so. Into a file (-o) nothing of it is written.
# cut_short OUT IN: OUT holds more than the output buffer of IN's compact text (IN is compact
# already), not all of it, and a newline: what went out before the failure
cut_short() {
    local size=$(($(wc -c <"$1") - 1))
    [ "$size" -gt 1048576 ] && [ "$size" -lt "$(wc -c <"$2")" ] &&
        [ "$(tail -c 1 "$1" | od -An -tx1 | tr -d ' ')" = 0a ] && cmp -s -n "$size" "$1" "$2"
}
for ending in 'parse|x]' $'ascii|"\xff"]'; do
    { printf '['; yes '"abcdefghij",' | head -n 120000 | tr -d '\n'; printf '%s' "${ending#*|}"; } >"$work/cut-${ending%%|*}.json"
done
for cut in "parse||$work/cut-parse.json:1:1560002: $no_digit
...$(tail -c 62 "$work/cut-parse.json")
$(printf '%63s')^" \
    "ascii|--lossy --ascii|$work/cut-ascii.json: --ascii: json: byte 0 of a string is not well-formed UTF-8, which ASCII-only text cannot write"; do
    IFS='|' read -r -d '' name flags message <<<"$cut"
    message=${message%$'\n'}
    file="$work/cut-$name.json"
    "$jsonfmt" -c $flags "$file" >"$work/out" 2>"$work/err"
    check "cut-$name-status" [ $? = 1 ]
    check "cut-$name-text" cut_short "$work/out" "$file"
    check "cut-$name-said" [ "$(cat "$work/err")" = "$message
jsonfmt: $file: part of its text went to standard output already" ]
    printf 'old' >"$work/kept.json"
    expect "cut-$name-output-kept" 1 "" "$message" -- -c $flags -o "$work/kept.json" "$file"
    check "cut-$name-output-untouched" [ "$(cat "$work/kept.json")" = old ]
done

# --output
expect output 0 "" "" -- -o "$work/written.json" "$work/doc.json"
check output-content [ "$(cat "$work/written.json")" = "$pretty" ]
printf 'old' >"$work/kept.json"
expect output-ascii-not-utf8 1 "" "$work/latin1.json: --ascii: json: byte 0 of a string is not well-formed UTF-8, which ASCII-only text cannot write" -- --lossy --ascii -o "$work/kept.json" "$work/latin1.json"
check output-ascii-not-utf8-kept [ "$(cat "$work/kept.json")" = old ]
expect output-long 0 "" "" -- -c --output "$work/written.json" "$work/doc.json"
check output-long-content [ "$(cat "$work/written.json")" = "$compact" ]
expect output-unwritable 2 "" "jsonfmt: $work/none/out.json: creating a temporary file: No such file or directory" -- -o "$work/none/out.json" "$work/doc.json"
expect output-full 2 "" "jsonfmt: writing /dev/full: No space left on device" -- -o /dev/full "$work/doc.json"
expect output-no-file 2 "" "jsonfmt: --output: 1 required FILE missing (try --help)" -- -o
expect output-is-input 2 "" "jsonfmt: --output $work/./doc.json is also an input: writing it would destroy it (use --in-place) (try --help)" -- -o "$work/./doc.json" "$work/doc.json"
check output-is-input-kept [ "$(cat "$work/doc.json")" = '{"b": [1, {}], "a": "x/y"}' ]
# FILE is replaced only when every document is valid and written; a closed standard stream
# takes no descriptor that the output could get
expect output-failed-run 1 "" "$bad_error" -- -o "$work/kept.json" "$work/doc.json" "$work/bad.json"
"$jsonfmt" -o "$work/kept.json" "$work/doc.json" "$work/bad.json" 2>&-
check output-stderr-closed [ $? = 1 ]
expect output-stdin-closed 2 "" "jsonfmt: <stdin>: read failed: Bad file descriptor" bash -c 'exec "$0" "$@" <&-' -- -o "$work/kept.json"
check output-failures-kept [ "$(cat "$work/kept.json")" = old ]
check output-nothing-left [ -z "$(ls -A "$work" | grep jsonfmt-)" ]
# A new file gets 0666 less the umask, a replaced one keeps its mode
(umask 027 && "$jsonfmt" -o "$work/new.json" "$work/doc.json")
check output-new-mode [ "$(stat -c %a "$work/new.json")" = 640 ]
chmod 604 "$work/new.json"
expect output-replaced 0 "" "" -- -c -o "$work/new.json" "$work/doc.json"
check output-replaced-mode [ "$(stat -c %a:%s "$work/new.json")" = 604:23 ]

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

# --in-place drops no comment unless --lossy says so; a trailing comma it drops, losing nothing
printf '{"a": [1,],\n  "b": 2 /* two */}' >"$work/commented.json"
cp "$work/commented.json" "$work/edit/config.json"
expect in-place-comment 1 "" "$work/edit/config.json:2:10: error: --in-place would drop this comment (add --lossy to allow that)
  \"b\": 2 /* two */}
         ^" -- -i --allow-comments --allow-trailing-commas "$work/edit/config.json"
check in-place-comment-kept cmp -s "$work/commented.json" "$work/edit/config.json"
expect in-place-comment-lossy 0 "" "" -- -c -i --lossy --allow-comments --allow-trailing-commas "$work/edit/config.json"
check in-place-comment-dropped [ "$(cat "$work/edit/config.json")" = '{"a":[1],"b":2}' ]
printf '[1,]' >"$work/edit/config.json"
expect in-place-no-comment 0 "" "" -- -c -i --allow-comments --allow-trailing-commas "$work/edit/config.json"
check in-place-no-comment-rewritten [ "$(cat "$work/edit/config.json")" = '[1]' ]
rm "$work/edit/config.json"

# --in-place refuses what a renamed copy would not replace: a file with other hard links, a
# FIFO (the writer is stopped once the refusal is checked), a pipe behind /dev/stdin
ln "$work/edit/doc.json" "$work/edit/second-name.json"
expect in-place-hard-link 2 "" "jsonfmt: $work/edit/doc.json: has 2 hard links: rewriting it would break them" -- -i "$work/edit/doc.json"
check in-place-hard-link-kept [ "$work/edit/doc.json" -ef "$work/edit/second-name.json" ]
rm "$work/edit/second-name.json"
mkfifo "$work/edit/pipe"
printf '[1]' >"$work/edit/pipe" &
writer=$!
expect in-place-fifo 2 "" "jsonfmt: $work/edit/pipe: not a regular file: only a regular file is rewritten" timeout 10 -- -i "$work/edit/pipe"
check in-place-fifo-kept [ -p "$work/edit/pipe" ]
kill "$writer" 2>/dev/null; wait "$writer" 2>/dev/null
rm "$work/edit/pipe"
printf '[1]' | "$jsonfmt" -i /dev/stdin 2>"$work/err"
check in-place-dev-stdin-status [ $? = 2 ]
check in-place-dev-stdin-message [ "$(cat "$work/err")" = "jsonfmt: /dev/stdin: not a regular file: only a regular file is rewritten" ]
check in-place-refusals-nothing-left same_listing "$work/edit" "$listing"

# A signal while the temporary file is there removes it: jsonfmt is held writing the messages
# of 3000 bad lines into a pipe that nobody reads
mkdir "$work/signal"
yes x | head -n 3000 >"$work/signal/bad.jsonl"
mkfifo "$work/signal-messages"
exec 3<>"$work/signal-messages"
for signal in INT TERM; do
    env --default-signal="$signal" "$jsonfmt" -l -i "$work/signal/bad.jsonl" 2>&3 &
    held=$!
    for _ in $(seq 100); do
        [ "$(ls -A "$work/signal")" != bad.jsonl ] && break
        sleep 0.1
    done
    kill -"$signal" "$held"
    wait "$held"
    check "in-place-$signal-status" [ $? = $((128 + $(kill -l "$signal"))) ]
    check "in-place-$signal-nothing-left" same_listing "$work/signal" bad.jsonl
done
exec 3<&-

# Owner and group are kept (only root can hand a file to another user)
if [ "$(id -u)" = 0 ]; then
    cp "$work/doc.json" "$work/edit/owned.json"
    chown 65534:65534 "$work/edit/owned.json"
    expect in-place-owner 0 "" "" -- -c -i "$work/edit/owned.json"
    check in-place-owner-kept [ "$(stat -c %u:%g "$work/edit/owned.json")" = 65534:65534 ]
    rm "$work/edit/owned.json"
else
    skip "in-place-owner: needs root"
fi

# As an ordinary user (root ignores permissions, so as root this runs as nobody): a read-only
# directory, where no temporary file can be made; a read-only file; and a file of another user
# that nobody may write, but whose owner the rewrite could not keep
mkdir "$work/locked" "$work/mine"
cp "$work/doc.json" "$work/locked/doc.json"
cp "$work/doc.json" "$work/mine/read-only.json"
chmod 444 "$work/mine/read-only.json"
cp "$work/doc.json" "$work/mine/others.json"
chmod 666 "$work/mine/others.json"
unprivileged=()
if [ "$(id -u)" = 0 ]; then
    unprivileged=(setpriv --reuid=65534 --regid=65534 --clear-groups)
    chown 65534:65534 "$work/locked/doc.json" "$work/mine" "$work/mine/read-only.json"
fi
chmod 555 "$work/locked"
if [ "${#unprivileged[@]}" -ne 0 ] && ! command -v setpriv >/dev/null; then
    skip "in-place-read-only: running as root without setpriv"
elif ! "${unprivileged[@]}" test -r "$work/locked/doc.json"; then
    skip "in-place-read-only: $work is out of the unprivileged user's reach"
else
    expect in-place-read-only-dir 2 "" "jsonfmt: $work/locked/doc.json: creating a temporary file: Permission denied" "${unprivileged[@]}" -- -i "$work/locked/doc.json"
    check in-place-read-only-unchanged cmp -s "$work/doc.json" "$work/locked/doc.json"
    check in-place-read-only-nothing-left same_listing "$work/locked" doc.json
    expect in-place-read-only-file 2 "" "jsonfmt: $work/mine/read-only.json: Permission denied" "${unprivileged[@]}" -- -i "$work/mine/read-only.json"
    check in-place-read-only-file-unchanged cmp -s "$work/doc.json" "$work/mine/read-only.json"
    if [ "${#unprivileged[@]}" -ne 0 ]; then
        expect in-place-foreign-owner 2 "" "jsonfmt: $work/mine/others.json: keeping its owner and group: Operation not permitted" "${unprivileged[@]}" -- -i "$work/mine/others.json"
        check in-place-foreign-owner-kept [ "$(stat -c %u "$work/mine/others.json")" = 0 ]
    fi
    check in-place-refused-nothing-left same_listing "$work/mine" $'others.json\nread-only.json'
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

# A read that fails is an I/O error, never the end of the text: the document is refused and
# the files stay as they were
printf '12345678' >"$work/num.json"
cp "$work/num.json" "$work/num-in-place.json"
printf 'old' >"$work/kept.json"
printf '[1]\n[2]\n[3]\n' >"$work/three.jsonl"
breaking=(env LD_PRELOAD="$failing_read" ASAN_OPTIONS=verify_asan_link_order=0 FAILING_READ_AFTER=4)
eio="read failed: Input/output error"
expect read-error 2 "" "jsonfmt: $work/num.json: $eio" "${breaking[@]}" -- "$work/num.json"
expect read-error-in-place 2 "" "jsonfmt: $work/num-in-place.json: $eio" "${breaking[@]}" -- -i "$work/num-in-place.json"
check read-error-in-place-kept [ "$(cat "$work/num-in-place.json")" = 12345678 ]
expect read-error-output 2 "" "jsonfmt: $work/num.json: $eio" "${breaking[@]}" -- -o "$work/kept.json" "$work/num.json"
check read-error-output-kept [ "$(cat "$work/kept.json")" = old ]
expect read-error-lines 2 "[1]" "jsonfmt: $work/three.jsonl:2: $eio" "${breaking[@]}" -- -l "$work/three.jsonl"
# A non-blocking pipe that has nothing yet is waited on, not taken for the end of the text
expect non-blocking-pipe 0 "1234" "" "$feed_in_pieces" 200 '12|34' -- -c
expect non-blocking-pipe-invalid 1 "" "<stdin>:1:7: $(printf '%s' "$no_digit" | sed 's/no JSON value starts here/the text goes on after the JSON value/; s/Expected leading digit while parsing value of type number/Unexpected end of input/')
[1,2] x
      ^" "$feed_in_pieces" 200 '[1,2]| x' -- -c

# --check gives every document the verdict of the run it stands for, message for message
check_agrees "" "--ascii --lossy" "--ascii" "--lossy" "--pointer /0" "--sort-keys" "-l" \
    "--allow-comments --allow-trailing-commas --allow-bom" "--max-depth 2"

# A byte order mark, lines ended by carriage returns, a depth beyond counting
printf '\xef\xbb\xbf{"a": 1}' >"$work/bom.json"
cp "$work/bom.json" "$work/bom-in-place.json"
expect bom-refused 1 "" "$work/bom.json:1:1: error: a UTF-8 byte order mark (EF BB BF) is not JSON; --allow-bom skips it
$(printf '\xef\xbb\xbf{"a": 1}')
^" -- "$work/bom.json"
expect bom-allowed 0 '{"a":1}' "" -- -c --allow-bom "$work/bom.json"
expect bom-in-place-kept 1 "" "$work/bom-in-place.json:1:1: error: --in-place would drop the byte order mark (add --lossy to allow that)
$(printf '\xef\xbb\xbf{"a": 1}')
^" -- -i --allow-bom "$work/bom-in-place.json"
expect bom-in-place-dropped 0 "" "" -- -i -c --allow-bom --lossy "$work/bom-in-place.json"
check bom-in-place-content [ "$(cat "$work/bom-in-place.json")" = '{"a":1}' ]
printf '[1,\r2,\rx]\r[3]' >"$work/returns.json"
expect carriage-returns 1 "" "$work/returns.json:3:1: $no_digit
x]
^" -- "$work/returns.json"
expect depth-beyond-counting 2 "" "jsonfmt: --max-depth: 99999999999999999999999 is more than the largest depth allowed, 18446744073709551615 (try --help)" -- --max-depth 99999999999999999999999

# Bounded memory: a 1 MB document nested 500 deep pretty-prints to 1.3 GB within 300 MB of
# address space, the output streaming out as it is made
if [ "$mode" = sanitized ]; then
    skip "bounded-memory, lines-out-of-memory: AddressSanitizer's reservations exceed any ulimit -v"
else
    { head -c 500 /dev/zero | tr '\0' '['; yes '[1,2],' | head -n 166000 | tr -d '\n' | head -c -1
      head -c 500 /dev/zero | tr '\0' ']'; } >"$work/big.json"
    bytes=$(ulimit -v 300000 && "$jsonfmt" "$work/big.json" | wc -c)
    check bounded-memory-status [ $? = 0 ]
    check bounded-memory-bytes [ "$bytes" = 666824999 ]
    # A line longer than memory allows is said to be so, with its length, and skipped; the
    # lines after it still go out, and a file to rewrite stays as it was
    { printf '[1]\n"'; head -c 30000000 /dev/zero | tr '\0' x; printf '"\n[2]\n'; } >"$work/long.jsonl"
    mkdir "$work/long"
    cp "$work/long.jsonl" "$work/long/long.jsonl"
    expect lines-out-of-memory 2 "[1]
[2]" "jsonfmt: $work/long.jsonl:2: out of memory: the line is 30000002 bytes" bash -c 'ulimit -v 30000 && exec "$0" "$@"' -- -l "$work/long.jsonl"
    expect lines-out-of-memory-in-place 2 "" "jsonfmt: $work/long/long.jsonl:2: out of memory: the line is 30000002 bytes" bash -c 'ulimit -v 30000 && exec "$0" "$@"' -- -l -c -i "$work/long/long.jsonl"
    check lines-out-of-memory-kept cmp -s "$work/long.jsonl" "$work/long/long.jsonl"
    check lines-out-of-memory-nothing-left same_listing "$work/long" long.jsonl
fi

# Constant memory while streaming: a 300 MB document of records (literals and repeated names
# passed through) formatted and checked within 64 MB of resident memory, from a file and from
# a pipe. Release builds only: sanitizers and debug code are too slow and too large for it.
if [ "$mode" = sanitized ]; then
    skip "stream-300MB: needs a release build"
elif [ ! -x /usr/bin/time ]; then
    absent stream-300MB "GNU time (/usr/bin/time, Debian package time)"
else
    record='{"id": 1234567890123456789, "name": "user", "tags": [1.50, 2e400, "x"], "id": 1},'
    count=3700000
    { printf '['; yes "$record" | head -n "$count" | tr -d '\n'; printf '0]'; } >"$work/huge.json"
    spaces=${record//[^ ]/}
    compact_bytes=$(($(wc -c <"$work/huge.json") - ${#spaces} * count + 1))
    # huge SOURCE FLAG: the size of jsonfmt FLAG's output for huge.json read from SOURCE (file or
    # pipe); its resident memory is left in $work/rss
    huge() {
        if [ "$1" = pipe ]; then
            cat "$work/huge.json" | /usr/bin/time -f %M -o "$work/rss" "$jsonfmt" "$2" - | wc -c
        else
            /usr/bin/time -f %M -o "$work/rss" "$jsonfmt" "$2" "$work/huge.json" | wc -c
        fi
    }
    for source in file pipe; do
        for flag in -c --check; do
            bytes=$(huge "$source" "$flag")
            check "stream-300MB $flag from a $source: status" [ $? = 0 ]
            expected=$compact_bytes
            [ "$flag" = --check ] && expected=0
            check "stream-300MB $flag from a $source: $bytes bytes" [ "$bytes" = "$expected" ]
            check "stream-300MB $flag from a $source: $(cat "$work/rss") KB resident" [ "$(cat "$work/rss")" -le 65536 ]
        done
    done
    rm "$work/huge.json"
fi

# --help names every option
for option in -h,--help -c,--compact '--indent N' --tab --ascii --library-layout --allow-comments \
    --allow-trailing-commas --lossy --sort-keys --check -l,--lines '-p,--pointer PTR' '-o,--output FILE' \
    -i,--in-place '--max-depth N' --version 'Usage: jsonfmt'; do
    check "help: $option" grep -qF -- "$option" <("$jsonfmt" --help)
done

# The manual page renders without warnings
if command -v man >/dev/null; then
    check man-page [ -z "$(man --warnings -l "$man_page" 2>&1 >/dev/null)" ]
else
    absent man-page "man (Debian package man-db)"
fi

finish
