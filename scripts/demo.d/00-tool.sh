# shellcheck shell=bash
# The steps see KORVANE (the tool), DATA (the sample files) and OUT (where to write).
source scripts/common.sh

say "The tool"
"$KORVANE" --version
