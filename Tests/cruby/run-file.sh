#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# run-file.sh BIN TESTS FILE OUT LIMIT: runs one file of CRuby's tests in ruby.exe and in the
# engine, each unless OUT has its outcome. BIN is the folder of the build's programs, TESTS that of
# CRuby's tests, LIMIT a number of seconds. OUT/ruby.exe and OUT/engine get FILE.log with the
# outcomes and FILE.done with the exit codes and the output. The engine is left out when ruby.exe
# ran no test.
set -euo pipefail
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../wine.sh"
bin=$1 tests=$2 file=$3 out=$4 limit=$5
driver=$(readlink -f "$(dirname "$0")")/run-file.rb
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
mkdir "$folder/empty"
cd "$folder/empty"
export CRUBY_TESTS=$tests CRUBY_TEST_FILES=$file
export RUBY_TEST_TIMEOUT_SCALE=${RUBY_TEST_TIMEOUT_SCALE:-5}

run() {
  local status=0
  timeout -k 5 "$limit" wine "$@" "$driver" </dev/null >"$folder/output" 2>&1 || status=$?
  echo "exit code $status"
  cat "$folder/output"
}

# Tests that start another Ruby come last: it is the same one.
run_in() { # run_in SIDE PROGRAM [OPTION...]
  local done=$out/$1/$file.done
  export CRUBY_TEST_LOG=$out/$1/$file.log RUBY=Z:$2
  shift
  [ ! -e "$done" ] || return 0
  mkdir -p "${done%/*}"
  : >"$CRUBY_TEST_LOG"
  run "$@" >"$folder/done"
  if grep -q 'starts another Ruby' "$CRUBY_TEST_LOG" && [ "${CHILDREN:-}" ]; then
    CRUBY_TEST_CHILDREN=1 run "$@" >>"$folder/done"
  fi
  mv "$folder/done" "$done"
}

run_in ruby.exe "$bin/ruby/bin/ruby.exe" --disable-gems
[ "$(wc -l <"$CRUBY_TEST_LOG")" -le 2 ] || run_in engine "$bin/run_ruby.exe"
