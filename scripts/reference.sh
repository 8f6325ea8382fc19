#!/usr/bin/env bash
# Writes docs/shaders/ from the parameter rows. With --check: fails when the pages are not current.
set -euo pipefail
cd "$(dirname "$0")/.."
describe=${DESCRIBE:-build/tools/describe}
[ -x "$describe" ] || { echo "reference: build first (scripts/test.sh)" >&2; exit 1; }
if [ "${1:-}" = --check ]; then
    pages=$(mktemp -d)
    trap 'rm -rf "$pages"' EXIT
    "$describe" pages "$pages" src
    diff -r docs/shaders "$pages" && echo "reference: current"
else
    "$describe" pages docs/shaders src
fi
