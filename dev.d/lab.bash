# shellcheck shell=bash
# ./dev lab: Morvane in the laboratory's guest.

lab_packages=(qemu-system-x86 cpio kmod python3)

cmd_lab() {
    need "${view_packages[@]}" "${lab_packages[@]}"
    local task=() arches=(amd64 i386) arch preset failed=()
    if [ "${1:-}" = shell ]; then
        task=(shell)
        arches=(amd64)
        shift
    fi
    case ${1:-} in amd64 | i386) arches=("$1"); shift ;; esac
    for arch in "${arches[@]}"; do
        preset=release
        [ "$arch" = i386 ] && preset=i386
        view=ON build "$preset" morvane morvane-view
        as_root lab/run "$arch" "build/$preset/morvane" "build/$preset/view/morvane-view" "${task[@]}" "$@" || failed+=("$arch")
    done
    [ ${#failed[@]} -eq 0 ] || { echo "laboratory failed: ${failed[*]}" >&2; return 1; }
}
