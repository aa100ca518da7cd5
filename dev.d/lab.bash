# shellcheck shell=bash
# ./dev lab: Morvane in the laboratory's guest.

lab_packages=(qemu-system-x86 cpio kmod python3)
# Emulators of the other processors, and what a module for their kernels is built with.
foreign_lab_packages=(qemu-system-arm qemu-system-misc dpkg-dev make binutils-aarch64-linux-gnu binutils-s390x-linux-gnu)

cmd_lab() {
    need "${view_packages[@]}" "${lab_packages[@]}"
    local task=() arches=(amd64 i386) arch folder view guest guests=()
    if [ "${1:-}" = shell ]; then
        task=(shell)
        arches=(amd64)
        shift
    fi
    case ${1:-} in amd64 | i386 | arm64 | s390x) arches=("$1"); shift ;; esac
    for arch in "${arches[@]}"; do
        case $arch in
            arm64 | s390x)
                need "${foreign_lab_packages[@]}"
                folder=build/dist-${arch/arm64/aarch64}
                build_for_processor "${folder#*-}" morvane simulated_host_tests
                view=ON build release morvane-view
                view=build/release/view/morvane-view # the judge's
                ;;
            *)
                folder=build/${arch/amd64/release}
                view=ON build "${folder#*/}" morvane morvane-view
                view=$folder/view/morvane-view
                ;;
        esac
        guest=("$arch" "$folder/morvane" "$view" "${task[@]}" "$@")
        guests+=("${guest[*]}")
    done
    if [ "${task[*]}" = shell ]; then
        # shellcheck disable=SC2086 # the words of a line
        as_root lab/run ${guests[0]}
    else
        printf '%s\n' "${guests[@]}" | at_once lab/run
    fi
}
