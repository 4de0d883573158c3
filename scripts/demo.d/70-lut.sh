# shellcheck shell=bash
source scripts/common.sh

say "A look as a .cube file"
"$KORVANE" lut info "$DATA/warm-evening.cube"

say "The same look for a host that reads .mga, and back again with more points"
"$KORVANE" lut convert "$DATA/warm-evening.cube" "$OUT/warm-evening.mga"
"$KORVANE" lut convert "$OUT/warm-evening.mga" "$OUT/warm-evening-33.cube" --size 33
"$KORVANE" lut info "$OUT/warm-evening-33.cube"

say "What it makes of mid grey, by tetrahedra and by the eight corners"
"$KORVANE" lut apply "$DATA/warm-evening.cube" 0.18 0.18 0.18
"$KORVANE" lut apply --method trilinear "$DATA/warm-evening.cube" 0.18 0.18 0.18

say "Its curves and a slice of its cube: $OUT/warm-evening.svg"
"$KORVANE" lut plot "$DATA/warm-evening.cube" "$OUT/warm-evening.svg"

say "A damaged copy is told by its line"
sed '100d' "$DATA/warm-evening.cube" > "$OUT/damaged.cube"
"$KORVANE" lut info "$OUT/damaged.cube" || true

say "Which blend modes a compositor may exchange or group"
"$KORVANE" blend properties normal add multiply difference behind
