#!/bin/sh
# SPDX-License-Identifier: MIT
# check-output.sh MACRORUN MACRO INPUT EXPECTED: the macro's output must be the expected bytes.
. "$(dirname "$0")/wine.sh"
output=$(mktemp)
trap 'rm -f "$output"' EXIT
wine "$1" "$2" "$3" > "$output" || exit 1
cmp "$output" "$4" && exit 0
diff -u "$4" "$output"
exit 1
