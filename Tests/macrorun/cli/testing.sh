#!/bin/sh
# SPDX-License-Identifier: MIT
# testing.sh MACRORUN FAKE_MODULE: --test and --promote: results, differences, files.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"

# Folders without tests
mkdir empty folder folder/inner.rbs
expect 2 '--test empty: no macros in this folder' --test empty
expect 2 '--test missing: no such folder or macro' --test missing
echo '@tarn.write("x")' | tee macro.rbs > macro.txt
expect 2 'missing.rbs: no such folder or macro' --test missing.rbs
expect 2 'macro.txt' --test macro.txt
expect 2 '--test' --test folder macro.rbs
expect 2 '--test' --test folder -o out.txt
expect 2 '--test' --test folder --each macro.rbs
expect 2 '--test' --test folder --in-place
expect 2 '--test' --promote macro.rbs

# Three languages on one text, a macro without a text; other files are ignored, nothing is written
echo 'tarn.document_end(); tarn.write(tarn.argument("what")); tarn.message("JScript")' > folder/same.js
echo 'tarn.document_end : tarn.write tarn.argument("what")' > folder/same.vbs
echo '@tarn.document_end; @tarn.write(@tarn.argument("what"))' > folder/same.rbs
echo '@tarn.write(@tarn.prompt("?") + @tarn.line_count.to_s)' > folder/empty.rbs
printf 'a\r\n' > folder/same.in
printf 'a\r\nb' > folder/same.out
printf 'yes0' > folder/empty.out
echo 'this runs nowhere' > folder/notes.txt
find folder -type f | sort | xargs cksum > before
expect 0 '' --test folder --arg what=b --answer yes
expect_lines err 'folder/same.js: JScript' 'macrorun: 4 passed, 0 failed'
expect 1 'macrorun: 0 passed, 4 failed' --test folder/ --arg what=c --answer no
[ "$(grep -c '^+c$' err)" -eq 3 ] && [ "$(grep -c '^+no0$' err)" -eq 1 ] || fail "not each its argument: $(cat err)"
expect 1 'macrorun: 0 passed, 4 failed' --test folder
expect 0 '4 passed' --test folder --arg what=b --answer yes --trace --profile
grep -q '^folder/same.rbs: argument("what") -> "b"' err && grep -q '^argument  *3 ' err || fail "reports: $(cat err)"
find folder -type f | sort | xargs cksum | diff before - || fail '--test has written'

# A complete difference; the empty macro does not change NAME.in
mkdir diff
: > diff/d.rbs
printf '1\r\n2\r\n3\r\n4\r\n5\t \r\n6\r\n7\r\n8\r\n9\r\n10\r\n11\r\n12\r\n13\r\n\033\377\r\n\303\244\302\240' > diff/d.out
printf '1\r\n2\r\n3\r\n4\r\n5 \t\r\n6\r\n7\r\n8\r\n9\r\n10\r\n11\r\n12\r\nnew\r\n13\n\033\377\r\n\303\244 \n' > diff/d.in
expect 1 '' --test diff
expect_lines err 'diff/d.rbs: the text differs from d.out' '--- d.out' '+++ d.rbs' \
  '@@ -2,7 +2,7 @@' ' 2' ' 3' ' 4' '-5<TAB><SPACE><CR>' '+5 <TAB><CR>' ' 6' ' 7' ' 8' \
  '@@ -10,6 +10,7 @@' ' 10' ' 11' ' 12' '-13<CR>' '+new<CR>' '+13' ' <U+001B><0xFF>' \
  '-ä<U+00A0>' '\ the text ends without a line end' '+ä<SPACE>' 'macrorun: 0 passed, 1 failed'

# Lines that differ look different
mkdir alike
i=10
while read -r pair; do
  i=$((i + 1))
  : > alike/$i.rbs
  printf "${pair% *}" > alike/$i.in
  printf "${pair#* }" > alike/$i.out
