#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Writes docs/shaders/ from what the library says of itself. With --check: fails when the pages are
# not current.
set -euo pipefail
cd "$(dirname "$0")/.."
zsi=${ZSI:-build/zsi}
[ -x "$zsi" ] || { echo "reference: build first (scripts/test.sh)" >&2; exit 1; }
pages=$(mktemp -d)
trap 'rm -rf "$pages"' EXIT
"$zsi" --shader-path "$(dirname "$zsi")/shaders" info --markdown | awk -v pages="$pages" '
    /^# / {
        class = $2
        page = pages "/" class ".md"
        print "<!-- Written by `scripts/reference.sh` from the rows and comments in src. -->" > page
    }
    /^Kind: / {
        print "![" class "](../gallery/" class ".jpg)\n" > page
        print "The scene: [scenes/gallery/" class ".json](../../scenes/gallery/" class ".json)\n" > page
    }
    { print > page }'
if [ "${1:-}" = --check ]; then
    diff -r docs/shaders "$pages" && echo "reference: current"
else
    rm -f docs/shaders/*.md
    cp "$pages"/*.md docs/shaders/
fi
