#!/bin/bash
# Usage: hardening.sh FILE...
#
# Reads from programs and shared libraries whether they were built with what
# makes a fault harder to exploit: addresses that vary, tables that are read-only
# after loading, no stack that can be executed, guarded stack frames and checked
# calls of the C library.
set -euo pipefail

fail() {
    echo "hardening: $1"
    exit 1
}

checked=
for file in "$@"; do
    header=$(readelf --wide --file-header "$file")
    segments=$(readelf --wide --program-headers "$file")
    dynamic=$(readelf --wide --dynamic "$file")
    symbols=$(readelf --wide --dyn-syms "$file")
    grep -q 'Type: *DYN ' <<<"$header" ||
        fail "$file is loaded at a fixed address"
    grep -q ' GNU_RELRO ' <<<"$segments" ||
        fail "$file keeps its tables of addresses writable"
    grep -Eq '\((BIND_NOW|FLAGS)\).*BIND_NOW|\(FLAGS_1\).*NOW' <<<"$dynamic" ||
        fail "$file looks functions up only when they are called"
    grep -Eq ' GNU_STACK .* RW +0x' <<<"$segments" ||
        fail "$file has a stack that can be executed"
    grep -q ' __stack_chk_fail' <<<"$symbols" ||
        fail "$file has no guarded stack frames"
    # A file has none if all of its calls could be checked by the compiler.
    ! grep -Eq ' __[a-z]+_chk(@| |$)' <<<"$symbols" || checked=1
done
[[ $checked ]] || fail "the C library is called unchecked"
