#!/bin/sh
# Runs every fuzz target for a short while on a copy of its seed corpus, as
# many at a time as there are processors (FUZZ_JOBS to choose).
set -eu
bin=$1
corpus=$2
seconds=$3
jobs=${FUZZ_JOBS:-$(nproc 2>/dev/null || echo 1)}

# One target in a scratch folder of its own; its last line, or its log's
# tail when it fails.
fuzz_one() {
  target=$1
  name=$(basename "$target" | sed 's/^fuzz_//')
  work=$(mktemp -d)
  mkdir "$work/corpus" "$work/tmp"
  if [ -d "$corpus/$name" ]; then cp -r "$corpus/$name/." "$work/corpus/"; fi
  if ! TMPDIR="$work/tmp" "$target" -max_total_time="$seconds" -rss_limit_mb=4096 \
       -artifact_prefix="$work/" "$work/corpus" >"$work.log" 2>&1; then
    tail -n 60 "$work.log"
    echo "fuzz target $name failed (artifacts in $work)"
    return 1
  fi
  echo "fuzzed $name for ${seconds}s: $(tail -n 1 "$work.log")"
  rm -rf "$work" "$work.log"
}

found=0
failed=0
pids=""
for target in "$bin"/fuzz_*; do
  [ -x "$target" ] || continue
  found=1
  fuzz_one "$target" &
  pids="$pids $!"
  if [ "$(echo $pids | wc -w)" -ge "$jobs" ]; then
    for pid in $pids; do wait "$pid" || failed=1; done
    pids=""
  fi
done
for pid in $pids; do wait "$pid" || failed=1; done
[ "$found" = 1 ] || echo "no fuzz targets"
[ "$failed" = 0 ] || { echo "a fuzz target failed"; exit 1; }
