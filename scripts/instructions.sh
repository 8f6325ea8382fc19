#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Instructions per call of the kernels whose name contains FILTER, by valgrind's callgrind:
# repeatable to the instruction for one build. Three columns: the whole pass with its loop and the
# filling of the record; the entry point with all it calls; its bound (bench/bounds.txt).
#   usage: scripts/instructions.sh [FILTER]
#          scripts/instructions.sh --check KERNELS   all bounds, for the program KERNELS; fails
#                                                    where one is exceeded
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing valgrind
kernels=build/bench/kernels filter=${1:-} check=0
[ "$filter" != --check ] || { kernels=$2 filter="" check=1; }
[ -x "$kernels" ] || { echo "instructions: build first (scripts/test.sh)" >&2; exit 1; }
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
valgrind --tool=callgrind --callgrind-out-file="$out/dump" "$kernels" "$filter" \
    >"$out/log" 2>&1 || { cat "$out/log" >&2; exit 1; }

# One dump a kernel. The entry point: every call from another object into the shader library.
for dump in $(ls "$out" | grep '^dump\.' | sort -t. -k2 -n); do
    awk '/^desc: Trigger: Client Request: / {sub(/^desc: Trigger: Client Request: /, ""); name = $0}
         /^c?ob=/ {
             match($0, /\([0-9]+\)/)
             id = substr($0, RSTART, RLENGTH)
             if ($0 ~ /zephyrShaders64/) ours[id] = 1
             if ($0 ~ /^ob=/) object = id
             callee = $0 ~ /^cob=/ ? id : object
         }
         /^fn=/ {callee = object}
         /^calls=/ {
             if (callee in ours && !(object in ours)) {getline; entry += $2}
             callee = object
         }
         /^(summary|totals): / {total = $2}
         END {if (name != "") printf "%s %.1f %.1f\n", name, total / 4096, entry / 4096}' "$out/$dump"
done >"$out/figures"

awk -v check="$check" '
    FNR == NR {if ($0 !~ /^#/) {bound[$1] = $2; how[$1] = $3; other[$1] = $4}; next}
    {names[++count] = $1; total[$1] = $2; entry[$1] = $3}
    END {
        for (i = 1; i <= count; ++i) {
            n = names[i]; o = other[n]; text = ""; mark = ""
            if (n in bound && (o == "" || o in total)) {
                if (how[n] == "times") {
                    figure = total[n] / total[o]
                    text = sprintf("%.2f of %s times %s", figure, bound[n], o)
                } else if (how[n] == "over") {
                    figure = entry[n] - entry[o]
                    text = sprintf("%.1f of %s over %s", figure, bound[n], o)
                } else {
                    figure = entry[n]
                    text = bound[n]
                }
                if (figure > bound[n]) {mark = "  EXCEEDED"; failed = 1}
            }
            printf "%-35s %9.1f %9s  %s%s\n", n, total[n], (entry[n] > 0 ? entry[n] : ""), text, mark
        }
        if (check) for (n in bound) if (!(n in total)) {print n ": no such kernel"; failed = 1}
        exit check && failed
    }' bench/bounds.txt "$out/figures"
