#!/usr/bin/env bash
# Builds the command-line tool and shows a stem-and-leaf display of a bundled sample.
set -euo pipefail
cd "$(dirname "$0")/.."
./scripts/setup-deps.sh
cmake --preset default >/dev/null
cmake --build build/default -j "$(nproc)" --target kelstat_cli >/dev/null
exec build/default/bin/kelstat stem "${1:-examples/rainfall.txt}"
