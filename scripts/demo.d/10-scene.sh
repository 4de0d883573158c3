# shellcheck shell=bash
source scripts/common.sh

say "A finishing project as a document"
"$KORVANE" scene check "$DATA/showreel.vzml"
began=$(date +%s%N)
"$KORVANE" scene show "$DATA/showreel.vzml"
ended=$(date +%s%N)
"$KORVANE" scene convert "$DATA/showreel.vzml" "$OUT/showreel.vzml"
printf '%d elements in %d bytes, shown in %d.%03d ms; written anew in %d bytes: %s\n' \
  "$(grep -c '<[a-z]' "$DATA/showreel.vzml")" "$(stat -c %s "$DATA/showreel.vzml")" \
  $(((ended - began) / 1000000)) $(((ended - began) / 1000 % 1000)) \
  "$(stat -c %s "$OUT/showreel.vzml")" "$OUT/showreel.vzml"
