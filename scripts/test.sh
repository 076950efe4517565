#!/usr/bin/env bash
# Installs what is missing, builds the release preset and runs all tests; arguments go to ctest:
#   scripts/test.sh                 every test
#   scripts/test.sh -R Tool/        those whose names match
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
scripts/configure.sh
cmake --build --preset release
ctest --preset release --parallel "$(nproc)" "$@"
