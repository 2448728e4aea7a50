#!/usr/bin/env bash
# Installs the build tree into a scratch prefix, then builds the tiny C consumer against it twice:
# through find_package(kelstat) and through pkg-config (which places the prefix where the .pc file
# now lies, as the tree was installed elsewhere than configured). Both binaries must run and succeed.
set -euo pipefail
build=$1 consumer_src=$2 work=$3
rm -rf "$work"; mkdir -p "$work"
prefix="$work/prefix"
cmake --install "$build" --prefix "$prefix" >/dev/null

cmake -S "$consumer_src" -B "$work/cmake-build" -DCMAKE_PREFIX_PATH="$prefix" >/dev/null
cmake --build "$work/cmake-build" >/dev/null
libdir=$(dirname "$(find "$prefix" -name 'libkelstat.so.1' | head -n 1)")
LD_LIBRARY_PATH="$libdir" "$work/cmake-build/c_consumer"

export PKG_CONFIG_PATH="$libdir/pkgconfig"
cc -std=c11 -Wall -Wextra -Werror "$consumer_src/main.c" -o "$work/pc_consumer" \
   $(pkg-config --define-prefix --cflags --libs kelstat)
LD_LIBRARY_PATH="$libdir" "$work/pc_consumer"
echo "installed tree usable through CMake and pkg-config"
