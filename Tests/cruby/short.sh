#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# short.sh RUN_RUBY TESTS LIST: files of CRuby's tests in the engine, all of them twice in one
# process. Both times they have the outcomes in LIST: a line for each file, and one for each test
# that neither passed nor was skipped.
set -euo pipefail
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../wine.sh"
run_ruby=$1 list=$3
driver=$(readlink -f "$(dirname "$0")")/run-file.rb
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cd "$folder"
touch log
export CRUBY_TESTS=$2 CRUBY_TEST_LOG=$folder/log RUBY=Z:${run_ruby%/*}/ruby/bin/ruby.exe
CRUBY_TEST_FILES=$(sed -n 's/^\([a-z]\S*\) .*/\1/p' "$list" | paste -sd ' ')
export CRUBY_TEST_FILES
status=0
times=$((2 * $(wc -w <<<"$CRUBY_TEST_FILES")))
wine "$run_ruby" --times=$times "$driver" </dev/null >output 2>&1 || status=$?

# The outcomes of a pass, as the list has them. A file's own lines have no "#".
summary() { # summary PASS
  awk -F '\t' -v pass="$1" '
    !/#/ && $2 == "started" { file = $1; runs[file]++; count = 0; delete outcome }
    /^[^\t]*#/ { if (!($1 in outcome)) order[++count] = $1; outcome[$1] = $2 }
    !/#/ && $2 == "passed" && runs[file] == pass {
      number["passed"] = number["skipped"] = 0
      others = ""
      for (i = 1; i <= count; ++i) {
        test = order[i]
        if (outcome[test] in number) number[outcome[test]]++
        else others = others "\n  " test " " outcome[test]
      }
      print file " " number["passed"] " passed " number["skipped"] " skipped" others
    }' log
}
for pass in 1 2; do
  sed '/^#/d' "$list" | diff - <(summary $pass) || { echo "FAILED: pass $pass" && status=1; }
done
[ "$status" = 0 ] || { tail -n 100 output && grep -aE $'\t(failed|error)' log; }
exit "$status"
