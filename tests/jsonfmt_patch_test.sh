#!/usr/bin/env bash
# Checks jsonfmt's patch modes: --patch, --merge-patch, --diff and --merge-diff, their output,
# messages, exit statuses and the files they rewrite.
# Usage: jsonfmt_patch_test.sh JSONFMT
set -uo pipefail
jsonfmt=$(realpath "$1")
here=$(cd "$(dirname "$0")" && pwd)
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
source "$here/support/cases.sh"
# expect NAME STATUS STDOUT STDERR ARGS...: jsonfmt ARGS (in $work, stdin from $work/stdin) has
# that status, standard output and standard error
expect() {
    local name=$1 status=$2 out=$3 err=$4
    shift 4
    (cd "$work" && "$jsonfmt" "$@" <stdin >out 2>err)
    outcome "$name" "$status" "$out" "$err" $?
}
put() { printf '%s' "$2" >"$work/$1"; }

put stdin ''
put deploy.json '{"replicas": 2, "name": "web", "ports": [80, 443]}'
put scale.json '[{"op":"test","path":"/replicas","value":2},{"op":"replace","path":"/replicas","value":3},{"op":"add","path":"/ports/-","value":8080}]'
put wrong.json '[{"op":"add","path":"/x","value":1},{"op":"remove","path":"/name"},{"op":"test","path":"/replicas","value":5}]'
scaled='{"name":"web","ports":[80,443,8080],"replicas":3}'
scaled_pretty=$'{\n  "name": "web",\n  "ports": [\n    80,\n    443,\n    8080\n  ],\n  "replicas": 3\n}'

# --patch: the document built, patched and written with its members in byte order of their names
expect patch 0 "$scaled_pretty" "" --patch scale.json deploy.json
expect patch-compact 0 "$scaled"$'\n'"$scaled" "" -c --patch scale.json deploy.json deploy.json
cp "$work/deploy.json" "$work/stdin"
expect patch-stdin 0 "$scaled" "" -c --patch scale.json
put stdin ''
expect patch-pointer 0 '[80,443,8080]' "" -c --patch scale.json -p /ports deploy.json
expect patch-pointer-missing 1 "" "deploy.json: no value at /x: no member \"x\"" -c --patch scale.json -p /x deploy.json
expect patch-check 0 "" "" --check --patch scale.json deploy.json
# A patch that fails names the operation and why; the documents around it are still written
put deploy5.json '{"replicas": 5}'
expect patch-fails 1 "$scaled"$'\n'"$scaled" "deploy5.json: operation 0 (test /replicas): the value differs" \
    -c --patch scale.json deploy.json deploy5.json deploy.json
expect patch-fails-message 1 "" "deploy.json: operation 2 (test /replicas): the value differs" --patch wrong.json deploy.json
put notpatch.json '{"op":"add"}'
expect patch-not-a-patch 1 "" "deploy.json: operation 0: expected a JSON array of operations, found JSON object" --patch notpatch.json deploy.json
# Nothing is changed silently: a number a double cannot hold and a repeated name are refused
# where they stand, in the documents (status 1) and in the patch (status 2)
put inexact.json '{"id": 12345678901234567890}'
expect patch-inexact 1 "" 'inexact.json:1:8: error: valid JSON, but building the document would change it: 12345678901234567890 cannot be held exactly by a double
{"id": 12345678901234567890}
       ^' --patch scale.json inexact.json
put repeated.json '{"a": 1, "a": 2}'
expect patch-repeated 1 "" 'repeated.json:1:10: error: valid JSON, but building the document would change it: the object already has a member named "a"
{"a": 1, "a": 2}
         ^' --patch scale.json repeated.json
put repeated-op.json '[{"op":"add","path":"/baz","value":"qux","op":"remove"}]'
expect patch-repeated-op 2 "" 'repeated-op.json:1:42: error: valid JSON, but building the document would change it: the object already has a member named "op"
[{"op":"add","path":"/baz","value":"qux","op":"remove"}]
                                         ^' --patch repeated-op.json deploy.json
expect patch-missing-patch 2 "" "jsonfmt: none.json: No such file or directory" --patch none.json deploy.json
expect patch-missing-document 2 "" "jsonfmt: none.json: No such file or directory" --patch scale.json none.json
expect patch-stdin-twice 2 "" "jsonfmt: standard input cannot give both the patch and a document (try --help)" --patch - deploy.json -
expect patch-lines 2 "" "jsonfmt: --lines excludes --patch (try --help)" --patch scale.json -l deploy.json

