#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs what is missing, builds, renders the demo scene, says where the picture is.
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing "${packages_build[@]}"

cmake --preset release -DZSI_BUILD_TESTS=OFF -DZSI_BUILD_BENCH=OFF >/dev/null
cmake --build --preset release
mkdir -p out
./build/zsi render scenes/demo.json -o out/demo.png --samples 24 --denoise "$@"
echo "The picture: $PWD/out/demo.png"
