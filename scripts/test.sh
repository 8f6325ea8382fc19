#!/usr/bin/env bash
# SPDX-License-Identifier: Apache-2.0
# Installs what is missing, builds, runs every test.
#   usage: scripts/test.sh            the optimised build and its tests
#          scripts/test.sh --all      every gate that a change has to pass
#          scripts/test.sh GATE...    some of them:
#              lint         formatting, clang-tidy, cppcheck, licences
#              sanitizers   the tests under the address and undefined-behaviour sanitizers
#              clang        Clang's warnings, and the tests as Clang compiles them
#              tests        the optimised build and its tests
#              blender      the add-on in a headless Blender, which is installed for that
set -euo pipefail
cd "$(dirname "$0")/.."
. scripts/lib/packages.sh

gates=("$@")
[ $# -gt 0 ] || gates=(tests)
[ "${1:-}" != --all ] || gates=(lint sanitizers clang tests blender)
packages=("${packages_build[@]}" "${packages_test[@]}")
for gate in "${gates[@]}"; do
    case $gate in
    tests | sanitizers | blender) ;;
    lint | clang) packages+=("${packages_lint[@]}") ;;
    *)
        echo "test.sh: $gate: unknown gate (lint, sanitizers, clang, tests, blender or --all)" >&2
        exit 2
        ;;
    esac
done
install_missing "${packages[@]}"

# A preset's build and tests; further arguments go to ctest.
preset() {
    local name=$1
    shift
    cmake --preset "$name" -DZSI_BUILD_TESTS=ON >/dev/null && cmake --build --preset "$name" &&
        ctest --preset "$name" -j "$(nproc)" "$@"
}
# run GATE. With Clang what its code computes is tested; what drives the programs from outside
# (installation, Python, browsers) is not.
run() {
    case $1 in
    tests) preset release ;;
    lint) scripts/lint.sh ;;
    sanitizers) preset asan ;;
    clang) preset clang -LE 'install|python' -E '^View' ;;
    blender) scripts/blender-test.sh ;;
    esac
}

log=$(mktemp -d)
trap 'rm -rf "$log"' EXIT
summary=() failed=0
for gate in "${gates[@]}"; do
    echo "== $gate"
    SECONDS=0
    # In a condition of its own: `set -e` would not hold inside `if run`.
    set +e
    (set -e; run "$gate") 2>&1 | tee "$log/$gate"
    status=${PIPESTATUS[0]}
    set -e
    verdict=passed
    [ "$status" -eq 0 ] || { verdict=FAILED failed=1; }
    summary+=("$(printf '%-10s %s, %d:%02d' "$gate" "$verdict" $((SECONDS / 60)) $((SECONDS % 60)))")
    # What the gate's own output says of it: a reader of the last lines knows what to look for.
    summary+=("$(grep -hE '^[0-9]+% tests passed|^Total Test time|tests passed$|[^ ]+: (fatal )?error:|\(Failed\)|\(Timeout\)|: FAILED$' \
        "$log/$gate" | sed 's/^/    /' | head -20 || true)")
done

echo "== summary"
printf '%s\n' "${summary[@]}" | grep -v '^$'
exit "$failed"
