#!/usr/bin/env bash
# Builds the release preset, runs all benchmarks (some minutes on a quiet machine) and writes their
# table to bench/README.md, and that of searches in other languages to bench/languages.md.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
scripts/configure.sh
cmake --build --preset release
bench/report.py build/release/bench/qv_bench
bench/languages.py build/release
