# shellcheck shell=bash
# ./dev demo: Morvane on a simulated host, and what morvane-view says of its log.

# The names of the simulated hosts, each with its own word on what it shows.
list_hosts() {
    local description
    for description in tests/hosts/*/host.toml; do
        printf '%-30s %s\n' "$(basename "$(dirname "$description")")" \
            "$(sed -n 's/^about = "\(.*\)"$/\1/p' "$description")"
    done
}

cmd_demo() {
    if [ "${1:-}" = --list ]; then
        list_hosts
        return
    fi
    local host=${1:-demo} description built=$PWD/build/release
    description=$PWD/tests/hosts/$host/host.toml
    if [ ! -e "$description" ]; then
        echo "./dev demo: no simulated host \"$host\"; ./dev demo --list names them" >&2
        return 2
    fi
    need "${run_packages[@]}" "${test_packages[@]}"
    tests=ON build release morvane simhost morvane-view >&2
    as_root rm -rf build/demo
    mkdir build/demo
    # However the run ends, the report shows how far it came.
    (cd build/demo && as_root "$built/simhost/simhost" "$description" -- "$built/morvane") >/dev/null || true
    (cd build/demo && "$built/view/morvane-view")
    echo "The log is in build/demo/MorvaneLogs/Morvane.log" >&2
}
