#!/bin/sh
# SPDX-License-Identifier: MIT
# record.sh MACRORUN FAKE_MODULE: macros made from recordings; wrong recordings and templates.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"
languages=$(dirname "$macrorun")/languages

# expect_steps CODE TEXT STEPS [OPTION...]: as expect, for --record of the steps.
expect_steps() {
  code=$1 text=$2 source=$3
  shift 3
  printf '%s' "$source" > steps.json
  expect "$code" "$text" --record steps.json "$@"
}

# A complete macro: templates, joined text, keys, calls
steps='[{"text": "say \"#{x}\" \\ ä"}, {"key": "Enter"}, {"text": "\r\n\n"}, {"bytes": [255]},
  {"text": "\u0001#"}, {"key": "Tab"}, {"call": "GOTO_LINE", "arguments": [2]}, {"key": "Home"},
  {"text": "#"}, {"text": "{"}, {"call": "message", "arguments": ["a", 1.0, -0.5, {"bytes": [200]}]}]'
expect_steps 0 '' "$steps"
expect_lines out 'def key_macro()' \
  '	@tarn.write("say \"#\x7Bx}\" \\ ä\n\r\n\n\xFF");' \
  '	@tarn.write("\x01#\t");' '	@tarn.goto_line(2);' '	@tarn.line_start();' \
  '	@tarn.write("#\x7B");' '	@tarn.message("a", 1, -0.5, "\xC8");' \
  'end' '' 'key_macro() # run the macro'
expect_steps 0 '' '[{"text": "it'"'"'s\r\n"}, {"call": "find", "arguments": ["\""]}]' -o new.js
[ ! -s out ] || fail '-o prints'
expect_lines new.js 'function key_macro() {' "	tarn.write(\"it\\'s\\r\\n\");" '	tarn.find("\"");' '}' '' \
  'key_macro(); // run the macro'
expect_steps 0 '' '[{"text": "\"'"'"'\r\n"}, {"key": "Enter"}]' --description "$languages/vbs.qwsh"
expect_lines out 'Sub key_macro()' "	Call tarn.write(\"\"\"'\"&vbCrLf&\"\"&vbLf&\"\")" 'End Sub' '' \
  "key_macro ' run the macro"

# The effect of each key
keys='"Ctrl+End", "Up", "Up", "End", "Tab", "Enter", "Left", "Left", "Right", "Backspace", "Down", "Down",
  "Right", "Home", "Delete", "Ctrl+Right", "Ctrl+Left", "Ctrl+Delete", "Ctrl+Home", "Delete"'
