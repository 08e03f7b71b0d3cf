#!/usr/bin/env bash
# Times jsonfmt against jq and python3 -m json.tool on a generated 50 MB file of records: the
# best of three runs of each command, output to /dev/null, and the throughput in MB/s.
# Usage: jsonfmt-vs-jq.sh JSONFMT [WORK_DIR]   (JSONFMT from a Release build; the file is
# generated into WORK_DIR, a temporary directory by default, and removed with it)
set -euo pipefail
jsonfmt=$1
work=${2:-$(mktemp -d)}
[ -n "${2:-}" ] || trap 'rm -rf "$work"' EXIT
records="$work/records.json"

# About 50 MB: an array of records with strings, integers, decimals, booleans, null, nested
# objects and arrays, one record per line.
python3 - "$records" <<'PY'
import json, random, sys
random.seed(1)
with open(sys.argv[1], "w") as out:
    out.write("[\n")
    size, i = 0, 0
    while size < 50_000_000:
        record = {"id": i, "name": "user%d" % i, "email": "user%d@example.com" % i,
                  "active": i % 3 == 0, "score": round(random.random() * 100, 3),
                  "tags": ["alpha", "beta", "gamma"][:i % 4],
                  "address": {"street": "%d Main St" % i, "city": "Springfield",
                              "zip": "%05d" % (i % 100000)},
                  "history": [{"t": 1600000000 + i * 7 + k, "v": k * 1.5} for k in range(3)],
                  "note": None}
        text = ("" if i == 0 else ",\n") + json.dumps(record)
        out.write(text)
        size, i = size + len(text), i + 1
    out.write("\n]\n")
PY
bytes=$(wc -c <"$records")
echo "$(date -u +%Y-%m-%d), $(nproc) x $(grep -m1 'model name' /proc/cpuinfo | cut -d: -f2 | sed 's/^ //'), $((bytes / 1000000)) MB"

# best COMMAND...: the shortest elapsed time of three runs of COMMAND on the records, in seconds
best() {
    local fastest="" start took
    for _ in 1 2 3; do
        start=$EPOCHREALTIME
        "$@" "$records" >/dev/null
        took=$(awk -v a="$start" -v b="$EPOCHREALTIME" 'BEGIN { printf "%.3f", b - a }')
        if [ -z "$fastest" ] || awk -v t="$took" -v f="$fastest" 'BEGIN { exit !(t < f) }'; then
            fastest=$took
        fi
    done
    echo "$fastest"
}

jq_pretty=$(best jq .)
printf '%-30s %8s %7s %8s\n' command seconds MB/s "vs jq ."
for command in "$jsonfmt" "$jsonfmt --compact" "$jsonfmt --sort-keys" "$jsonfmt --check" \
    "jq ." "jq -c ." "python3 -m json.tool" "python3 -m json.tool --compact"; do
    read -ra words <<<"$command"
    if [ "$command" = "jq ." ]; then seconds=$jq_pretty; else seconds=$(best "${words[@]}"); fi
    shown=$command
    [ "${words[0]}" = "$jsonfmt" ] && shown="jsonfmt${command#"$jsonfmt"}"
    awk -v c="$shown" -v s="$seconds" -v b="$bytes" -v j="$jq_pretty" \
        'BEGIN { printf "%-30s %8.3f %7.0f %7.1fx\n", c, s, b / s / 1e6, j / s }'
done
