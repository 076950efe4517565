#!/usr/bin/env bash
# Builds the release preset, runs all benchmarks (some minutes on a quiet machine) and writes their
# table to bench/README.md.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
cmake --preset release
cmake --build --preset release --target qv_bench
bench/report.py build/release/bench/qv_bench
