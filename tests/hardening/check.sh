#!/usr/bin/env bash
# check.sh PROPERTY PROGRAM: whether a program has one of the properties that the shipped one must have.
set -euo pipefail
export LC_ALL=C
property=$1
program=$2

fail() {
    echo "$program: $1" >&2
    exit 1
}

header=$(readelf -Wh "$program")
segments=$(readelf -Wl "$program")
dynamic=$(readelf -Wd "$program")
imports=$(readelf -W --dyn-syms "$program" | sed 's| \[<localentry>: [0-9]*\]||' | awk '$7 == "UND" { print $8 }')

case $property in
    position_independent)
        grep -q 'Type: *DYN' <<<"$header" || fail "not position-independent: $(grep 'Type:' <<<"$header")"
        grep -q 'FLAGS_1.* PIE' <<<"$dynamic" || fail "not marked as a position-independent executable"
        ;;
    full_relro)
        grep -q 'GNU_RELRO' <<<"$segments" || fail "no segment is made read-only after relocation"
        grep -q 'BIND_NOW\|FLAGS_1.* NOW' <<<"$dynamic" || fail "symbols are bound lazily"
        ;;
    non_executable_stack)
        grep -Eq 'GNU_STACK .* RW +0x' <<<"$segments" || fail "stack: $(grep GNU_STACK <<<"$segments")"
        ;;
    no_writable_code)
        ! grep -Eq 'LOAD .* RWE ' <<<"$segments" || fail "a segment is writable and executable"
        ;;
    no_text_relocations)
        ! grep -q 'TEXTREL' <<<"$dynamic" || fail "code is patched when it is loaded"
        ;;
    stack_protected)
        grep -q '^__stack_chk_fail' <<<"$imports" || fail "no stack protector"
        ;;
    checked_libc_calls)
        for call in __vfprintf_chk __vsnprintf_chk; do
            grep -q "^$call" <<<"$imports" || fail "$call is not used"
        done
        for call in vfprintf vsnprintf vsprintf; do
            ! grep -Eq "^$call(@|\$)" <<<"$imports" || fail "$call is used unchecked"
        done
        ;;
    no_build_path)
        # The source folder, which is the third argument.
        ! grep -aqF "$3" "$program" || fail "holds the path $3"
        ;;
    no_searched_working_directory)
        # An element of the run path that is empty or relative is looked up from wherever the program is started.
        path=$(sed -nE 's/.*\((RPATH|RUNPATH)\).*\[(.*)\]$/\2/p' <<<"$dynamic")
        # shellcheck disable=SC2016 # $ORIGIN is the loader's
        [ -z "$path" ] || ! tr ':' '\n' <<<"$path" | grep -qvE '^(/|\$ORIGIN(/|$))' || fail "run path: $path"
        ;;
    *) fail "unknown property $property" ;;
esac
