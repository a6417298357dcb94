#!/bin/sh
# SPDX-License-Identifier: MIT
# examples.sh MACRORUN FOLDER: each macro in the folder makes of its text what it should, and none is
# passed over.
. "$(dirname "$0")/../wine.sh"
report=$(mktemp)
trap 'rm -f "$report"' EXIT
wine "$1" --test "$2" 2> "$report"
result=$?
cat "$report"
count=$(find "$2" -maxdepth 1 -type f ! -name '*.in' ! -name '*.out' | wc -l)
[ $result -eq 0 ] && grep -qx "macrorun: $count passed, 0 failed" "$report" || {
  echo "FAILED: exit code $result, $count macros to pass"
  exit 1
}
