#!/bin/sh
# SPDX-License-Identifier: MIT
# output.sh MACRORUN FAKE_MODULE: output files; a file is replaced completely or not at all.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"

printf 'old\r\nno end' > original
echo '@tarn.set_line(1, @tarn.get_line(1) + "+")' > macro.rbs
printf 'old+\r\nno end' > changed

# unchanged WHAT, replaced WHAT: checks input.txt, and that no temporary file is left.
unchanged() { cmp original input.txt || fail "$1: the file has changed"; beside "$1"; }
replaced() { cmp changed input.txt || fail "$1: not the macro's text"; beside "$1"; }
beside() { [ -z "$(ls -d ./*~ 2> /dev/null)" ] || fail "$1: left: $(ls -d ./*~)"; }

cp original input.txt
expect 0 '' macro.rbs input.txt -o new.txt
cmp changed new.txt || fail 'a new file'
unchanged '-o'
expect 0 '' macro.rbs input.txt -o new.txt
cmp changed new.txt || fail 'a file that was there'
expect 0 '' --in-place macro.rbs input.txt
replaced '--in-place'
[ ! -s out ] || fail '--in-place prints'
# The new file has the attributes of the old one, if the file system has any
wine attrib +h input.txt > attributes 2>&1
wine attrib input.txt > attributes 2>&1
expect 0 '' -i macro.rbs input.txt
wine attrib input.txt > attributes.now 2>&1
diff attributes attributes.now || fail 'attributes'
cp original input.txt
expect 0 '' macro.rbs input.txt --repeat 3
printf 'old+++\r\nno end' | cmp - out || fail '--repeat'
echo '@tarn.message("run"); @tarn.write("+"); raise "no" if @tarn.cursor_column == 3' > fails.rbs
expect 1 'no (RuntimeError)' fails.rbs input.txt --repeat 4
[ "$(grep -c '^run$' err)" -eq 2 ] || fail "--repeat goes on after a failure: $(cat err)"

# --each
mkdir each
for i in 1 2 3; do echo "$i" > "each/$i"; done
expect 0 '3 of 3 files done, 0 failed' macro.rbs --each each/1 each/2 each/3
expect_lines out 1+ 2+ 3+
expect 2 '2 of 3 files done, 1 failed' -i macro.rbs --each each/1 each/missing each/3
expect_lines each/3 3+
source='raise "no" if @tarn.get_line(1) == "2"; @tarn.write("x")'
echo "$source" > some.rbs
expect 1 '2 of 3 files done, 1 failed' -i some.rbs --each each/1 each/2 each/3
grep -qx 'macrorun: each/2: failed' err || fail 'which text an error is about'
expect_lines each/2 2
expect_lines each/1 x1+
echo > each/4.txt && touch each/4.txt~ && mkdir each/5.TXT
expect 0 '4 of 4 files done' macro.rbs --each 'each\?' 'each/*.txt'
rm -r each/4* each/5*
expect 2 'each/*.xyz: no such file' macro.rbs --each 'each/*.xyz'
expect 4 '0 of 2 files done, 1 failed, 1 not started' --module "$fake" -i macro.rbs --each each/1 each/2
! grep -q '\[1/3\]' err || fail 'progress without a terminal'
if command -v script > /dev/null; then
  timeout 20 script -qec "wine '$macrorun' -i macro.rbs --each each/1 each/2" terminal > /dev/null 2>&1
  grep -q '\[1/2\] each/1' terminal || fail "no progress on a terminal: $(cat terminal)"
  # A terminal shows every letter
  echo 'Zoë → 10 €' > letters.txt
  timeout 20 script -qec "wine '$macrorun' macro.rbs letters.txt" terminal > /dev/null 2>&1
  grep -q 'Zoë → 10 €' terminal || fail "a text on a terminal: $(cat terminal)"
  { sleep 2; printf 'typed\r'; sleep 1; printf '\004\r'; sleep 1; } | timeout 20 script -qec "wine '$macrorun' macro.rbs - -o typed.txt" terminal > /dev/null 2>&1
  expect_lines typed.txt typed+
fi

# A file that cannot be replaced is refused before the macro runs
echo '@tarn.message("has run")' > says.rbs
cp original input.txt
chmod a-w input.txt
for option in '-i input.txt' 'input.txt -o input.txt'; do
  expect 2 'write-protected' says.rbs $option
  ! grep -q 'has run' err || fail "$option: the macro has run"
done
unchanged 'write-protected'
chmod u+w input.txt
expect 2 'missing.txt' -i macro.rbs missing.txt
expect 2 'it is a folder' macro.rbs input.txt -o each
expect 2 'it is a folder' macro.rbs each
echo text > aux.c
expect 2 'the name is that of a Windows device' macro.rbs aux.c
expect 2 'cannot write nowhere' macro.rbs input.txt -o nowhere/new.txt

# The macro fails, makes a wrong call, is stopped or faults
while read -r code options; do
  echo '@tarn.set_line(1, "new")' > bad.rbs
  read -r source
  echo "$source" >> bad.rbs
  # shellcheck disable=SC2086
  expect "$code" '' -i bad.rbs input.txt $options
  unchanged "$source $options"
done << CASES
1
raise "no"
1
@tarn.set_line(1)
1 --keep-going
@tarn.set_line(1)
1
syntax error (
3 --timeout 0.3
loop {}
4 --module $fake
nothing
CASES

# The disk is full (simulated by a limit of the file size); the temporary name is taken
echo '@tarn.write("+")' > macro.rbs
head -c 300000 /dev/zero | tr '\0' 'x' > large
cp large input.txt
(
  trap '' XFSZ
  ulimit -f 100
  wine "$macrorun" -i macro.rbs input.txt 2> err
)
result=$?
[ $result -eq 2 ] && grep -q 'cannot write input.txt' err || fail "failing write: $result, $(cat err)"
cmp large input.txt || fail 'failing write: the file has changed'
beside 'failing write'
cp original input.txt
mkdir 'input.txt.macrorun~'
expect 2 'cannot write input.txt.macrorun~' -i macro.rbs input.txt
cmp original input.txt || fail 'the name is taken: the file has changed'
rmdir 'input.txt.macrorun~'

# Killed at a random moment, the process leaves the old or the new file, and the next run works
head -c 2000000 /dev/zero | tr '\0' 'x' > original
(printf '+' && cat original) > changed
now() { date +%s%N; }
cp original input.txt
begin=$(now)
expect 0 '' -i macro.rbs input.txt
replaced 'a large file'
duration=$(($(now) - begin))
old=0 new=0 i=0
while [ $i -lt 20 ]; do
  cp original input.txt
  wine "$macrorun" -i macro.rbs input.txt 2> /dev/null &
  # Most of the time passes before the text is written.
  moment=$((duration * (50 + i * 3) / 100 + $(date +%N | sed 's/^0*//') % 5000000))
  sleep "$(printf '%d.%09d' $((moment / 1000000000)) $((moment % 1000000000)))"
  kill -9 $! 2> /dev/null
  wait $! 2> /dev/null
  if cmp -s original input.txt; then old=$((old + 1)); else new=$((new + 1)); fi
  cmp -s original input.txt || cmp -s changed input.txt || fail "killed: $(wc -c < input.txt) bytes"
  i=$((i + 1))
done
echo "killed twenty times: $old times the old file, $new times the new one"
cp original input.txt
expect 0 '' -i macro.rbs input.txt
replaced 'after kills'

finish
