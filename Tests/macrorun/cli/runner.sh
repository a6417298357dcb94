# SPDX-License-Identifier: MIT
# shellcheck shell=sh
# Sourced by the tests of macrorun, which are called with MACRORUN and FAKE_MODULE: a temporary
# folder and functions that check results. The last line of each test is `finish`.
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../../wine.sh"
exec < /dev/null
macrorun=$1
# shellcheck disable=SC2034 # for the tests that source this file
fake=$2
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cd "$folder" || exit 1
failures=0
source=

fail() {
  echo "FAILED: $*"
  failures=$((failures + 1))
}

finish() { [ $failures -eq 0 ]; }

# expect CODE TEXT [ARGUMENT...]: checks the exit code, and a text on either stream. A run
# that fails must leave standard output empty.
expect() {
  code=$1 text=$2
  shift 2
  wine "$macrorun" "$@" > out 2> err
  result=$?
  [ $result -eq "$code" ] || fail "$* ($source): exit code $result, expected $code"
  [ -z "$text" ] || cat out err | grep -qF -- "$text" || fail "$* ($source): no '$text' in: $(cat err)"
  [ "$code" -eq 0 ] || [ ! -s out ] || fail "$* ($source): printed although it failed"
}

# expect_js CODE TEXT SOURCE [OPTION...], expect_rbs: as expect, for a macro on input.txt.
expect_source() {
  extension=$1 code=$2 text=$3 source=$4
  shift 4
  printf '%s\n' "$source" > "macro.$extension"
  expect "$code" "$text" "macro.$extension" input.txt "$@"
}
expect_js() { expect_source js "$@"; }
expect_rbs() { expect_source rbs "$@"; }

# expect_lines FILE LINE...: checks the complete file.
expect_lines() {
  file=$1
  shift
  printf '%s\n' "$@" | diff - "$file" > difference || fail "$source: $file: $(cat difference)"
}
