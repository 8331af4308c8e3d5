#!/bin/sh
# Runs every fuzz target for a short while on a copy of its seed corpus.
set -eu
bin=$1
corpus=$2
seconds=$3
found=0
for target in "$bin"/fuzz_*; do
  [ -x "$target" ] || continue
  found=1
  name=$(basename "$target" | sed 's/^fuzz_//')
  work=$(mktemp -d)
  mkdir "$work/corpus" "$work/tmp"
  if [ -d "$corpus/$name" ]; then cp -r "$corpus/$name/." "$work/corpus/"; fi
  echo "fuzzing $name for ${seconds}s"
  if ! TMPDIR="$work/tmp" "$target" -max_total_time="$seconds" -rss_limit_mb=4096 \
       -artifact_prefix="$work/" "$work/corpus" >"$work.log" 2>&1; then
    tail -n 60 "$work.log"
    echo "fuzz target $name failed"
    exit 1
  fi
  tail -n 1 "$work.log"
  rm -rf "$work" "$work.log"
done
[ "$found" = 1 ] || echo "no fuzz targets"
