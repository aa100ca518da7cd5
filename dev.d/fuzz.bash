# shellcheck shell=bash
# ./dev fuzz: every fuzz target for a while, and what the kept corpora reach.

fuzz_packages=(clang libclang-rt-14-dev llvm "${view_packages[@]}")

# The parsing code: what the fuzz targets are there for. All of morvane-view works on what its reader found.
fuzzed_sources=(scsi fc/identity host/iscsi_listing.cpp host/logical_tree.cpp multipath view)

cmd_fuzz() {
    need "${run_packages[@]}" "${fuzz_packages[@]}"
    cmake --preset fuzz >/dev/null
    cmake --build --preset fuzz -- --quiet fuzz_targets
    local seconds=${1:-10} target folder work=$PWD/build/fuzz/work failed=() profiles=() programs=()
    rm -rf "$work"
    for folder in tests/fuzz/corpus/*/; do
        target=$(basename "$folder")
        local program=$PWD/build/fuzz/tests/fuzz/fuzz_$target
        mkdir -p "$work/$target"
        programs+=(-object "$program")
        profiles+=("$work/$target.profraw")
        # What is new goes to the build folder; the corpus in the sources holds what somebody chose to keep.
        if ! LLVM_PROFILE_FILE=/dev/null "$program" -max_total_time="$seconds" -timeout=10 -rss_limit_mb=2048 \
            -artifact_prefix="$work/found-$target-" "$work/$target" "$folder" >"$work/$target.log" 2>&1; then
            failed+=("$target")
            tail -n 40 "$work/$target.log"
        fi
        LLVM_PROFILE_FILE=$work/$target.profraw "$program" -runs=0 "$folder" >/dev/null 2>&1 || failed+=("$target")
        printf '%-18s %s\n' "$target" "$(sed -n 's/^Done \([0-9]*\) runs in \([0-9]*\) .*/\1 inputs in \2 s/p' "$work/$target.log")"
    done
    llvm-profdata-14 merge -o "$work/corpora.profdata" "${profiles[@]}"
    echo "coverage of the parsing code by the corpora alone:"
    llvm-cov-14 report -instr-profile "$work/corpora.profdata" "${programs[@]:1}" "${fuzzed_sources[@]}" 2>/dev/null |
        awk '/^Filename|\.cpp|^TOTAL/ { printf "%-28s %10s %10s\n", $1, $10, $13 }' |
        sed 's/^Filename.*/Filename                          lines   branches/'
    echo
    [ ${#failed[@]} -eq 0 ] || { echo "failed: ${failed[*]}" >&2; return 1; }
}
