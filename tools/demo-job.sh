#!/bin/sh
# The main job, on the samples the repository ships: a poster image through a
# tile bitmap file (levels, CMYK, black and white, back out as images) and a
# sign drawing cut into HPGL, lines only and with arcs. Outputs go to out/.
set -eu
tool=${1:-build/tools/cli/tessarine}
out=${2:-out}
mkdir -p "$out"
rm -f "$out"/poster*.tsr
say() { printf '%s\n' "$*"; }
run() { "$tool" "$@"; }

say "== The poster (samples/poster.png) through a tile bitmap file"
run import samples/poster.png "$out/poster.tsr" --layout rgb
run levels "$out/poster.tsr" --count 3 --quiet
run info "$out/poster.tsr" | sed -n '1,3p;/sub-bitmaps/p'
run info --json "$out/poster.tsr" > "$out/poster.json"
say "   details as JSON in $out/poster.json"
run export "$out/poster.tsr" "$out/poster-level2.png" --sub 2
run convert "$out/poster.tsr" "$out/poster-cmyk.tsr" --layout cmyk
run export "$out/poster-cmyk.tsr" "$out/poster-cmyk.tif" --tiff-cmyk
run export "$out/poster-cmyk.tsr" "$out/poster-proof.png"
run convert "$out/poster.tsr" "$out/poster-bw.tsr" --layout bw
run export "$out/poster-bw.tsr" "$out/poster-bw.png"
say ""
say "== The sign (samples/sign.svg) as cutter commands, 0.1 mm tolerance"
run cut samples/sign.svg "$out/sign.plt" --tolerance 0.1
run cut samples/sign.svg "$out/sign-arcs.plt" --tolerance 0.1 --arcs
say ""
say "Done: the outputs are in $out/ (tile files .tsr, images, HPGL .plt)."
