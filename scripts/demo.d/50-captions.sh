# shellcheck shell=bash
source scripts/common.sh

say "Captions: a tape's subtitles, which begin at one hour, onto the frames of a film that begins at zero"
retimed="$OUT/lighthouse-film.srt"
"$KORVANE" captions check "$DATA/lighthouse.srt"
"$KORVANE" captions convert "$DATA/lighthouse.srt" "$retimed" --frame 1001/24000 --offset -01:00:00 --tags

# Side by side: the times of the tape, those of the film, the text.
paste -d '|' <("$KORVANE" captions show "$DATA/lighthouse.srt") <("$KORVANE" captions show "$retimed") |
  awk -F '|' '{ printf "%s  |%s\n", substr($1, 1, 32), substr($2, 5) }'

say "Captions: what is wrong with a file, and what can be saved"
broken="$OUT/broken.srt"
printf '\n1\n00:00:01.000 -> 00:00:03\nCaf\xe9, at nine.\n3\n00:00:05,000 --> 00:00:04,000\n<blink>Late!</blink>\n' >"$broken"
"$KORVANE" captions check "$broken" --repair "$OUT/repaired.srt"
cat "$OUT/repaired.srt"
