# shellcheck shell=bash
# ./dev memcheck: the unit tests, and Morvane on the simulated hosts, under valgrind.

memcheck_packages=(valgrind)

# A status of its own tells that memcheck, and not the program, found something. What is still reachable at exit
# is meant: the log's stream, which exit flushes. A test's own operator new, one that finds no memory, stays.
memcheck=(valgrind --quiet --error-exitcode=99 --leak-check=full "--errors-for-leak-kinds=definite,indirect,possible"
    --child-silent-after-fork=yes --soname-synonyms=somalloc=nouserintercepts)

cmd_memcheck() {
    need "${run_packages[@]}" "${test_packages[@]}" "${memcheck_packages[@]}"
    tests=ON build release all
    local built=$PWD/build/release failed=() program description status
    for program in "$built"/tests/*_tests; do
        case $program in */simhost_tests | */simulated_host_tests) continue ;; esac # they only start others
        status=0
        "${memcheck[@]}" "$program" --gtest_brief=1 >"$scratch/output" 2>&1 || status=$?
        [ $status -eq 0 ] || { failed+=("$program"); tail -n 60 "$scratch/output"; }
        echo "memcheck $(basename "$program"): status $status"
    done
    for description in "$PWD"/tests/hosts/*/host.toml "$PWD/tests/faults/host.toml"; do
        status=0
        (cd "$scratch" && as_root "$built/simhost/simhost" "$description" -- "$(command -v valgrind)" \
            "${memcheck[@]:1}" "$built/morvane") >"$scratch/output" 2>&1 || status=$?
        [ $status -le 1 ] || { failed+=("$description"); cat "$scratch/output"; }
        echo "memcheck $(basename "$(dirname "$description")"): status $status"
    done
    [ ${#failed[@]} -eq 0 ] || { echo "failed: ${failed[*]}" >&2; return 1; }
}
