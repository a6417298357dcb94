#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# dump-tables.sh OUTPUT COMPILER ARGUMENT...: writes the compiler's dump of every virtual table, one
# line a slot, the destructor's line under one name whatever the compiler calls it.
set -euo pipefail
output=$1
shift
object=$(mktemp)
trap 'rm -f "$object"' EXIT
"$@" -o "$object" -Xclang -fdump-vtable-layouts |
  sed -n -e "/^VFTable for /,/^$/p" |
  sed -e "s/^VFTable for //" -e "s/ ([0-9]* entr.*)\.\?$//" -e "s/ *$//" \
      -e "s/\(  *[0-9]* | \).*\[\(scalar\|vector\) deleting\].*/\1deleting destructor/" >"$output"
[ -s "$output" ]
