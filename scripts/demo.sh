#!/usr/bin/env bash
# The library's main job from end to end: installs what is missing, builds, makes a provider
# database of sample contacts, indexes it and types some searches key by key:
#   scripts/demo.sh           works in build/demo-data, which it makes anew
#   scripts/demo.sh DIR       works in DIR, which must not hold a database yet
#   scripts/demo.sh --type    ends with the keypad in this terminal; DIR may follow
set -euo pipefail
export LC_ALL=C.UTF-8 # Chinese characters are shown, whatever the machine's language
type=
if [ "${1:-}" = --type ]; then
    type=yes
    shift
fi
given=${1:+$(realpath -m "$1")}
cd "$(dirname "$0")/.."

data=${given:-build/demo-data}
tool=build/release/tools/qvlocalize

build_tool() {
    scripts/setup.sh
    scripts/configure.sh >/dev/null
    cmake --build --preset release --target qvlocalize
}

# Shows a call of the tool, without its data directory, and makes it.
run() {
    local command=$1 shown
    shift
    shown="qvlocalize $command$([ $# -eq 0 ] || printf ' %q' "$@")"
    printf '\n$ %s\n' "$shown"
    "$tool" "$command" --data-dir "$data" "$@"
}

heading() {
    printf '\n== %s ==\n' "$1"
}

build_tool
if [ -z "$given" ]; then
    rm -rf "$data"
fi
printf '\nEvery call below also has --data-dir %s\n' "$data"

heading "Sample contacts and the index"
run sample
run index
run show --limit 5

heading "Keypad digits: z h a n g s a n is 9 4 2 6 4 7 2 6"
run search 94264726 --type num --limit 3

heading "Letters: whole readings, beginnings and initials; a surname with two readings"
run search zhangs --limit 3
run search zgf --limit 3
run search chan --limit 3

heading "A typed Chinese character, then a letter"
run search 张s --limit 4

heading "Letters one by one in Latin and mixed names, # for signs and digits"
run search tom#2 --limit 3
run search wangli --limit 3

heading "Special numbers"
run search bj --type special

heading "Filters: favourites with a phone number outside group 2"
run search w --starred --phone --not-group 2 --limit 4
run search l --online --limit 4

heading "The whole index after each key, instead of narrowing the matches before it"
run search li --whole --limit 3

heading "Nothing typed: everybody, by sections"
run search "" --limit 3

heading "For programs"
run search zgl --limit 1 --json --once

heading "With your own keys: the matches follow each key"
printf '%s type --data-dir %q\n' "$tool" "$data"
if [ -n "$type" ]; then
    exec "$tool" type --data-dir "$data"
fi
