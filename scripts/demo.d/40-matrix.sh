# shellcheck shell=bash
source scripts/common.sh

say "Where a camera stands and looks: its matrix as a tracker writes it, taken apart"
cat "$DATA/camera.txt"
"$KORVANE" matrix decompose "$DATA/camera.txt"

say "The way back, from the set into the camera's view"
"$KORVANE" matrix invert "$DATA/camera.txt"