printf 'one\ntwo\nthree four\n' > input.txt
expect_steps 0 '' "$(echo "[$keys]" | sed 's/"[^"]*"/{"key": &}/g')" -o keys.rbs
expect 0 '' keys.rbs input.txt
expect_lines out ne two '' four

# Typed text of any length passes
long=$(printf '%0510dä%0511d%0512d' 1 2 3)
expect_steps 0 '' "[{\"text\": \"$long\"}]" -o long.rbs
[ "$(grep -c write long.rbs)" -eq 4 ] || fail 'long text: not the fewest calls'
expect 0 '' long.rbs
printf %s "$long" | cmp - out || fail 'long text has changed'

# Wrong recordings, with the place of each error; an existing macro is kept
echo old > kept.rbs
while IFS='|' read -r steps text; do
  expect_steps 2 "steps.json: $text" "$steps" -o kept.rbs
done << CASES
{"text": "a"}|expected a list of steps, got {"text":"a"}
[{"text": "a"|parse error at line 1, column 14
[1e999]|number overflow
[{"text": "a"}, 5]|step 2: expected an object with "text", "bytes", "key" or "call", got 5
[{}]|step 1: expected an object
[{"txt": "a"}]|step 1: "txt": unknown key; expected
[{"call": "find", "args": ["a"]}]|step 1: "args": unknown key; a call has "call" and "arguments"
[{"text": "a", "key": "Enter"}]|step 1: "text": cannot be combined with "key"
[{"text": "a", "arguments": []}]|step 1: "arguments": needs "call"
[{"text": 5}]|step 1: "text": expected a text, got 5
[{"text": "a\u0000b"}]|step 1: "text": a zero byte
[{"bytes": "a"}]|step 1: "bytes": expected a list of bytes
[{"bytes": [65, 256]}]|step 1: "bytes": byte 2: expected a number from 1 to 255, got 256
[{"bytes": [-1]}]|step 1: "bytes": byte 1
[{"bytes": [0]}]|step 1: "bytes": a zero byte
[{"key": "Esc"}]|step 1: "key": expected one of Enter, Tab
[{"call": "nothing"}]|step 1: "call": unknown macro function nothing
[{"call": "undo", "arguments": 5}]|step 1: "arguments": expected a list, got 5
[{"call": "write", "arguments": [null]}]|step 1: "arguments": argument 1: expected a number, a text
[{"call": "goto_line"}]|step 1: "arguments": goto_line: expected 1 argument (line), got 0
[{"call": "goto_line", "arguments": [0]}]|step 1: "arguments": goto_line: argument 1 of (line): expected a line number from 1 to 2147483647, got "0"
[{"call": "goto_line", "arguments": [2147483648]}]|step 1: "arguments": goto_line: argument 1 of (line)
[{"call": "goto_line", "arguments": [1.5]}]|step 1: "arguments": goto_line: argument 1 of (line)
[{"call": "delete_lines", "arguments": [3, 2]}]|step 1: "arguments": delete_lines: argument 2
[{"call": "set_line", "arguments": [1, "a\nb"]}]|step 1: "arguments": set_line: argument 2
[{"call": "set_mark", "arguments": [""]}]|step 1: "arguments": set_mark: argument 1
[{"call": "write", "arguments": ["$(printf %0512d 0)"]}]|step 1: "arguments": write: argument 1
CASES
printf '["\377"]' > steps.json
expect 2 'steps.json: parse error at line 1' --record steps.json
expect_lines kept.rbs old

# Templates: a text that fills its field is accepted, a longer one is refused
describe() { printf '%s\n' '[Options]' 'Language=RubyScript' "$@" > own.qwsh; }
for field in '\nMacroBegin 75' '\nMacroEnd 50' '\nFunctionPrint 40' '\nFunctionPrefix 40' \
  '\nFunctionPostfix 40' 'Enter 10' 'CRLF 10' 'LineFeed 10' 'Tick 10' 'Quote 10'; do
  width=${field##* } key=${field% *}
  start='%s'
  case $key in '\n'*) start='\n%s' width=$((width + 1)) key=${key#??} ;; esac
  fits=$(printf "%s%0$((width - ${#start}))d" "$start" 0)
  describe "$key=$fits"
  expect_steps 0 '' '[]' --description own.qwsh
  describe "$key=${fits}0"
  expect_steps 2 "own.qwsh: $key is longer" '[]' --description own.qwsh
done
for format in none '%d' '%s%s' '100% %s' '%s%'; do
  describe "FunctionPrint=$format"
  expect_steps 2 'own.qwsh: FunctionPrint: expected one %s' '[]' --description own.qwsh
done
describe 'FunctionPrint=100%%2; write("%s");'
expect_steps 0 '100%2; write("%s%");' '[{"text": "%s%"}]' --description own.qwsh
describe 'FunctionPrint=write(%s)'
expect_steps 2 'step 1: "arguments": a text needs quotes' \
  '[{"call": "find", "arguments": ["a"]}]' --description own.qwsh
describe 'Quote=""' 'Tick='
expect_steps 2 'step 2: own.qwsh has no Tick' '[{"text": "a"}, {"text": "it'"'"'s"}]' --description own.qwsh
expect_steps 2 'step 1: no template for a carriage return' '[{"text": "a\rb"}]' -o new.vbs
describe 'Enter=\r\n'
expect_steps 0 '"\r\n\n"' '[{"key": "Enter"}, {"text": "\n"}]' --description own.qwsh

# The command line
expect 2 'takes no macro and no text' --record steps.json macro.rbs
expect 2 'missing.json' --record missing.json
expect_steps 2 'xyz.qwsh' '[]' -o new.xyz
expect_steps 2 '--engine JScript' '[]' --engine JScript
expect_steps 0 'def key_macro()' '[]' --engine Tarn.RubyScript
expect_steps 2 'cannot write nowhere' '[]' -o nowhere/new.rbs
expect_steps 2 'no templates' '[]' --module "$fake"

finish
