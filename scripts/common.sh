# shellcheck shell=bash
# What the scripts share. Each begins with: source "$(dirname "$0")/common.sh"

set -euo pipefail

root=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
cd "$root"

jobs=$(nproc)
passed=0
failed=0

say() {
  printf '\n== %s\n' "$*"
}

fail() {
  printf '%s: %s\n' "$(basename "$0")" "$*" >&2
  exit 1
}

# build PRESET [TARGET...]: configures and builds, quiet unless it fails, which
# counts as a failed test.
build() {
  local preset=$1 log result=0
  shift
  log=$(mktemp)
  say "Building $preset"
  if cmake --preset "$preset" >"$log" 2>&1 &&
    cmake --build --preset "$preset" -j "$jobs" ${1:+--target "$@"} >>"$log" 2>&1; then
    # Warnings are worth a look even where they do not stop the build.
    grep -A4 'warning:' "$log" || true
  else
    cat "$log"
    echo "FAILED: the $preset build"
    failed=$((failed + 1))
    result=1
  fi
  rm -f "$log"
  return "$result"
}

# run_tests PRESET [ctest argument...]: runs the tests, shows those that do not
# pass, and adds up.
run_tests() {
  local preset=$1 log result=0
  shift
  log=$(mktemp)
  say "Testing $preset"
  ctest --preset "$preset" -j "$jobs" "$@" >"$log" 2>&1 || result=$?
  grep -vE '^ *Start +[0-9]+:|^ *[0-9]+/[0-9]+ Test +#[0-9]+: .* Passed ' "$log" | cat -s
  count_tests "$log" "$result"
  rm -f "$log"
}

# count_tests LOG RESULT: adds what ctest's closing line says. A run that told
# nothing, or failed without a failed test, counts as one failure.
count_tests() {
  local line total=0 wrong=0
  line=$(grep -E '^[0-9]+% tests passed, ' "$1" | tail -n 1 || true)
  if [[ $line =~ ([0-9]+)\ tests\ failed\ out\ of\ ([0-9]+) ]]; then
    wrong=${BASH_REMATCH[1]}
    total=${BASH_REMATCH[2]}
  fi
  if [[ $total -eq 0 || ($2 -ne 0 && $wrong -eq 0) ]]; then
    wrong=$((wrong + 1))
    total=$((total + 1))
  fi
  passed=$((passed + total - wrong))
  failed=$((failed + wrong))
}

# run_script COMMAND...: runs a script that ends with a closing line of its own, and adds that.
run_script() {
  local log result=0
  log=$(mktemp)
  "$@" 2>&1 | tee "$log" || result=$?
  if [[ $(tail -n 1 "$log") =~ ^([0-9]+)\ passed,\ ([0-9]+)\ failed$ ]]; then
    passed=$((passed + BASH_REMATCH[1]))
    failed=$((failed + BASH_REMATCH[2]))
  else
    echo "FAILED: $* (code $result, no closing line)"
    failed=$((failed + 1))
  fi
  rm -f "$log"
}

# check NAME COMMAND...: one check that is no ctest run; counts as a test.
check() {
  local name=$1
  shift
  say "$name"
  if "$@"; then
    passed=$((passed + 1))
  else
    failed=$((failed + 1))
    printf 'FAILED: %s\n' "$name"
  fi
}

# closing_line: the last line of a run; its result is the script's.
closing_line() {
  printf '\n%d passed, %d failed\n' "$passed" "$failed"
  [[ $failed -eq 0 && $passed -gt 0 ]]
}
