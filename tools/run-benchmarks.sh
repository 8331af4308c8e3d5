#!/bin/sh
# Runs every benchmark program; each prints its ratios against a baseline
# measured in the same run.
set -eu
for b in "$1"/bench_*; do
  [ -x "$b" ] || continue
  echo "== $(basename "$b")"
  "$b" --benchmark_min_time=0.2
done
