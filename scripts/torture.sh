#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Runs the long form of the tests that ctest runs for seconds, and prints their figures:
#
#   scripts/torture.sh [memory | values | profile | hosts | engines | recordings | fuzz | undefined |
#                       tidy]...
#
# Without arguments, runs all of them, which takes one to two hours on an idle machine. The figures
# are also written to Docs/reliability.md, each below the command that produced it. To repeat a
# random test, set SCRIPTRUBY_TORTURE_SEED (in the section profile CORE_TEST_SEED) to the seed that
# it printed. FUZZ_SECONDS is the time for each fuzz target (60).
#
# Sets the machine up and builds first when needed.
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

REPORT=$ROOT/Docs/reliability.md
ALL=(memory values profile hosts engines recordings fuzz undefined tidy)
failed=0

# Replaces the section's block of figures by the standard input.
keep_figures() { # keep_figures SECTION
  awk -v heading="## $1" -v figures=/dev/stdin '
    /^## / { inside = ($0 == heading) }
    inside && /^```/ {
      if (!skipping) { print; while ((getline line < figures) > 0) print line }
      skipping = !skipping
    }
    !skipping || !inside { print }' "$REPORT" >"$REPORT.new"
  mv "$REPORT.new" "$REPORT"
}

# record SECTION SHOWN COMMAND...: runs the command from the root; SHOWN is the command for users.
record() {
  local section=$1 shown=$2 log=$LOGS/torture-$1.log status=0
  shift 2
  say "-- $section"
  mkdir -p "$LOGS"
  (cd "$ROOT" && "$@") >"$log" 2>&1 </dev/null || status=$?
  { echo "\$ $shown" && sed -n 's/^figure: //p' "$log" | tr -d '\r'; } >"$log.figures"
  cat "$log.figures"
  keep_figures "$section" <"$log.figures"
  if [ "$status" != 0 ]; then
    tail -n 30 "$log" >&2
    say "error: $section failed (whole output: $log)"
    failed=1
  fi
}

long_test() { # long_test SECTION FILTER [PROGRAM]
  local program=build/release/bin/${3:-torture_tests}.exe
  record "$1" "SCRIPTRUBY_TORTURE=1 wine $program --gtest_filter='$2'" \
    env SCRIPTRUBY_TORTURE=1 timeout 14400 wine "$program" "--gtest_filter=$2"
}

fuzz() {
  local target found=build/fuzz seconds=${FUZZ_SECONDS:-60} log status=0
  for target in Tests/fuzz/corpus/*; do
    target=${target##*/}
    log=$found/$target.log
    mkdir -p "$found/$target"
    build/release/native/bin/"${target}Fuzz" -max_total_time="$seconds" -artifact_prefix="$found/" \
      "$found/$target" "Tests/fuzz/corpus/$target" >"$log" 2>&1 || status=1
    cat "$log"
    sed -En "s/^#([0-9]+)\\s+DONE +cov: ([0-9]+).*/figure: $target: \\1 inputs, \\2 edges, no difference/p" \
      "$log"
  done
  return $status
}

# Tests that fault on purpose would not notice another fault.
undefined() {
  local program out=$LOGS/undefined.out
  for program in module_tests torture_tests; do
    SCRIPTRUBY_TEST_DLL=build/release/bin/trapping/scriptruby.dll timeout 3600 \
      wine build/release/bin/$program.exe --gtest_color=no '--gtest_filter=-RandomHost*' \
      >"$out" || { cat "$out" && return 1; }
    # The last: some tests start the program once more.
    sed -n "s/^\[==========\] \(.*\) ran\..*/figure: $program: \1, no trap/p" "$out" | tail -n 1
  done
}

tidy() {
  local files=(Core/*/*.cpp Scripting/*/*.cpp Tools/*/*/*.cpp Tools/*/*/*/*.cpp)
  printf '%s\0' "${files[@]}" |
    xargs -0 -n 1 -P "$(nproc)" \
      clang-tidy-19 -p build/release --quiet --extra-arg=-Wno-unused-command-line-argument &&
    echo "figure: ${#files[@]} files, no finding"
}

run() {
  case $1 in
  memory) long_test memory '*Allocation*' ;;
  values) long_test values 'RandomCall*' ;;
  profile) long_test profile '*ProfileFunctionsDo' core_tests ;;
  hosts) long_test hosts 'RandomHost*' ;;
  engines) long_test engines 'Isolation.SurvivesManyMixedMacros' engine_tests ;;
  recordings)
    record recordings "SCRIPTRUBY_TEST_RECORDINGS=10000 wine build/release/bin/recording_tests.exe" \
      env SCRIPTRUBY_TEST_RECORDINGS=10000 timeout 3600 wine build/release/bin/recording_tests.exe
    ;;
  fuzz) record fuzz "FUZZ_SECONDS=${FUZZ_SECONDS:-60} scripts/torture.sh fuzz" fuzz ;;
  undefined) record undefined "scripts/torture.sh undefined" undefined ;;
  tidy) record tidy "scripts/torture.sh tidy" tidy ;;
  esac
}

[ $# -gt 0 ] || set -- "${ALL[@]}"
for section; do
  [[ " ${ALL[*]} " == *" $section "* ]] || STATUS=2 die "no such section: $section (there are: ${ALL[*]})"
done
prepare torture_tests recording_tests module_tests scriptruby_trapping core_tests core_native engine_tests
for section; do run "$section"; done
exit $failed
