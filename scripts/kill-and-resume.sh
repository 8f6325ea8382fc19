#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# Kills a render at random moments and compares the picture with that of an undisturbed one.
# Usage: scripts/kill-and-resume.sh [KILLS [SCENE [OPTIONS...]]]
set -eu
cd "$(dirname "$0")/.."
kills=${1:-100}
scene=${2:-scenes/gallery/corvid_Mtl_Ward.json}
[ $# -gt 2 ] && shift 2 || set -- --size 160x120 --samples 400
zsi=${ZSI:-build/zsi}
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
"$zsi" render "$scene" -o "$folder/want.exr" "$@" -q
done=0
runs=0
while [ "$done" -lt "$kills" ]; do
    runs=$((runs + 1))
    "$zsi" render "$scene" -o "$folder/a.exr" "$@" -q --resume --checkpoint-every 0 &
    pid=$!
    sleep "$(awk "BEGIN { srand($runs); print 0.2 + 0.8 * rand() }")"
    if kill -KILL $pid 2>/dev/null; then
        done=$((done + 1))
    fi
    if wait $pid 2>/dev/null; then # it was faster
        cmp "$folder/a.exr" "$folder/want.exr"
    fi
done
"$zsi" render "$scene" -o "$folder/a.exr" "$@" -q --resume
cmp "$folder/a.exr" "$folder/want.exr"
echo "$done kills: the same picture"
