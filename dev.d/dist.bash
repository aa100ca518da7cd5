# shellcheck shell=bash
# ./dev dist, ./dev test-dist and ./dev test-processors: the programs for every server, as tarballs and RPMs, in
# build/dist.

dist_packages=(cmake ninja-build clang llvm xz-utils rpm rpmlint libc6-i386) # the last runs what was built for i686
test_dist_packages=(mmdebstrap arch-test busybox-static diffoscope-minimal)
other_processors=(aarch64 ppc64le s390x)
other_processor_packages=(qemu-user binutils-aarch64-linux-gnu binutils-powerpc64le-linux-gnu binutils-s390x-linux-gnu)

# The mirror of Debian's archive that this host installs from.
debian_mirror() {
    # shellcheck disable=SC2016 # the dollar is apt's
    apt-get indextargets --format '$(REPO_URI)' "Component: main" \
        "Codename: $(sed -n 's/^VERSION_CODENAME=//p' /etc/os-release)" | head -n 1
}

# sysroot PROCESSOR: lays out the headers and libraries of packaging/sysroot/packages in build/sysroot/PROCESSOR. The
# packages stay in build/sysroot/packages; one that is there and has the right checksum is not fetched again.
sysroot() {
    local root=build/sysroot/$1 kept=build/sysroot/packages mirror wanted checksum place package link target
    wanted=$(grep -E "^($1|all) " packaging/sysroot/packages)
    [ "$wanted" != "$(cat "$root.packages" 2>/dev/null)" ] || return 0
    rm -rf "$root" "$root.packages"
    mkdir -p "$root" "$kept"
    mirror=$(debian_mirror)
    while read -r _ checksum place; do
        package=$kept/$(basename "$place")
        sha256sum --status --check <<<"$checksum  $package" 2>/dev/null ||
            /usr/lib/apt/apt-helper -o APT::Sandbox::User=root download-file "$mirror$place" "$package" "SHA256:$checksum" >&2
        dpkg-deb --extract "$package" "$root"
    done <<<"$wanted"
    while read -r link target; do # what is absolute there would lead out to this host's libraries
        ln -sfnr "$root$target" "$root/$link"
    done < <(find "$root" -lname '/*' -printf '%P %l\n')
    echo "$wanted" >"$root.packages"
}

# configure_dist PROCESSOR OPTION...: the build for a processor, its sysroot laid out.
configure_dist() {
    case " ${other_processors[*]} " in *" $1 "*) need "${other_processor_packages[@]}" ;; esac
    sysroot "$1"
    cmake --preset "dist-$1" "${@:2}" >/dev/null
}

# tarball PROCESSOR VERSION: what `cmake --install` lays out, checked, and a README, as an archive of the same bytes each
# time.
tarball() {
    local folder=$scratch/morvane-$2-linux-$1 program
    for program in morvane morvane-view; do
        cmake --install "build/dist-$1" --component "$program" --strip --prefix "$folder" >/dev/null
        tests/dist/check_program "$folder"/*bin/"$program"
    done
    rm -r "${folder:?}/lib" # plugins, for folders that an archive does not reach
    cp packaging/tarball/README "$folder"
    tar --create --directory "$scratch" --format=ustar --sort=name --owner=0 --group=0 --numeric-owner \
        --mode=u=rwX,go=rX --mtime="@$SOURCE_DATE_EPOCH" "$(basename "$folder")" | xz -9 >"build/dist/$(basename "$folder").tar.xz"
}


cmd_dist() {
    need "${dist_packages[@]}"
    SOURCE_DATE_EPOCH=$(git log -1 --format=%ct) # the same sources make the same bytes
    export SOURCE_DATE_EPOCH
    umask 022 # as the folders in an RPM are to be
    rm -rf build/dist
    mkdir -p build/dist
    local processor version
    case ${1-} in
        "") set -- x86_64 i686 ;;
        all) set -- x86_64 i686 "${other_processors[@]}" ;;
    esac
    for processor in "$@"; do
        configure_dist "$processor"
        cmake --build --preset "dist-$processor" -- --quiet morvane morvane-view completions compressed_documents
        version=$(sed -n 's/^CMAKE_PROJECT_VERSION:STATIC=//p' "build/dist-$processor/CMakeCache.txt")
        tarball "$processor" "$version"
        cpack --config "build/dist-$processor/CPackConfig.cmake" -B build/dist >"$scratch/cpack" 2>&1 ||
            { cat "$scratch/cpack" >&2; return 1; }
        rm -rf build/dist/_CPack_Packages
    done
    (cd build/dist && sha256sum -- *.tar.xz *.rpm >SHA256SUMS)
    rpmlint --config packaging/rpm/rpmlint.toml build/dist/*.rpm
    ls -l build/dist
}

cmd_test_dist() {
    need "${run_packages[@]}" "${test_packages[@]}" "${test_dist_packages[@]}"
    cmd_dist
    tests=ON build release morvane simhost simulated_host_tests
    local processor release
    for processor in x86_64 i686; do
        as_root tests/dist/install_rpms build/dist/morvane-[0-9]*."$processor".rpm build/dist/morvane-view-*."$processor".rpm \
            build/dist/morvane-watch-*.noarch.rpm "build/sysroot/$processor"
    done
    for release in bullseye bookworm trixie; do
        for processor in x86_64 i686; do
            echo "$release" build/dist/*-linux-"$processor".tar.xz build/release
        done
    done | at_once tests/dist/run_in_clean_root
    tests/dist/build_again x86_64 build/dist
}

# build_for_processor PROCESSOR TARGET...: what ./dev dist builds for it, with tests.
build_for_processor() {
    need "${dist_packages[@]}" "${test_packages[@]}"
    configure_dist "$1" -DMORVANE_TESTS=ON
    cmake --build --preset "dist-$1" -- --quiet "${@:2}"
}

# The unit tests and morvane-view's reports, on processors that this machine has not: under qemu-user.
cmd_test_processors() {
    need qemu-user
    [ $# -gt 0 ] || set -- "${other_processors[@]}"
    local processor failed=()
    for processor in "$@"; do
        echo "== $processor"
        build_for_processor "$processor" all
        ctest --preset "dist-$processor" || failed+=("$processor: unit tests")
        printf '#!/bin/sh\nexec qemu-%s -L "%s" "%s" "$@"\n' "$processor" "$PWD/build/sysroot/$processor" \
            "$PWD/build/dist-$processor/view/morvane-view" >"$scratch/morvane-view"
        chmod +x "$scratch/morvane-view"
        /usr/bin/python3 tests/view/golden_test.py "$scratch/morvane-view" || failed+=("$processor: morvane-view")
    done
    [ ${#failed[@]} -eq 0 ] || { printf 'failed: %s\n' "${failed[@]}" >&2; return 1; }
}
