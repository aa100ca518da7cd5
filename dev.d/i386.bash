# shellcheck shell=bash
# The i386 packages that the 32-bit build links, without a foreign architecture on the host.

# unpack_i386 PACKAGE...: unpacks i386 packages, their control files included, into build/i386/packages/NAME. They
# cannot be installed beside the amd64 ones; apt looks them up in a state of its own.
unpack_i386() {
    local package missing=() target=$PWD/build/i386/packages apt=$scratch/apt
    for package in "$@"; do
        [ -e "$target/$package/DEBIAN/control" ] || missing+=("$package")
    done
    [ ${#missing[@]} -eq 0 ] && return
    mkdir -p "$apt/state/lists/partial" "$apt/cache/archives/partial" "$target"
    : >"$apt/status"
    local options=(-qq -o APT::Architecture=i386 -o APT::Architectures=i386 -o APT::Sandbox::User=root
        -o Dir::State="$apt/state" -o Dir::State::status="$apt/status" -o Dir::Cache="$apt/cache")
    apt-get "${options[@]}" update || true # an index that fails matters only if the package is not found
    for package in "${missing[@]}"; do
        (cd "$apt" && apt-get "${options[@]}" download "$package")
        rm -rf "${target:?}/$package"
        dpkg-deb --raw-extract "$apt/$package"_*_i386.deb "$target/$package"
    done
}
