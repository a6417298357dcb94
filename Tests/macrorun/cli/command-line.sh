#!/bin/sh
# SPDX-License-Identifier: MIT
# command-line.sh MACRORUN FAKE_MODULE: usage, exit codes, wrong calls, texts and paths.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"

# The command line
printf 'text\n' > input.txt
echo 'tarn.line_count();' > macro.js
touch macro.xyz macro.rb
expect 0 'set_line(line, text)' --functions
expect 0 '--in-place' --help
[ "$(wc -l < out)" -le 50 ] && ! grep -q '.\{81\}' out || fail '--help does not fit a screen'
expect 0 'RubyScript' --version
expect 0 'VBScript' --version --description "$(dirname "$macrorun")/languages/vbs.qwsh"
for time in 2s -1 0 nan; do
  expect 2 "--timeout: expected a number of seconds above 0, such as 2 or 0.5, got \"$time\"" \
    --timeout "$time" macro.js
done
while IFS='|' read -r arguments text; do
  eval "expect 2 '$text' $arguments" < /dev/null
done < "$root/Tests/macrorun/cli/wrong-command-lines.txt"

# Exit codes and errors
expect_js 0 'text' 'tarn.message("done");'
expect 0 'Debug: GetIDsOfNames call succeeded.' --trace macro.js
expect_js 1 'Syntax error' 'x = = 1;'
expect_js 1 'macro.js:2:' "$(printf 'tarn.write("x");\nnothing.here();')"
expect_js 1 'unknown macro function nothing (see' 'tarn.nothing();'
expect_js 1 'unknown macro function lineCount; did you mean line_count? (see' 'tarn.lineCount();'
expect_js 0 '' 'try { tarn.nothing(); } catch (error) {}'
expect 1 "Error creating 'No.Engine'" --engine No.Engine macro.js
echo 'tarn.message("as JScript");' > macro.xyz
expect 0 'as JScript' --engine JScript macro.xyz
expect 4 'Tarn has detected' --module "$fake" macro.js

# Wrong calls, which scripts cannot catch
while IFS='|' read -r call text; do
  expect_js 1 "$text" "tarn.write('x'); try { tarn.$call; } catch (error) {}"
done << 'CALLS'
set_line(1)|set_line: expected 2 arguments (line, text), got 1
line_count(1)|line_count: expected 0 arguments
get_line(0)|get_line: argument 1 of (line): expected a line number from 1 to 1, got "0"
get_line(2)|from 1 to 1
get_line(1.5)|from 1 to 1, got "1.500000"
get_line("1x")|got "1x"
goto_line(3)|from 1 to 2
set_line(1, "a\nb")|argument 2 of (line, text): expected one line
write(new Array(513).join("x"))|may have been cut
set_line(1, new Array(600).join("x"))|may have been cut
CALLS
for line in "$(printf '%01024d' 0)" "$(printf '\200')"; do
  printf '%s\n' "$line" > input.txt
  expect_js 1 'get_line: line 1 has ' 'tarn.get_line(1);'
done
: > input.txt
expect_js 1 'the document is empty' 'tarn.get_line(1);'

# Unchanged text keeps every byte, and text at the limits passes
expect_same() {
  expect_js 0 '' "$1"
  cmp input.txt out || fail "$1: the text has changed"
  wine "$macrorun" macro.js - < input.txt 2> err | cmp - input.txt || fail "$1: standard input"
}
i=0
while [ $i -lt 256 ]; do printf "\\$(printf %03o $i)"; i=$((i + 1)); done > input.txt
printf '\r\nCR LF\r\n\n\r\nno end' >> input.txt
expect_same 'tarn.line_count();'
printf '%s\n' '[Options]' Language=RubyScript FixCRLF=1 FixDelimiter=1 > flags.qwsh
expect_rbs 0 '' '@tarn.set_line(2, @tarn.get_line(2))' --description flags.qwsh
cmp input.txt out || fail 'a flag of the description changes the text'
printf '%01023d\n%0511d' 1 2 > input.txt
expect_same 'tarn.get_line(1); tarn.set_line(2, tarn.get_line(2));'

# Standard input with and without -
echo 'tarn.line_count();' > macro.js
echo '$stdin.read' > reads.rbs
for case in 'macro.js - < input.txt' 'reads.rbs < input.txt' 'macro.js < /dev/null' 'macro.js input.txt < input.txt'; do
  source=$case
  eval "expect 0 '' $case"
  [ ! -s err ] || fail "$case: $(cat err)"
done
forgotten='macrorun: the macro started with an empty text (use - as FILE to read standard input)'
expect 0 "$forgotten" macro.js < input.txt
cat input.txt | { sleep 0.1; expect 0 "$forgotten" macro.js; finish; } || fail 'a pipe'

# Ruby gets texts as bytes: every line is unchanged, unless it is too long or has a zero byte
copy_lines='1.upto(@tarn.line_count) { |line| @tarn.set_line(line, @tarn.get_line(line)) }'
i=1
while [ $i -lt 256 ]; do printf "\\$(printf %03o $i)"; i=$((i + 1)); done > input.txt
expect_rbs 0 '' "$copy_lines"
cmp input.txt out || fail "a macro in Ruby changes bytes"
printf '%01024d\n' 0 > input.txt
expect_rbs 1 'get_line: line 1 has 1024 characters' "$copy_lines"
printf 'a\0b\n' > input.txt
expect_rbs 1 'get_line: line 1 has a zero byte' "$copy_lines"
: > input.txt

# Paths outside the code page
mkdir 'Ordner ä 日本'
echo 'tarn.message("found");' > 'Ordner ä 日本/ä 日本.js'
expect 0 'found' 'Ordner ä 日本/ä 日本.js' input.txt

# The Ruby engine is the one in the folder of macrorun
echo 'require "date"; @tarn.message("found " + Date::MONTHNAMES[5])' > macro.rbs
cp "$macrorun" "$(dirname "$macrorun")/scriptruby.dll" 'Ordner ä 日本/'
in_build_folder=$macrorun
macrorun='Ordner ä 日本/macrorun.exe'
expect 1 "Error creating 'RubyScript'" macro.rbs
cp -r "$(dirname "$in_build_folder")/ruby" 'Ordner ä 日本/'
expect 0 'found May' macro.rbs
cp macro.rbs MACRO.RBS
expect 0 'found May' MACRO.RBS
# A user's description is neither read nor written
printf '[Options]\r\nLanguage=No.Engine\r\n' | tee description > 'Ordner ä 日本/xMacroWSH.qwsh'
expect 0 'found May' macro.rbs
cmp description 'Ordner ä 日本/xMacroWSH.qwsh' || fail "the user's description has changed"
expect 1 "Error creating 'No.Engine'" macro.rbs --description description
mv "$macrorun" 'Ordner ä 日本/other.exe'
macrorun='Ordner ä 日本/other.exe'
expect 0 'found May' macro.rbs
macrorun=$in_build_folder

# The temporary folder is empty afterwards
mkdir temporary
temporary() {
  wine cmd /c "set TMP=Z:$(pwd | tr / '\\')\\temporary&& Z:$(echo "$macrorun" | tr / '\\') $1"
}
for source in 'tarn.line_count();' 'tarn.get_line(-1);' 'x = = 1;'; do
  echo "$source" > macro.js
  temporary macro.js > /dev/null 2>&1
  [ -z "$(ls temporary)" ] || fail "left after $source: $(ls temporary)"
done
mkdir temporary/macrorun-999999-1
temporary macro.js > /dev/null 2>&1
[ -z "$(ls temporary)" ] || fail "the folder of a killed run is left"

finish