done << 'PAIRS'
a\n a\r\n
a\n a
a\n a\040\n
\ta\n \040\040\040\040\040\040\040\040a\n
a\302\240b\n a\040b\n
\303\251\n e\314\201\n
\357\273\277a\n a\n
a\342\200\213b\n ab\n
a\033[1mb\n ab\n
\377\n \376\n
\355\240\200\n \377\n
\302\205\n \n
a\rb\n ab\n
a\n\n a\n
PAIRS
expect 1 'macrorun: 0 passed, 14 failed' --test alike
awk '/^(---|\+\+\+|[^-+\\])/ { next } /^\\/ { lines[n] = lines[n] $0; next } { lines[++n] = $0 }
     END { for (i = 1; i < n; i++)
             if (lines[i] ~ /^-/ && substr(lines[i], 2) == substr(lines[i + 1], 2)) bad = 1
           exit bad || n < 27 }' err ||
  fail "a difference that cannot be seen: $(cat err)"
grep -qx -- '-e<U+0301>' err || fail 'a combining mark is not shown'
LC_ALL=C tr -d '\n\040-\176\303\251' < err | LC_ALL=C od -c | grep -q '033\|377\|\\r' && fail 'raw bytes in a difference'

# Errors, wrong calls, stops and faults
mkdir bad
echo 'raise "oops"' > bad/a.rbs
echo 'tarn.goto_line(7);' > bad/b.js
: > bad/c.rbs
touch bad/a.out bad/b.out bad/c.out
expect 1 'macrorun: 1 passed, 2 failed' --test bad
grep -q '^bad/a.rbs:1:1: oops' err && grep -q '^bad/b.js: goto_line: ' err && ! grep -q '^@@' err || fail "errors: $(cat err)"
expect 1 'macrorun: 1 passed, 2 failed' --test bad --keep-going
echo 'loop {}' > bad/b.rbs
echo 'tarn.write("x");' > bad/d.js
: > bad/d.out
expect 3 'macrorun: 0 passed, 4 failed, 0 promoted, 1 not started' --test bad --timeout 2 --promote
grep -q '^bad/b.rbs:1:1: timed out' err || fail "who timed out: $(cat err)"
[ ! -s bad/d.out ] || fail 'promoted after a stop'
expect 4 'macrorun: 0 passed, 1 failed, 4 not started' --test bad --module "$fake"
rm bad/b.rbs bad/d.*
chmod a-r bad/c.out
[ -r bad/c.out ] || expect 2 'cannot read the file bad/c.out' --test bad
chmod a+r bad/c.out
expect 2 'missing.dll' --test bad --module missing.dll

# Several cases of a macro in two languages; texts without a macro
mkdir cases
echo 'tarn.document_end(); tarn.write("!");' > cases/a.js
echo '@tarn.message("Ruby"); raise "oops" if @tarn.get_text == "c"; @tarn.document_end; @tarn.write("!")' | tee cases/a.rbs > cases/b.rbs
echo '@tarn.write("own ")' > cases/a.own.rbs
printf a > cases/A.In; printf 'a!' > cases/a.out
printf b > cases/a.long.in; printf 'b!' > cases/A.long.out
touch cases/a.lnog.out
printf o > cases/a.own.in; printf 'own o' > cases/a.own.out
printf c | tee cases/b.first.in cases/c.in > cases/a..in
expect 1 'macrorun: 5 passed, 1 failed' --test cases
grep -qx 'cases/a.rbs (long): Ruby' err && grep -qx 'macrorun: cases/b.rbs (first): failed' err || fail "cases: $(cat err)"
[ "$(grep -cE 'cases/(c.in|a..in|a.lnog.out) belongs to no macro' err)" -eq 3 ] && [ "$(grep -c belongs err)" -eq 3 ] || fail "orphans: $(cat err)"
expect 0 'macrorun: 2 passed, 0 failed' --test cases/a.js
[ "$(wc -l < err)" -eq 1 ] || fail "one macro: $(cat err)"
printf d > cases/b.first.in
expect 0 'macrorun: promoted cases/b.first.out' --test cases/b.rbs --promote
cd cases || exit 1
expect 0 '{"type":"test","macro":"A.js","case":"long","passed":true}' --test A.js --errors json
cd .. || exit 1

# --promote writes the text of each macro that ran without an error, completely or not at all
mkdir new
for name in a b c d; do echo '@tarn.write("new\n")' > new/$name.rbs; done
echo 'tarn.write("newer\n");' > new/b.js
echo '@tarn.write("new\n"); raise "oops"' > new/c.rbs
echo 'tarn.write("new\n");' > new/d.js
for name in b c; do echo old > new/$name.out; done
expect 1 'new/a.rbs: no a.out (create it with --promote)' --test new
grep -qx '+new' err || fail "what --promote would write: $(cat err)"
[ ! -e new/a.out ] || fail 'written without --promote'
expect 1 'macrorun: 0 passed, 3 failed, 3 promoted' --test new --promote
grep -q '^new/b.out: not promoted: its macros make different texts: b.js, b.rbs' err || fail "disagreeing: $(cat err)"
cat new/a.out new/b.out new/c.out new/d.out > all
expect_lines all new old old new
expect 1 'macrorun: 3 passed, 3 failed, 0 promoted' --test new --promote
rm new/b.* new/c.*
expect 0 'macrorun: 3 passed, 0 failed' --test new
echo old > new/a.out
chmod a-w new/a.out
expect 2 'write-protected' --test new --promote
expect_lines new/a.out old
chmod u+w new/a.out
mkdir new/a.out.macrorun~
expect 2 'cannot write new/a.out.macrorun~' --test new --promote
expect_lines new/a.out old
rmdir new/a.out.macrorun~
expect 0 'macrorun: 2 passed, 0 failed, 1 promoted' --test new --promote
grep -qx -- '-old' err && grep -qx '+new' err && grep -qx 'macrorun: promoted new/a.out' err || fail "promoted unseen: $(cat err)"

# JSON; colour on a terminal
expect 1 '' --test bad --errors json
if command -v python3 > /dev/null; then
  python3 - << 'PYTHON' || fail "JSON: $(cat err)"
import json
lines = [json.loads(line) for line in open('err', 'rb')]
assert [(x['macro'], x['passed']) for x in lines if x['type'] == 'test'] == \
    [('bad/b.js', False), ('bad/a.rbs', False), ('bad/c.rbs', True)]
assert [x['kind'] for x in lines if x['type'] == 'error'] == ['call', 'script']
PYTHON
fi
expect 1 '{"type":"test","macro":"diff/d.rbs","passed":false,"diff":"--- d.out' --test diff --errors json
if command -v script > /dev/null; then
  timeout 20 script -qec "wine '$macrorun' --test diff" terminal > /dev/null 2>&1
  for line in '-13<CR>' '+new<CR>'; do
    grep -q "$(printf '\033')\[[0-9;]*m$line" terminal || fail "no colour: $(cat -v terminal)"
  done
fi

finish
