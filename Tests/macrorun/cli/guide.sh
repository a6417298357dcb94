#!/bin/sh
# SPDX-License-Identifier: MIT
# guide.sh MACRORUN FAKE_MODULE: the macros in the guide for macro authors and the recordings in the
# manual do what the text says.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"
guide=$root/Docs/writing-macros.md

# expect_twice CODE TEXT MACRO FILE [OPTION...]: as expect; and two runs in one process make the
# same text and show the same messages. Leaves the text of one run in `out`.
expect_twice() {
  expect "$@"
  cp out once
  cat out out > texts
  cat err err > messages
  code=$1 text=$2 macro=$3 file=$4
  shift 4
  expect "$code" "$text" "$macro" "$@" --each "$file" "$file"
  cmp texts out && grep -v '^macrorun: ' err | diff messages - ||
    fail "$(cat "$macro"): the second run differs"
  mv once out
}

# The macros, and the texts before and after some of them
awk '/^```ruby$/ { n++; file = n ".rbs"; next }
     /^```text before$/ { file = n ".in"; next }
     /^```text after$/ { file = n ".out"; next }
     /^```/ { file = ""; next }
     file { print > file }' "$guide"
ran=0
for macro in *.rbs; do
  expect 0 '' --check "$macro"
  name=${macro%.rbs}
  [ -f "$name.out" ] || continue
  expect_twice 0 '' "$macro" "$name.in"
  diff "$name.out" out > difference || fail "$(cat "$macro"): $(cat difference)"
  ran=$((ran + 1))
done
[ $ran -ge 3 ] || fail "only $ran macros with texts found in $guide"

# run CODE TEXT WORD [OPTION...]: runs the macro that contains the word on the file text
run() {
  code=$1 text=$2 macro=$(grep -l -- "$3" ./*.rbs)
  shift 3
  expect_twice "$code" "$text" "$macro" text "$@"
}
printf 'a Colour and colour\n' > text
run 0 '2 replaced' colour
expect_lines out 'a color and color'
printf 'one\ntwo\n' > text
run 0 '' prefix --arg 'prefix=| '
expect_lines out '| one' '| two'
printf '{"a": [1' > text
run 1 'rbs:6:3: This is no JSON' JSON.parse
# Longer than an argument
{ echo '['; seq 300 | sed 's/^/  /; $!s/$/,/'; echo ']'; } > long
sed 's/^ *//' long > text
run 0 '' JSON.parse
cmp out long || fail "a long text: $(cat err)"
seq 300 > text
run 0 '' partition
cmp out text || fail "many lines: $(cat err)"

# Recordings
awk '/^```json$/ { n++; file = n ".json"; next }
     /^```/ { file = ""; next }
     file { print > file }' "$guide" "$root/Docs/macrorun.md"
for steps in 1.json 2.json; do
  expect 0 '' --record $steps -o "$steps.rbs"
  expect 0 '' --check "$steps.rbs"
done
printf 'one\ntwo\n' > text
expect 0 '' 1.json.rbs text
expect_lines out one '- said "hello"' two

finish
