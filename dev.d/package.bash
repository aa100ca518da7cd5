# shellcheck shell=bash
# ./dev package, ./dev test-packages and ./dev test-watch: the Debian packages for both architectures.

package_packages=(dpkg-dev lintian)
clean_root_packages=(mmdebstrap arch-test jq)
watch_guest_packages=(mmdebstrap e2fsprogs qemu-system-x86)

# dependencies PRESET PROGRAM: the Depends field for a program in the preset's build folder: the packages, and
# their versions, that hold the libraries and the symbols it uses.
dependencies() {
    local preset=$1 program=$PWD/build/$1/$2 work arch=amd64 search=()
    if [ "$preset" = i386 ]; then
        arch=i386
        local libraries=(libhbaapi2 libc6 libgcc-s1 libstdc++6 "${codec_packages[@]}")
        unpack_i386 "${libraries[@]}"
        search=("${libraries[@]/#/-S$PWD/build/i386/packages/}")
    fi
    work=$(mktemp -d -p "$scratch")
    mkdir -p "$work/debian" "$work/package/DEBIAN"
    printf 'Source: morvane\n\nPackage: morvane\nArchitecture: any\n' >"$work/debian/control"
    cp "$program" "$work/package/program"
    (cd "$work" && DEB_HOST_ARCH=$arch dpkg-shlibdeps -O "${search[@]}" package/program) |
        sed -n 's/^shlibs:Depends=//p'
}

cmd_package() {
    need "${run_packages[@]}" "${view_packages[@]}" "${package_packages[@]}"
    SOURCE_DATE_EPOCH=$(git log -1 --format=%ct) # the same sources make the same packages
    export SOURCE_DATE_EPOCH
    umask 022 # as the folders in a package are to be
    rm -rf build/packages
    local preset depends view_depends
    for preset in release i386; do
        view=ON build "$preset" morvane morvane-view completions compressed_documents
        depends=$(dependencies "$preset" morvane)
        view_depends=$(dependencies "$preset" view/morvane-view)
        cpack --config "build/$preset/CPackConfig.cmake" -B build/packages \
            -D CPACK_DEBIAN_MORVANE_PACKAGE_DEPENDS="$depends" \
            -D CPACK_DEBIAN_MORVANE-VIEW_PACKAGE_DEPENDS="$view_depends" >/dev/null
    done
    rm -rf build/packages/_CPack_Packages
    ls build/packages/*.deb
    lintian --allow-root --display-info --fail-on error,warning,info build/packages/*.deb
    echo "lintian: clean"
}

cmd_test_packages() {
    cmd_package
    need "${clean_root_packages[@]}"
    local arch
    for arch in amd64 i386; do
        echo build/packages/morvane{,-view}_*_"$arch".deb build/packages/morvane-watch_*_all.deb
    done | at_once tests/packages/install_and_run
}

# morvane-watch and the support bundles where systemd is the init: in a guest, with nights by a clock that is turned.
cmd_test_watch() {
    cmd_package
    need "${watch_guest_packages[@]}"
    as_root tests/watch/guest/build build/watch-guest
    as_root tests/watch/guest/run build/watch-guest build/packages/morvane{,-view}_*_amd64.deb build/packages/morvane-watch_*_all.deb
}
