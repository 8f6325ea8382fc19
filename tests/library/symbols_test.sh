#!/bin/sh
# SPDX-License-Identifier: Apache-2.0
# The shared object as the linker sees it: symbols_test.sh LIBRARY CATALOGUE
# It exports two functions for each class of the catalogue, needs the language's libraries only,
# runs no code when it is loaded and keeps no variables, but for the compiler's own.
same() {
    [ "$2" = "$3" ] && return
    printf '%s: "%s", not "%s"\n' "$1" "$2" "$3"
    exit 1
}
same exports "$(nm -D --defined-only --format=posix "$1" | cut -d' ' -f1 | sort)" \
    "$(awk '$1 == "class" { print $2 "_create"; print $2 "_getAPIVersion" }' "$2" | sort)"
same libraries "$(readelf -dW "$1" | grep NEEDED | grep -vE '\[lib(stdc\+\+|m|c|gcc_s)\.so\.')" ""
same "bytes of initialisers" \
    "$(readelf -SW "$1" | sed -n 's/.* INIT_ARRAY  *[0-9a-f]* [0-9a-f]* \([0-9a-f]*\) .*/\1/p')" 000008
same variables "$(objdump -t "$1" | awk '/ \.(t?data|t?bss)\t/ { print $NF }' \
    | grep -vE '^(\.|__|completed\.|DW\.ref\.)')" ""