# --patch -i: the file is rewritten only when the whole patch applies
mkdir "$work/edit"
cp "$work/deploy.json" "$work/edit/a.json"
cp "$work/deploy.json" "$work/edit/b.json"
expect patch-in-place-fails 1 "" "edit/b.json: operation 2 (test /replicas): the value differs" --patch wrong.json -i edit/b.json
check patch-in-place-fails-untouched cmp -s "$work/deploy.json" "$work/edit/b.json"
expect patch-in-place 0 "" "" -c --patch scale.json -i edit/a.json edit/b.json
check patch-in-place-content [ "$(cat "$work/edit/a.json")$(cat "$work/edit/b.json")" = "$scaled$scaled" ]
check patch-in-place-nothing-left [ "$(ls -A "$work/edit")" = $'a.json\nb.json' ]
put edit/config.json $'{"replicas": 2, // two\n"name": "web", "ports": []}'
expect patch-in-place-comment 1 "" 'edit/config.json:1:17: error: --in-place would drop this comment (add --lossy to allow that)
{"replicas": 2, // two
                ^' --patch scale.json --allow-comments -i edit/config.json
expect patch-in-place-lossy 0 "" "" -c --patch scale.json --allow-comments --lossy -i edit/config.json
check patch-in-place-lossy-content [ "$(cat "$work/edit/config.json")" = '{"name":"web","ports":[8080],"replicas":3}' ]
# -o FILE is replaced only when the patch applies to every document
put kept.json 'old'
expect patch-output-fails 1 "" "deploy.json: operation 2 (test /replicas): the value differs" --patch wrong.json -o kept.json deploy.json
check patch-output-kept [ "$(cat "$work/kept.json")" = old ]
expect patch-output 0 "" "" -c --patch scale.json -o kept.json deploy.json
check patch-output-content [ "$(cat "$work/kept.json")" = "$scaled" ]

# --merge-patch streams: members it replaces or removes where they stand, members it adds at the
# end of their object, everything else as it came (order, literals, repeated names)
put config.json '{"z": 1e400, "name": "web", "limits": {"cpu": 1.50, "memory": "1G", "cpu": 2}, "env": ["A"], "old": {"x": 1}, "id": 12345678901234567890}'
put change.json '{"name": "api", "limits": {"memory": "2G", "disk": {"size": 10, "none": null}}, "env": {"B": "1"}, "old": null, "absent": null, "new": [null, 1]}'
merged='{"z":1e400,"name":"api","limits":{"cpu":1.50,"memory":"2G","cpu":2,"disk":{"size":10}},"env":{"B":"1"},"id":12345678901234567890,"new":[null,1]}'
expect merge-patch 0 "$merged" "" -c --merge-patch change.json config.json
expect merge-patch-check 0 "" "" --check --merge-patch change.json config.json
expect merge-patch-pointer 0 '{"cpu":1.50,"memory":"2G","cpu":2,"disk":{"size":10}}' "" -c --merge-patch change.json -p /limits config.json
expect merge-patch-sorted 0 '{"cpu":1.50,"cpu":2,"disk":{"size":10},"memory":"2G"}' "" -c --sort-keys --merge-patch change.json -p /limits config.json
# A patch that is no object replaces the document; an object patch makes anything else an object.
# What comes from the patch is written as the library writes a built value.
put replace.json '[1, {"a": null}]'
expect merge-patch-replace 0 '[1,{"a":null}]' "" -c --merge-patch replace.json config.json
put scalar.json '[1.50, "x"]'
expect merge-patch-onto-array 0 '{"env":{"B":"1"},"limits":{"disk":{"size":10},"memory":"2G"},"name":"api","new":[null,1]}' "" -c --merge-patch change.json scalar.json
# A name the patch changes that the document repeats is refused at its second occurrence
put twice.json $'{"limits": {"memory": "1G",\n  "memory": "4G"}}'
expect merge-patch-repeated 1 "" 'twice.json:2:3: error: the object has more than one member "memory": the merge patch cannot tell which one it changes
  "memory": "4G"}}
  ^' --merge-patch change.json twice.json
put lines.jsonl $'{"name": "a", "n": 1.0}\n[]\n{"name": "b", "name": "c"}\n'
expect merge-patch-lines 1 $'{"name":"api","n":1.0}\n{"name":"api"}' 'lines.jsonl:3:15: error: the object has more than one member "name": the merge patch cannot tell which one it changes
{"name": "b", "name": "c"}
              ^' --merge-patch <(printf '{"name":"api"}') -l lines.jsonl
