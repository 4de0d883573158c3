# shellcheck shell=bash
source scripts/common.sh

say "A million frames of 1001/30000 seconds, added one by one"
"$KORVANE" time sum 1001/30000 --times 1000000
"$KORVANE" time floor 3.52 --frame 1001/24000
"$KORVANE" time remap 100100/30000 1001/30000 1/25 --exact
"$KORVANE" time "1/1000000007 + 1/998244353"

say "The showreel's clips, and what is left of them without ten seconds"
# Each clip has its start and, in a line of its own, its length in frames of 1001/24000 seconds.
sed -n -e 's/.*<clip name="\([^"]*\)".* start="\([0-9]*\) \([0-9]*\) .*/\2\/\3 \1/p' \
  -e 's/.*<length>\([0-9]*\)<.*/\1/p' "$DATA/showreel.vzml" | paste - - |
  while IFS=$'\t' read -r clip length; do
    printf '%s+%d/24000=%s\n' "${clip%% *}" $((length * 1001)) "${clip#* }"
  done >"$OUT/showreel.ranges"
"$KORVANE" ranges subtract "$OUT/showreel.ranges" 20..30 --timeline --svg "$OUT/showreel.svg"
"$KORVANE" ranges subtract "$OUT/showreel.ranges" 20..30 >"$OUT/showreel-cut.ranges"
printf '%d clips became %d pieces; drawn in %s\n' "$(wc -l <"$OUT/showreel.ranges")" \
  "$(wc -l <"$OUT/showreel-cut.ranges")" "$OUT/showreel.svg"
