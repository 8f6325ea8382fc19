#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs Blender when it is missing, builds its add-on and tests it in a headless Blender.
#   usage: scripts/blender-test.sh [TEST...]    names of functions of tests/blender/addon_test.py
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing "${packages_build[@]}" "${packages_blender[@]}"

cmake --preset release >/dev/null
cmake --build --preset release --target blender_addon zsi
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
# A home of its own: neither the user's add-ons nor preferences count, and none of them change.
HOME=$folder BLENDER_USER_RESOURCES=$folder/blender TESTS="$*" \
    blender --background --factory-startup --python-exit-code 1 \
    --python tests/blender/addon_test.py -- "$PWD/build/zsi-blender.zip" "$PWD/build/zsi" "$folder"
