#!/bin/sh
# Installs the built library into a scratch prefix, then builds and runs a
# small application against it with CMake and with pkg-config.
set -eu
build=$1
src=$2
cc=$3
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
cmake --install "$build" --prefix "$work/prefix" >/dev/null
cmake -S "$src/project" -B "$work/cmake-build" -DCMAKE_PREFIX_PATH="$work/prefix" >/dev/null
cmake --build "$work/cmake-build" >/dev/null
LD_LIBRARY_PATH=$(dirname "$(find "$work/prefix" -name 'libtessarine.so' | head -n 1)") \
  "$work/cmake-build/consumer"
pcdir=$(dirname "$(find "$work/prefix" -name tessarine.pc | head -n 1)")
flags=$(PKG_CONFIG_PATH="$pcdir" pkg-config --cflags --libs tessarine)
# shellcheck disable=SC2086
"$cc" -std=c99 -o "$work/pc-consumer" "$src/consumer.c" $flags
LD_LIBRARY_PATH=$(PKG_CONFIG_PATH="$pcdir" pkg-config --variable=libdir tessarine) "$work/pc-consumer"
