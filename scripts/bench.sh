#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Measures the shipped programs; each figure is compared with a peer's from the same run:
#
#   scripts/bench.sh            all groups; writes Benchmarks/results.md and a chart of each group
#   scripts/bench.sh GROUP...   those only, to standard output
#
# Groups: calls dispatch runs start files module macro library. Takes some minutes on an idle
# machine; a busy one widens the spread. Sets the machine up and builds first when needed. The
# results are written only when all groups have finished.
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

PACKAGES+=(gnuplot-nox)

GROUPS_IN_ORDER=(calls dispatch runs start files module macro library)

# measure GROUP [FILE]: prints the group's section; FILE receives the numbers of its chart. The
# output passes through a file, since Wine's server would keep a pipe open.
measure() {
  local output
  output=$(mktemp)
  if ! (cd "$BUILD" && timeout 900 wine release/bin/benchmarks.exe "$@") >"$output" 2>"$output.errors"; then
    cat "$output" "$output.errors" >&2
    rm -f "$output" "$output.errors"
    die "the group $1 could not be measured"
  fi
  tr -d '\r' <"$output"
  rm -f "$output" "$output.errors"
}

describe_machine() {
  local processor
  processor=$(sed -n 's/^model name[^:]*: *//p' /proc/cpuinfo | head -n 1)
  cat <<END
# Results

Written by \`scripts/bench.sh\` on $(date -u +%Y-%m-%d), from $(git -C "$ROOT" describe --always --dirty).

$(nproc) cores ($processor), $(wine --version), load average at the start $(cut -d ' ' -f 1 /proc/loadavg).

A ratio is the median of the rounds' own ratios, with the least and the greatest; the two sides of a
round are measured in turns, so that what else the machine does hits both. A goal is met when the
median is not above it.
END
}

draw() { # draw GROUP: its chart from its numbers
  local settings="data='$WORK/$1.tsv'; result='$WORK/$1.svg'; caption='$1'"
  local kind=bars
  [ "$1" != library ] || kind=curves
  gnuplot -e "$settings" "$ROOT/Benchmarks/$kind.gp"
}

write_results() {
  local group
  WORK=$(mktemp -d "$BUILD/bench-XXXXXX")
  trap 'rm -rf "$WORK"' EXIT
  describe_machine >"$WORK/results.md"
  for group in "${GROUPS_IN_ORDER[@]}"; do
    say "-- measuring $group"
    measure "$group" "$(basename "$WORK")/$group.tsv" >>"$WORK/results.md"
    step "drawing $group" draw "$group"
    printf '\n![%s](%s.svg)\n' "$group" "$group" >>"$WORK/results.md"
  done
  mv "$WORK"/{results.md,*.svg} "$ROOT/Benchmarks/"
  cat "$ROOT/Benchmarks/results.md"
}

prepare benchmarks
if [ $# -eq 0 ]; then
  write_results
else
  for group in "$@"; do measure "$group"; done
fi
