#!/usr/bin/env bash
# Fails when a C++ file that git knows is not laid out as .clang-format says;
# scripts/check-format.sh --fix lays them out.
set -euo pipefail
cd "$(dirname "$0")/.."

mode=(--dry-run -Werror)
if [ "${1:-}" = --fix ]; then
    mode=(-i)
fi
git ls-files -z '*.cpp' '*.h' | xargs -0 clang-format-14 "${mode[@]}"
