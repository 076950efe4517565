#!/usr/bin/env bash
# Configures the release preset; anew where CXX names another compiler than the one of last time,
# which CMake would keep without a word.
set -euo pipefail
cd "$(dirname "$0")/.."

cache=build/release/CMakeCache.txt
fresh=()
if [ -n "${CXX:-}" ] && [ -f "$cache" ] &&
    ! grep -q "^CMAKE_CXX_COMPILER:[A-Z]*=$(command -v "${CXX%% *}")\$" "$cache"; then
    fresh=(--fresh)
fi
cmake --preset release "${fresh[@]}"