# -i: the file is rewritten only when every document takes the patch
cp "$work/twice.json" "$work/edit/twice.json"
expect merge-patch-in-place-refused 1 "" 'edit/twice.json:2:3: error: the object has more than one member "memory": the merge patch cannot tell which one it changes
  "memory": "4G"}}
  ^' --merge-patch change.json -i edit/twice.json
check merge-patch-in-place-untouched cmp -s "$work/twice.json" "$work/edit/twice.json"
cp "$work/config.json" "$work/edit/config.json"
expect merge-patch-in-place 0 "" "" -c --merge-patch change.json -i edit/config.json
check merge-patch-in-place-content [ "$(cat "$work/edit/config.json")" = "$merged" ]
put badpatch.json '{"a": 1e400}'
expect merge-patch-inexact 2 "" 'badpatch.json:1:7: error: valid JSON, but building the document would change it: 1e400 cannot be held exactly by a double
{"a": 1e400}
      ^' --merge-patch badpatch.json config.json

# --diff and --merge-diff: exit status as diff(1), the patch pretty or compact
put deploy2.json '{"name": "web", "ports": [80, 443, 8080], "replicas": 3, "tls": null}'
expect diff 1 '[{"op":"add","path":"/ports/2","value":8080},{"op":"replace","path":"/replicas","value":3},{"op":"add","path":"/tls","value":null}]' "" -c --diff deploy.json deploy2.json
expect diff-pretty 0 "[]" "" --diff deploy.json deploy.json
expect diff-check 1 "" "" --check --diff deploy.json deploy2.json
expect diff-output 1 "" "" -c --diff deploy2.json deploy.json -o kept.json
check diff-output-content [ "$(cat "$work/kept.json")" = '[{"op":"remove","path":"/ports/2"},{"op":"replace","path":"/replicas","value":2},{"op":"remove","path":"/tls"}]' ]
expect diff-inexact 2 "" 'inexact.json:1:8: error: valid JSON, but building the document would change it: 12345678901234567890 cannot be held exactly by a double
{"id": 12345678901234567890}
       ^' --diff deploy.json inexact.json
expect diff-missing 2 "" "jsonfmt: none.json: No such file or directory" --diff deploy.json none.json
expect diff-file 2 "" "jsonfmt: --diff compares its own two files: it takes no FILE (try --help)" --diff deploy.json deploy2.json -- other.json
expect diff-one 2 "" "jsonfmt: --diff: At least 2 required but received 1 (try --help)" --diff deploy.json
expect diff-stdin-twice 2 "" "jsonfmt: --diff: standard input cannot be both A and B (try --help)" --diff - -
for excluded in --in-place --lines "--pointer /a"; do
    expect "diff-excludes $excluded" 2 "" "jsonfmt: ${excluded%% *} excludes --diff (try --help)" $excluded --diff deploy.json deploy2.json
done
expect merge-diff 1 '{"ports":[80,443,8080],"replicas":3}' "" -c --merge-diff deploy.json <(printf '{"name": "web", "ports": [80, 443, 8080], "replicas": 3}')
expect merge-diff-equal 0 '{}' "" -c --merge-diff deploy.json deploy.json
expect merge-diff-null 2 "" "jsonfmt: deploy2.json: a member is null there that no merge patch can set (null removes a member); --diff can say it" --merge-diff deploy.json deploy2.json
# The patches they write take the first document to the second
(cd "$work" && "$jsonfmt" -c --diff deploy.json deploy2.json >forward.json; "$jsonfmt" --merge-diff deploy2.json deploy.json >backward.json)
check diff-round-trip [ "$(cd "$work" && "$jsonfmt" -c --patch forward.json deploy.json)" = "$(cd "$work" && "$jsonfmt" -c --patch <(printf '[]') deploy2.json)" ]
check merge-diff-round-trip [ "$(cd "$work" && "$jsonfmt" -c --merge-patch backward.json deploy2.json)" = '{"name":"web","ports":[80,443],"replicas":2}' ]

# --help names every mode and says which build documents; the manual page renders
for option in '--patch FILE' '--merge-patch FILE' '--diff FILE' '--merge-diff FILE' 'byte order of their names' \
    'as --patch does' '1 when they differ'; do
    check "help: $option" grep -qF -- "$option" <("$jsonfmt" --help)
done
if command -v man >/dev/null; then
    check man-page [ -z "$(man --warnings -l "$here/../tools/jsonfmt.1" 2>&1 >/dev/null)" ]
fi

finish
