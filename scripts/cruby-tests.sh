#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Runs CRuby's own test suite inside the engine and in the ruby.exe of the same build, and compares
# the outcome of each test:
#
#   scripts/cruby-tests.sh [--continue] [--children] [PATTERN...]
#
# PATTERN names files of CRuby's folder `test`, for example 'ruby/test_io*.rb'; without one, all
# files are run. Tests that start another Ruby are skipped unless --children is given. The other
# Ruby is then the same one, engine or ruby.exe, and each of these tests takes some seconds.
#
# The outcomes are kept in build/cruby-tests. Those of ruby.exe are used again as long as CRuby is
# the same, those of the engine only with --continue, which resumes an interrupted run.
#
# Tests/cruby/differences.txt lists the known differences. The exit code is 1 after any other one.
# JOBS sets how many files run at a time (2), LIMIT how many seconds a file may take (300).
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

# Libraries that are not in the package, and tests of programs other than Ruby macros.
LEFT_OUT='-ext-|drb|dtrace|fiddle|irb|mkmf|net|open-uri|openssl|psych|racc|rdoc|readline|reline'
LEFT_OUT+='|resolv|rinda|rubygems|socket|syslog|yaml|zlib'
KNOWN=$ROOT/Tests/cruby/differences.txt
continue='' CHILDREN=''
while [[ ${1:-} == --* ]]; do
  case $1 in
    --continue) continue=1 ;;
    --children) CHILDREN=1 ;;
    *) die "unknown option: $1" ;;
  esac
  shift
done
export CHILDREN

prepare run_ruby rubyscript
CRUBY=$("$ROOT/scripts/build-cruby.sh")
OUT=$BUILD/cruby-tests${CHILDREN:+/children}
mkdir -p "$OUT"
[ "$(cat "$OUT/cruby" 2>/dev/null)" = "$CRUBY" ] || rm -rf "$OUT/ruby.exe"
printf '%s\n' "$CRUBY" >"$OUT/cruby"
[ "$continue" ] || rm -rf "$OUT/engine"

files=$(cd "$CRUBY/tests/test" && for pattern in "${@:-*}"; do
  find . -path "./$pattern" -name 'test_*.rb' -type f
done | sed 's,^\./,,' | grep -Ev "^($LEFT_OUT)/" | sort -u)
[ "$files" ] || die "no test file matches $*"

run() { # run FILE...: in both, those that have no outcome yet
  printf '%s\n' "$@" |
    xargs -P "${JOBS:-2}" -I {} "$ROOT/Tests/cruby/run-file.sh" "$BUILD/release/bin" \
      "$CRUBY/tests" {} "$OUT" "${LIMIT:-300}"
}

# outcomes SIDE: "FILE TEST<tab>OUTCOME", the last outcome of each test. A file that ruby.exe cannot
# load is left out.
outcomes() {
  local file
  for file in $files; do
    [ ! -e "$OUT/engine/$file.log" ] || awk -F '\t' -v file="$file" '
      { outcome[$1] = $2 }
      END { for (test in outcome) print file " " test "\t" outcome[test] }' "$OUT/$1/$file.log"
  done | LC_ALL=C sort -t $'\t' -k 1,1
}

sed '/^#/d; /^$/d' "$KNOWN" | LC_ALL=C sort >"$OUT/known"

# "TEST<tab>OUTCOME IN RUBY.EXE<tab>OUTCOME IN THE ENGINE"
compare() {
  LC_ALL=C join -t $'\t' -a 1 -a 2 -e missing -o 0,1.2,2.2 <(outcomes ruby.exe) \
    <(outcomes engine) >"$OUT/all"
  awk -F '\t' '$2 != $3' "$OUT/all" >"$OUT/different"
  LC_ALL=C join -t $'\t' -v 1 "$OUT/different" "$OUT/known" >"$OUT/new"
}

say "-- running $(wc -w <<<"$files") files"
run $files
compare

# Some tests depend on time: only a difference that shows twice counts.
again=$(cut -d ' ' -f 1 "$OUT/new" | uniq)
if [ "$again" ]; then
  say "-- running once more: $(wc -w <<<"$again") files"
  for file in $again; do rm -f "$OUT"/{ruby.exe,engine}/"$file".{log,done}; done
  JOBS=1 run $again
  compare
fi

tests=$(grep -c '#' "$OUT/all")
different=$(grep -c '#' "$OUT/different" || true)
printf '%s files, %s tests, %s the same, %s different\n' \
  "$(cut -d ' ' -f 1 "$OUT/all" | uniq | wc -l)" "$tests" "$((tests - different))" "$different"
! sed 's/\t/: ruby.exe /; s/\t/, engine /' "$OUT/new" | grep .
