#!/usr/bin/env bash
# The shared library must export exactly the six kel_ functions and carry SONAME libkelstat.so.1.
set -euo pipefail
lib=$1
expected=$'kel_CalcNonParametricToleranceInterval\nkel_CalcParametricToleranceInterval\nkel_CreateStemAndLeafContainer\nkel_DeleteStemAndLeafContainer\nkel_FindStemAndLeafScaleInfo\nkel_RunStemAndLeaf'
actual=$(nm -D --defined-only "$lib" | awk '{print $3}' | sed 's/@.*//' | sort)
if [[ "$actual" != "$expected" ]]; then
  echo "unexpected export list of $lib:"; diff <(echo "$expected") <(echo "$actual") || true
  exit 1
fi
soname=$(readelf -d "$lib" | sed -n 's/.*(SONAME).*\[\(.*\)\]/\1/p')
if [[ "$soname" != "libkelstat.so.1" ]]; then
  echo "unexpected SONAME: '$soname'"; exit 1
fi
echo "exports and SONAME as expected"
