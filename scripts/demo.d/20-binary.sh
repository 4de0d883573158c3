# shellcheck shell=bash
source scripts/common.sh

# timed ARGUMENT...: runs the tool and prints how long it took, in milliseconds.
timed() {
  local began ended
  began=$(date +%s%N)
  "$KORVANE" "$@"
  ended=$(date +%s%N)
  printf '%d.%03d' $(((ended - began) / 1000000)) $(((ended - began) / 1000 % 1000))
}

say "The same project in its compact form"
to_binary=$(timed scene convert --to binary "$DATA/showreel.vzml" "$OUT/showreel.vzbml")
to_text=$(timed scene convert --to text "$OUT/showreel.vzbml" "$OUT/showreel-back.vzml")
printf 'text to binary: %d bytes to %d in %s ms\n' \
  "$(stat -c %s "$DATA/showreel.vzml")" "$(stat -c %s "$OUT/showreel.vzbml")" "$to_binary"
printf 'binary to text: %d bytes to %d in %s ms\n' \
  "$(stat -c %s "$OUT/showreel.vzbml")" "$(stat -c %s "$OUT/showreel-back.vzml")" "$to_text"
"$KORVANE" scene hash "$DATA/showreel.vzml" "$OUT/showreel.vzbml" "$OUT/showreel-back.vzml"
"$KORVANE" scene diff "$DATA/showreel.vzml" "$OUT/showreel.vzbml"
say "What an edit changed"
sed -e 's/name="Gulls"/name="Seagulls"/' -e '0,/<lane>2/s//<lane>3/' \
  "$DATA/showreel.vzml" >"$OUT/showreel-edited.vzml"
"$KORVANE" scene diff "$OUT/showreel.vzbml" "$OUT/showreel-edited.vzml" || true
