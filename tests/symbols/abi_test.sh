#!/usr/bin/env bash
# Compares the binary interface of the library, types included, with the recorded one:
#   abi_test.sh CMAKE BUILD_DIR LIBRARY RECORD [--update]
# LIBRARY has debug information; BUILD_DIR is a build whose installed headers tell the interface
# from the rest. RECORD is what libabigail's abidw writes, compressed. --update writes it; that is
# for changes that are meant, and a change of the interface that breaks programs also needs another
# SOVERSION. Ends with 77 where there is nothing to compare with.
set -euo pipefail
cmake=$1 build=$2 library=$3 record=$4 update=${5-}

skip() {
    echo "not run: $1"
    exit 77
}

type abidw abidiff >/dev/null 2>&1 || skip "libabigail is not installed"
[ -e "$record" ] || [ -n "$update" ] ||
    skip "compilers describe an interface in different ways, and there is no ${record##*/}"

directory=$(mktemp -d)
trap 'rm -r "$directory"' EXIT
cd "$directory"
"$cmake" --install "$build" --prefix "$PWD" >install.log
abidw --exported-interfaces-only --drop-private-types --drop-undefined-syms --no-parameter-names \
    --no-show-locs --no-comp-dir-path --no-corpus-path --no-elf-needed --no-write-default-sizes \
    --headers-dir include/QV_Localize --out-file now "$library"
if [ -n "$update" ]; then
    gzip --best --no-name <now >"$record"
else
    gunzip <"$record" >recorded
    abidiff recorded now
fi
