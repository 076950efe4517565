#!/usr/bin/env bash
# Compares the dynamic symbols that a library defines with a reviewed list, and checks that no
# reference of the library to one of them can be bound elsewhere:
#   exported_symbols_test.sh NM READELF CXXFILT LIBRARY LIST [--update]
# A line of the list is a symbol as the linker knows it, a tab, and the same for readers. --update
# writes the list; look at its difference before it goes into the repository.
set -euo pipefail
export LC_ALL=C
nm=$1 readelf=$2 cxxfilt=$3 library=$4 list=$5

# Without the names of versions (A), which some programs print twice.
symbols=$("$nm" --dynamic --defined-only --format=posix "$library" |
    awk '$2 != "A" { print $1 }' | sort)
readable=$("$cxxfilt" <<<"$symbols")
exported=$(paste <(echo "$symbols") <(echo "$readable"))
if [ "${6-}" = --update ]; then
    echo "$exported" >"$list"
    exit
fi

faults=$(diff --unified=0 --label reviewed --label exported "$list" - <<<"$exported") || [ $? = 1 ]
looked_up=$("$readelf" --relocs --wide "$library" |
    awk '$3 ~ /^R_/ && $5 { sub("@.*", "", $5); print $5 }' | sort -u)
elsewhere=$(comm -12 <(sed 's/@.*//' <<<"$symbols" | sort) <(echo "$looked_up"))
if [ -n "$faults$elsewhere" ]; then
    printf '%s\n' "$faults" ${elsewhere:+"bound by the dynamic linker:" "$elsewhere"}
    echo "Update the list with --update if the difference is meant; see docs/embedding.md."
    exit 1
fi
