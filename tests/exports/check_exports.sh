#!/bin/sh
# Compares the library's dynamic symbol table with the expected export lists
# (one name a line, # comments). Every listed name must be exported, and
# nothing else may be.
set -eu
lib=$1
lists=$2
expected=$(mktemp)
actual=$(mktemp)
trap 'rm -f "$expected" "$actual"' EXIT
cat "$lists"/*.txt | sed -e 's/#.*//' -e 's/[[:space:]]*$//' | grep -v '^$' | sort -u >"$expected"
nm -D --defined-only "$lib" | awk '{print $3}' | sed 's/@.*//' | grep -v '^$' |
  grep -v -E '^(_init|_fini|_edata|_end|__bss_start)$' | sort -u >"$actual"
status=0
missing=$(comm -23 "$expected" "$actual")
extra=$(comm -13 "$expected" "$actual")
if [ -n "$missing" ]; then echo "not exported:"; echo "$missing"; status=1; fi
if [ -n "$extra" ]; then echo "exported but not listed:"; echo "$extra"; status=1; fi
echo "$(wc -l <"$expected") names expected, $(wc -l <"$actual") exported"
exit $status
