#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Renders every scene of scenes/gallery into docs/gallery, with a contact sheet.
#   usage: scripts/gallery.sh [NAME...]     only these, such as voSpotLight
# SAMPLES sets the samples per pixel (default 16); the pictures are denoised.
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing "${packages_build[@]}"

cmake --preset release -DZSI_BUILD_TESTS=OFF -DZSI_BUILD_BENCH=OFF >/dev/null
cmake --build --preset release
out=docs/gallery
mkdir -p "$out"
names=("$@")
if [ ${#names[@]} -eq 0 ]; then
    for scene in scenes/gallery/*.json; do
        [ "$(basename "$scene")" = stage.json ] || names+=("$(basename "$scene" .json)")
    done
fi
for name in "${names[@]}"; do
    echo "$name"
    ./build/zsi render "scenes/gallery/$name.json" -o "$out/$name.jpg" --samples "${SAMPLES:-16}" --denoise
done

sheet=()
for scene in scenes/gallery/*.json; do
    picture=$out/$(basename "$scene" .json).jpg
    [ -f "$picture" ] && sheet+=("$picture")
done
columns=7
rows=$(((${#sheet[@]} + columns - 1) / columns))
oiiotool "${sheet[@]}" --mosaic:pad=8:fit=240x180 "${columns}x${rows}" \
    --compression jpeg:75 -o "$out/contact-sheet.jpg"
echo "Contact sheet: $out/contact-sheet.jpg"
