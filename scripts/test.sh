#!/usr/bin/env bash
# Installs what is missing, builds, runs every test.
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing "${packages_build[@]}" "${packages_test[@]}"

cmake --preset release -DZSI_BUILD_TESTS=ON -DZSI_BUILD_BENCH=ON >/dev/null
cmake --build --preset release
ctest --preset release -j "$(nproc)"
