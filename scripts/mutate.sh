#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Breaks the module on purpose, in one place at a time, and tells which breaks the tests catch:
#
#   scripts/mutate.sh [COUNT [SEED]]
#   scripts/mutate.sh --only MUTANT...     those, by number or as FILE:LINE[:KIND]
#   scripts/mutate.sh --list               all mutants and their numbers
#
# Fails when less than 95 % are caught of those for which Tests/mutation/survivors.txt does not tell
# why nobody can see them. Works on a copy in build/mutation, with a Wine prefix of its own; the output
# of each mutant's tests is in build/mutation/logs, under its number. Sets the machine up first when
# needed.
set -euo pipefail
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

PACKAGES+=(python3 python3-clang-19 rsync)
WORK=$BUILD/mutation
export WINEPREFIX=$WORK/wineprefix

CRUBY=$("$ROOT/scripts/build-cruby.sh")
PCRE2=$("$ROOT/scripts/build-pcre2.sh")
mkdir -p "$WORK"
exec 9>"$BUILD/.lock"
flock 9
set_up
exec 9>"$WORK/.lock"
flock -n 9 || die "another run is at work in $WORK"
start_wine 900 9>&- # longer than any build takes
exec nice /usr/bin/python3 -B "$ROOT/Tests/mutation/mutate.py" \
  --root "$ROOT" --work "$WORK" --cruby "$CRUBY" --pcre2 "$PCRE2" "$@"
