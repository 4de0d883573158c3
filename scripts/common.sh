# shellcheck shell=bash
# What the scripts share. Each begins with: source "$(dirname "$0")/common.sh"

set -euo pipefail

root=$(cd "$(dirname "${BASH_SOURCE[0]}")/.." && pwd)
cd "$root"

# Two compilers at once at least; as many as there are processors otherwise.
jobs=$(nproc)

say() {
  printf '\n== %s\n' "$*"
}

fail() {
  printf '%s: %s\n' "$(basename "$0")" "$*" >&2
  exit 1
}

# build PRESET [TARGET...]: configures and builds, quiet unless it fails.
build() {
  local preset=$1 log
  shift
  log=$(mktemp)
  say "Building $preset"
  if ! { cmake --preset "$preset" && cmake --build --preset "$preset" -j "$jobs" \
         ${1:+--target "$@"}; } >"$log" 2>&1; then
    cat "$log"
    rm -f "$log"
    fail "the $preset build failed"
  fi
  # Warnings are worth a look even where they do not stop the build.
  grep -A4 'warning:' "$log" || true
  rm -f "$log"
}

passed=0
failed=0

# run_tests PRESET [ctest argument...]: runs the tests, adds up passed and failed.
run_tests() {
  local preset=$1 log result=0
  shift
  log=$(mktemp)
  say "Testing $preset"
  ctest --preset "$preset" -j "$jobs" --no-label-summary "$@" 2>&1 | tee "$log" || result=$?
  count_tests "$log" "$result"
  rm -f "$log"
}

# count_tests LOG RESULT: adds what the last line of ctest says; a run that told
# nothing, or failed without a failed test, counts as one failure.
count_tests() {
  local line total wrong
  line=$(grep -E '^[0-9]+% tests passed, ' "$1" | tail -n 1 || true)
  total=$(sed -E 's/.* out of ([0-9]+)$/\1/' <<<"${line:-0}")
  wrong=$(sed -E 's/.*, ([0-9]+) tests failed .*/\1/' <<<"${line:-0}")
  if [[ -z $line || ($2 -ne 0 && $wrong -eq 0) ]]; then
    wrong=$((wrong + 1))
    total=$((total + 1))
  fi
  passed=$((passed + total - wrong))
  failed=$((failed + wrong))
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

# closing_line: the last line of a run, and its exit code.
closing_line() {
  printf '\n%d passed, %d failed\n' "$passed" "$failed"
  [[ $failed -eq 0 && $passed -gt 0 ]]
}
