#!/bin/sh
# SPDX-License-Identifier: MIT
# examples.sh MACRORUN FOLDER: each macro in the folder makes the text NAME.out of NAME.in. It runs
# twice in one process and shows the same messages both times.
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../wine.sh"
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cp -r "$2" "$folder/macros"
report=$folder/report
for file in "$folder"/macros/*.in "$folder"/macros/*.out; do
  cp "$file" "${file%.*}.again.${file##*.}"
done
wine "$1" --test "$folder/macros" 2> "$report"
result=$?
cat "$report"
count=$(find "$2" -maxdepth 1 -type f ! -name '*.in' ! -name '*.out' | wc -l)
[ $result -eq 0 ] && grep -qx "macrorun: $((2 * count)) passed, 0 failed" "$report" || {
  echo "FAILED: exit code $result, $count macros to pass twice"
  exit 1
}
grep -v ' (again): \|^macrorun: ' "$report" > "$folder/first"
sed -n 's/ (again): /: /p' "$report" | diff "$folder/first" - || {
  echo "FAILED: the messages of the second runs differ"
  exit 1
}
