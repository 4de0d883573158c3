# shellcheck shell=bash
# All of it to look at. The movie is the one that 60-media.sh wrote.
source scripts/common.sh

say "The whole project on one page, to look at"
# Two captions that stay too long, as an edit by hand leaves them.
sed -e 's/--> 01:00:05,600/--> 01:00:06,600/' -e 's/--> 01:00:16,100/--> 01:00:17,000/' \
  "$DATA/lighthouse.srt" >"$OUT/lighthouse.srt"
"$KORVANE" report "$DATA/showreel.vzml" "$OUT/lighthouse.srt" "$OUT/spherical.mp4" \
  "$DATA/warm-evening.cube" "$DATA/camera.txt" --before tests/data/media/head-moov.mp4 \
  -o "$OUT/report.html"
printf 'Open it in a browser: %s (%d bytes)\n' "$OUT/report.html" \
  "$(stat -c %s "$OUT/report.html")"
