#!/usr/bin/env bash
# Instructions per call of the kernels whose name contains FILTER, by valgrind's callgrind:
# repeatable to the instruction for one build.   usage: scripts/instructions.sh [FILTER]
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing valgrind
[ -x build/bench/kernels ] || { echo "instructions: build first (scripts/test.sh)" >&2; exit 1; }
out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
valgrind --tool=callgrind --callgrind-out-file="$out/dump" build/bench/kernels "${1:-}" \
    >"$out/log" 2>&1 || { cat "$out/log" >&2; exit 1; }
for dump in $(ls "$out" | grep '^dump\.' | sort -t. -k2 -n); do
    # The entry point: the one call, as often as there are inputs, into the shader library.
    awk '/^desc: Trigger: Client Request: /{sub(/^desc: Trigger: Client Request: /, ""); name = $0}
         /^(ob|cob)=/{if (match($0, /\([0-9]+\)/)) {
             id = substr($0, RSTART, RLENGTH)
             if ($0 ~ /zephyrShaders64/) ours[id] = 1
         }}
         /^ob=/{object = id; callee = ""}
         /^cob=/{callee = id}
         /^calls=4096 /{split($0, c, /[= ]/); if (callee in ours && !(object in ours)) {getline; if ($2 > inside) inside = $2}}
         /^calls=/{callee = ""}
         /^(summary|totals): /{total = $2}
         END{if (name != "") printf "%-50s %9.1f %9.1f\n", name, total / 4096, inside / 4096}' "$out/$dump"
done
