#!/usr/bin/env bash
# Builds everything for 32-bit ARM with Debian's cross compiler and runs all tests on the emulated
# processor; arguments go to ctest. Where Debian's packages for it cannot be had, says so in one
# line and succeeds: the native result stands.
#   scripts/test-armhf.sh                 every test
#   scripts/test-armhf.sh -R MemManager/  those whose names match
set -euo pipefail
cd "$(dirname "$0")/.."

root=$PWD/build/armhf-root
log=$PWD/build/armhf-setup.log
toolchain=$PWD/cmake/toolchain-armhf.cmake

# Header-only libraries are the same for every processor: their files are copied from here.
header_packages=(libcli11-dev nlohmann-json3-dev)
armhf_packages=(libsqlite3-0:armhf libsqlite3-dev:armhf libncurses-dev:armhf
                libncurses6:armhf libncursesw6:armhf libtinfo6:armhf)

skip() {
    echo "test-armhf: not run: $1 (details in build/armhf-setup.log)"
    exit 0
}

as_root() {
    if [ "$(id -u)" -eq 0 ]; then "$@"; else sudo "$@"; fi
}

# The armhf packages are only downloaded and unpacked: they cannot be installed beside the native
# ones. Not all package lists of the architecture have to arrive, as long as these packages do.
download_packages() {
    if ! dpkg --print-foreign-architectures | grep -qx armhf; then
        as_root dpkg --add-architecture armhf || return 1
        added_architecture=yes
    fi
    as_root apt-get -q -o DPkg::Lock::Timeout=300 update ||
        echo "no fresh package lists, trying with those that are here"
    (cd "$1" && apt-get -q download "${armhf_packages[@]}")
}

# Leaves the machine's apt as it was.
forget_architecture() {
    if [ "${added_architecture:-}" = yes ]; then
        as_root dpkg --remove-architecture armhf >>"$log" 2>&1 || true
    fi
}

copy_headers() {
    local package file
    for package in "${header_packages[@]}"; do
        dpkg -L "$package" | grep -E '/include/|/cmake/' | while read -r file; do
            if [ -f "$file" ]; then cp --parents "$file" "$1"; fi
        done
    done
}

build_googletest() {
    cmake -G Ninja -S /usr/src/googletest -B "$1" -DCMAKE_TOOLCHAIN_FILE="$toolchain" \
        -DCMAKE_BUILD_TYPE=Release -DCMAKE_INSTALL_PREFIX="$2/usr" -DBUILD_GMOCK=OFF
    cmake --build "$1"
    cmake --install "$1"
}

# Makes the folder of what the project links; it appears under its name only when it is complete.
make_root() {
    local work=$root.tmp package
    rm -rf "$work"
    mkdir -p "$work/packages"
    download_packages "$work/packages" >>"$log" 2>&1 ||
        skip "Debian's armhf packages of SQLite or ncurses cannot be had here"
    for package in "$work"/packages/*.deb; do
        dpkg -x "$package" "$work"
    done
    # One folder for all libraries, and a link that does not leave it.
    cp -a "$work"/lib/. "$work/usr/lib/"
    ln -sf libtinfo.so.6 "$work/usr/lib/arm-linux-gnueabihf/libtinfo.so"
    copy_headers "$work"
    build_googletest "$work/googletest" "$work" >>"$log" 2>&1
    echo "${armhf_packages[*]}" >"$work/contents"
    rm -rf "$root"
    mv "$work" "$root"
}

mkdir -p build
trap forget_architecture EXIT
scripts/setup.sh --armhf >"$log" 2>&1 ||
    skip "Debian's cross compiler, qemu-user or googletest cannot be installed here"
if [ "$(cat "$root/contents" 2>/dev/null)" != "${armhf_packages[*]}" ]; then
    make_root
fi

cmake --preset armhf
cmake --build --preset armhf
ctest --preset armhf --parallel "$(nproc)" "$@"
