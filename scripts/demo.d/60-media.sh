# shellcheck shell=bash
# A movie gains spherical and HDR metadata; its samples stay what they were.
source scripts/common.sh

movie=tests/data/media/head-moov.mp4
changed="$OUT/spherical.mp4"

say "A movie: its atoms, with their offsets and sizes"
"$KORVANE" media tree "$movie"

say "What giving it spherical and HDR metadata would do"
change=(--spherical equirectangular --stereo top-bottom --yaw 10 --hdr "$DATA/mastering.json")
"$KORVANE" media set "$movie" "$changed" "${change[@]}" --dry-run

say "Done: its atoms again; * changed, + new, > moved"
"$KORVANE" media set "$movie" "$changed" "${change[@]}"
"$KORVANE" media tree "$changed" --against "$movie"

say "The metadata that it holds now"
"$KORVANE" media info "$changed"

if command -v ffprobe >/dev/null; then
  say "The same, as ffprobe reads it"
  ffprobe -v error -select_streams v -show_entries stream_side_data "$changed"
fi
