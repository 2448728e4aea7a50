#!/usr/bin/env bash
# Builds and runs every test. With no argument: the default preset. Arguments name other presets
# (asan, tsan), each built and tested in turn.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup-deps.sh
presets=("$@")
((${#presets[@]})) || presets=(default)
jobs=$(nproc)
for preset in "${presets[@]}"; do
  echo "== ${preset}: configure, build, test"
  cmake --preset "$preset" >/dev/null
  cmake --build "build/$preset" -j "$jobs"
  ctest --test-dir "build/$preset" --output-on-failure -j "$jobs"
done
