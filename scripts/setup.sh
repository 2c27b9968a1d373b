#!/usr/bin/env bash
# Installs what is missing, builds the library and the ovmacro tool, and expands the examples.
set -euo pipefail
cd "$(dirname "$0")/.."
scripts/install-deps.sh gnuplot-nox  # gnuplot draws the plot of bench/compare_with_m4.sh
cmake -S . -B build/release -DCMAKE_BUILD_TYPE=Release -DOVMACRO_BUILD_TESTS=OFF -DOVMACRO_BUILD_BENCHMARKS=OFF
cmake --build build/release -j"$(nproc)"
for example in examples/*.ovm; do
  echo "== build/release/tools/ovmacro/ovmacro $example"
  build/release/tools/ovmacro/ovmacro "$example"
done
