#!/usr/bin/env bash
# Builds the release preset, runs all benchmarks (some minutes on a quiet machine) and writes their
# table to bench/README.md, and that of searches in other languages to bench/languages.md. --large
# measures 1,000,000 contacts instead (2 GB of disk, a quarter of an hour), into bench/large.md.
set -euo pipefail
cd "$(dirname "$0")/.."

scripts/setup.sh
scripts/configure.sh
cmake --build --preset release
if [[ ${1:-} == --large ]]; then
    exec bench/report.py build/release/bench/qv_bench --large
fi
bench/report.py build/release/bench/qv_bench
bench/languages.py build/release
