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
    awk '/^desc: Trigger: Client Request: /{sub(/^desc: Trigger: Client Request: /, ""); name = $0}
         /^(summary|totals): /{total = $2}
         END{if (name != "") printf "%-50s %9.1f\n", name, total / 4096}' "$out/$dump"
done
