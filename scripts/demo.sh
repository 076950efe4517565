#!/usr/bin/env bash
# The library's main job from end to end: installs what is missing, builds, makes a provider
# database of sample contacts, indexes it and types some searches key by key:
#   scripts/demo.sh [DIR]     works in DIR, build/demo-data by default, which is made anew
set -euo pipefail
cd "$(dirname "$0")/.."

data=${1:-build/demo-data}
tool=build/release/tools/qvlocalize

build_tool() {
    scripts/setup.sh
    cmake --preset release >/dev/null
    cmake --build --preset release --target qvlocalize
}

# Shows a call of the tool and makes it.
run() {
    local command=$1
    shift
    printf '\n\033[1m$ qvlocalize %s' "$command"
    printf ' %q' "$@"
    printf '\033[0m\n'
    "$tool" "$command" --data-dir "$data" "$@"
}

heading() {
    printf '\n== %s ==\n' "$1"
}

build_tool

heading "Sample contacts and the index"
run sample --force
run index
run show --limit 5

heading "Keypad digits: z h a n g s a n is 9 4 2 6 4 7 2 6"
run search 9426472 --type num --limit 3

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
run search lgs --limit 1 --json --once
