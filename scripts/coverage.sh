#!/usr/bin/env bash
# Which lines of the library no test runs: builds with coverage counters below build/coverage, runs
# all tests and prints a table by file. Needs Debian's package gcovr.
#   scripts/coverage.sh [ctest options]
set -euo pipefail
cd "$(dirname "$0")/.."

command -v gcovr >/dev/null || { echo "coverage: install the package gcovr first" >&2; exit 2; }
cmake -G Ninja -B build/coverage -DCMAKE_BUILD_TYPE=Debug -DQV_BUILD_BENCH=OFF -DCMAKE_CXX_FLAGS=--coverage
cmake --build build/coverage
find build/coverage -name '*.gcda' -delete
ctest --test-dir build/coverage --parallel "$(nproc)" --output-on-failure "$@"
gcovr --root . --filter '(Core|LocalizerImpl|MemManager|DBOperator|Filter|Common)/' build/coverage
