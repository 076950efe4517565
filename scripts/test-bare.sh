#!/usr/bin/env bash
# Runs scripts/demo.sh and scripts/test.sh where nobody has prepared anything: in a bare Debian made
# by debootstrap, which holds git and a clone of this checkout's last commit and nothing else. First
# as root, then as a user with sudo, and then the tests without a network.
#   scripts/test-bare.sh            Debian 12
#   scripts/test-bare.sh trixie     Debian 13
# Needs root, minutes and 2 GB; packages come from the mirror of this machine's apt. Where such a
# root cannot be made, says so in one line and succeeds.
set -euo pipefail
cd "$(dirname "$0")/.."

suite=${1:-bookworm}
log=$PWD/build/bare-$suite.log
checkout=/srv/checkout # in the root
user=tester

skip() {
    echo "test-bare: not run: $1"
    exit 0
}

# Runs a command in the background, so that a signal ends the script at once and the command with it.
run() {
    local result=0
    "$@" >>"$log" 2>&1 &
    job=$!
    wait "$job" || result=$?
    job=
    return "$result"
}

clean_up() {
    if [ -n "${job:-}" ]; then
        kill "$job" 2>/dev/null || true
        wait "$job" 2>/dev/null || true
    fi
    if [ -n "${root:-}" ]; then
        rm -rf --one-file-system "$root"
    fi
}

# All mounts are made in a namespace of their own and go with it, however the command ends: nothing
# is ever mounted below a folder that is removed.
in_namespace() {
    exec unshare --mount --pid --fork --kill-child "$@"
}

# in_root NETWORK USER command...: in the checkout, as after a login; NETWORK is online or offline.
in_root() {
    local network=() as_user=$2
    if [ "$1" = offline ]; then
        network=(--net)
    fi
    shift 2
    in_namespace "${network[@]}" sh -euc '
        root=$1 user=$2
        shift 2
        mount -t proc proc "$root/proc"
        mount --rbind /dev "$root/dev"
        exec chroot "$root" setpriv --reuid "$user" --regid "$user" --init-groups --reset-env \
            env -C "'"$checkout"'" "$@"' sh "$root" "$as_user" "$@"
}

# step NAME command...: runs one step, its output in the log and the end of it here.
step() {
    local name=$1 begin=$SECONDS
    shift
    printf '\n=== %s ===\n' "$name" >>"$log"
    if ! run "$@"; then
        tail -n 60 "$log"
        printf '=== %s, %s: FAILED; its output is in %s ===\n' "$suite" "$name" "$log"
        exit 1
    fi
    printf '=== %s, %s: ok, %d s ===\n' "$suite" "$name" "$((SECONDS - begin))"
}

# The mirror of the first plain suite that apt knows; updates and security come from elsewhere.
find_mirror() {
    apt-get indextargets --format '$(RELEASE) $(COMPONENT) $(REPO_URI)' 'Created-By: Packages' |
        awk '$1 ~ /^[a-z]+$/ && $2 == "main" && mirror == "" { mirror = $3 } END { print mirror }'
}

# debootstrap takes proxies from the environment, apt in the root from its configuration.
find_proxies() {
    local apt_http= apt_https=
    eval "$(apt-config shell apt_http Acquire::http::Proxy apt_https Acquire::https::Proxy)"
    export http_proxy=${http_proxy:-$apt_http} https_proxy=${https_proxy:-$apt_https}
}

network_settings() {
    apt-config dump Acquire | grep -E '^Acquire::(Check-|Retries |ForceIP)' || true
    printf 'Acquire::%s::Proxy "%s";\n' http "$http_proxy" https "$https_proxy"
}

make_root() {
    find_proxies
    run in_namespace debootstrap --variant=minbase "$suite" "$root" "$mirror" ||
        skip "debootstrap cannot make a root of $suite here (details in $log)"
    network_settings >"$root/etc/apt/apt.conf.d/01network"
    cp -L /etc/resolv.conf /etc/hosts "$root/etc/"
    if [[ $mirror == https:* ]]; then
        cp -L --parents /etc/ssl/certs/ca-certificates.crt "$root"
    fi
    mkdir "$root$checkout"
}

# This checkout may belong to somebody else, and may be shallow or without a branch.
copy_last_commit() {
    git config --file "$root/gitconfig" safe.directory '*'
    GIT_CONFIG_GLOBAL=$root/gitconfig \
        git clone --quiet --bare --depth 1 "file://$PWD" "$root/srv/checkout.git"
}

# A package is missing, so that the user's sudo is needed.
hand_over_to_user() {
    in_root online root sh -euc "
        apt-get -q install -y --no-install-recommends sudo
        apt-get -q remove -y unicode-data
        useradd --create-home $user
        echo '$user ALL=(ALL) NOPASSWD: ALL' >/etc/sudoers.d/$user
        chown -R $user: ."
}

if [ "$(id -u)" -ne 0 ]; then
    skip "only root can make a bare Debian"
fi
mirror=$(find_mirror 2>/dev/null || true)
case $mirror in
    http://* | https://*) ;;
    *) skip "apt has no mirror of Debian here" ;;
esac
mkdir -p build
: >"$log"
scripts/setup.sh --bare >>"$log" 2>&1 || skip "debootstrap and git cannot be installed here"
unshare --mount --pid --fork true 2>>"$log" || skip "nothing may be mounted here"
if ! git -c safe.directory='*' diff --quiet HEAD; then
    echo "test-bare: changes that are not committed are left out"
fi

trap clean_up EXIT
trap 'exit 130' INT
trap 'exit 143' TERM HUP
root=$(mktemp -d "${TMPDIR:-/var/tmp}/qv_bare.XXXXXX")
chmod 755 "$root"
make_root
step "the last commit" copy_last_commit
step "git" in_root online root sh -euc "
    apt-get -q update
    apt-get -q install -y --no-install-recommends git
    git clone /srv/checkout.git ."
step "demo as root" in_root online root scripts/demo.sh
step "tests as root" in_root online root scripts/test.sh
tail -n 12 "$log"
step "a user with sudo, one package missing" hand_over_to_user
step "demo as the user" in_root online "$user" scripts/demo.sh
step "tests as the user, without a network" in_root offline "$user" scripts/test.sh
tail -n 12 "$log"
