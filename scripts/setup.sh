#!/usr/bin/env bash
# Installs what building and testing need and this machine lacks, from Debian's packages:
#   scripts/setup.sh          compiler (clang where CXX names it), build tools and libraries
#   scripts/setup.sh --lint   also what .ci/run checks with: clang and its tools, libabigail, Doxygen
#   scripts/setup.sh --armhf  also the cross compiler and the emulator for 32-bit ARM
#   scripts/setup.sh --java   also a JDK: without it the Java classes are neither built nor tested
#   scripts/setup.sh --bare   only what makes a bare Debian to try the two commands in
# Touches neither apt nor the network when nothing is missing.
set -euo pipefail

packages=(
    g++ cmake ninja-build python3 python3-vobject
    libsqlite3-dev libcli11-dev nlohmann-json3-dev libncurses-dev
    libgtest-dev libbenchmark-dev unicode-data pkg-config tmux
)
case "${CXX:-}" in
    clang++*) packages+=("clang${CXX#clang++}") ;;
esac
case "${1:-}" in
    --lint) packages+=(clang clang-format-14 clang-tidy-14 abigail-tools doxygen) ;;
    --armhf) packages+=(g++-arm-linux-gnueabihf qemu-user googletest) ;;
    --java) packages+=(openjdk-17-jdk-headless) ;;
    --bare) packages=(debootstrap debian-archive-keyring git) ;;
esac

is_installed() {
    [ "$(dpkg-query -W -f='${db:Status-Status}' "$1" 2>/dev/null || true)" = installed ]
}

missing=()
for package in "${packages[@]}"; do
    is_installed "$package" || missing+=("$package")
done
if [ "${#missing[@]}" -eq 0 ]; then
    exit 0
fi

as_root=()
if [ "$(id -u)" -ne 0 ]; then
    if ! command -v sudo >/dev/null; then
        echo "setup: missing packages: ${missing[*]}" >&2
        echo "setup: run as root, or install sudo or these packages" >&2
        exit 1
    fi
    as_root=(sudo)
fi

# Waits for another apt; never asks, and leaves services alone.
apt=("${as_root[@]}" env DEBIAN_FRONTEND=noninteractive NEEDRESTART_SUSPEND=1
     apt-get -q -o DPkg::Lock::Timeout=300)

echo "setup: installing ${missing[*]}"
"${apt[@]}" update || echo "setup: no fresh package lists, trying with those that are here" >&2
"${apt[@]}" install -y --no-install-recommends "${missing[@]}"
