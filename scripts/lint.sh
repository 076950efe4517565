#!/usr/bin/env bash
# Runs clang-tidy over the sources of the library and the tool, as they are compiled in a
# configured build directory: scripts/lint.sh [DIR], build/release by default.
set -euo pipefail
cd "$(dirname "$0")/.."

build=${1:-build/release}
if [ ! -f "$build/compile_commands.json" ]; then
    echo "lint: $build is not configured; run cmake --preset release" >&2
    exit 2
fi
java=()
if grep -q qvlocalize_jni "$build/compile_commands.json"; then # it was configured with a JDK
    java=(bindings/java)
fi
git ls-files -z Common Core DBOperator Filter LocalizerImpl MemManager Platform bindings/c \
    "${java[@]}" 'tools/*.cpp' |
    grep -z '\.cpp$' |
    xargs -0 -n 1 -P "$(nproc)" clang-tidy-14 --quiet -p "$build" \
        2> >(grep -vE 'warnings? generated\.$' >&2) # counts of what .clang-tidy leaves out
