#!/usr/bin/env bash
# Formatting, clang-tidy and cppcheck over the sources; silent but for what is wrong.
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing "${packages_build[@]}" clang-format-14 clang-tidy-14 cppcheck

dirs=()
for dir in include src host tests tools bench; do
    [ -d "$dir" ] && dirs+=("$dir")
done
failed=0

find "${dirs[@]}" -name '*.h' -o -name '*.cpp' | xargs clang-format-14 --dry-run -Werror || failed=1

# A build tree of clang's own: its warnings too, and no flag that only GCC knows.
cmake --preset clang -DZSI_BUILD_TESTS=OFF -DZSI_BUILD_BENCH=OFF -B build-lint >/dev/null
find src host -name '*.cpp' | xargs -P "$(nproc)" -n 2 clang-tidy-14 -p build-lint --quiet \
    2> >(grep -v ' warnings\? generated' >&2) || failed=1

cppcheck --quiet --std=c++20 --language=c++ --enable=warning,style,performance,portability \
    --inline-suppr --suppressions-list=.cppcheck-suppressions --error-exitcode=1 \
    -I include -I src src include || failed=1

[ "$failed" -eq 0 ] && echo "lint: clean"
exit "$failed"
