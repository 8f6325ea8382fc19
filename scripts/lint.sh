#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Formatting, clang-tidy and cppcheck over the sources, licences of sources and assets; silent but
# for what is wrong.
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh
install_missing "${packages_build[@]}" "${packages_test[@]}" "${packages_lint[@]}"
check_spdx=yes

failed=0
complain() {
    echo "$*" >&2
    failed=1
}

dirs=(include src host tests tools bench examples python blender)
find "${dirs[@]}" -name '*.h' -o -name '*.cpp' | xargs clang-format-14 --dry-run -Werror || failed=1

# Every source says its licence near its top; the note beside the assets that of every asset.
if [ "$check_spdx" = yes ]; then
    while read -r file; do
        head -3 "$file" | grep -q 'SPDX-License-Identifier: Apache-2.0' ||
            complain "$file: no line SPDX-License-Identifier: Apache-2.0 among the first three"
    done < <(find "${dirs[@]}" scripts cmake -name '*.h' -o -name '*.cpp' -o -name '*.py' -o -name '*.sh' \
        -o -name CMakeLists.txt -o -name '*.cmake')
fi
while read -r file; do
    grep -qF "\`${file#assets/}\`" assets/README.md || complain "$file: not in assets/README.md"
done < <(find assets -type f -not -name README.md)

# The compile commands of Clang's build: its warnings, and no flag that only GCC knows. One for
# each file.
cmake --preset clang -B build-lint -DZSI_UNITY=OFF >/dev/null
find src host -name '*.cpp' | xargs -P "$(nproc)" -n 2 clang-tidy-14 -p build-lint --quiet \
    2> >(grep -v ' warnings\? generated' >&2) || failed=1

cppcheck --quiet --std=c++20 --language=c++ --enable=warning,style,performance,portability \
    --inline-suppr --suppressions-list=.cppcheck-suppressions --error-exitcode=1 \
    -I include -I src src include || failed=1

[ "$failed" -eq 0 ] && echo "lint: clean"
exit "$failed"
