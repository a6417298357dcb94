#!/bin/sh
# SPDX-License-Identifier: MIT
# errors.sh MACRORUN FAKE_MODULE: errors, messages, traces, profiles and syntax checks.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"
printf 'text\n' > input.txt

# Place, message, source line and caret
expect_rbs 1 '' "$(printf 'def f\n\t"\303\244" + nil\nend\nf')"
expect_lines err "macro.rbs:2:2: no implicit conversion of nil into String (TypeError)" \
  "$(printf '  \t"\303\244" + nil')" "$(printf '  \t^')" "$(printf "\tfrom macro.rbs:2:in \`+'")" \
  "$(printf "\tfrom macro.rbs:2:in \`f'")" "$(printf "\tfrom macro.rbs:4:in \`<main>'")"
expect_rbs 1 '' 'x = "ä"; y = = 1'
expect_lines err "macro.rbs:1:14: syntax error, unexpected '='" '  x = "ä"; y = = 1' \
  '               ^'
several=$(printf 'x = = 1\ny = 2\nz = = 3')
expect_rbs 1 '' "$several"
expect_lines err "macro.rbs:1:5: syntax error, unexpected '='" '  x = = 1' '      ^' \
  "macro.rbs:3: syntax error, unexpected '='" 'z = = 3'
expect_js 1 '' '/* ä */ x = = 1;'
expect_lines err 'macro.js:1:13: Syntax error' '  /* ä */ x = = 1;' '              ^'
expect_js 1 '' "$(printf 'var ok;\n  tarn.nothing();')"
expect_lines err 'macro.js:2:3: unknown macro function nothing (see --functions)' \
  '    tarn.nothing();' '    ^'
expect_rbs 1 '' '@tarn.nothing'
expect_lines err 'macro.rbs:1:6: unknown macro function nothing (see --functions)' '  @tarn.nothing' '       ^'
expect_rbs 1 '' "$(printf '@tarn.nothing rescue nil\nnil.foo')"
expect_lines err "macro.rbs:2:4: undefined method \`foo' for nil:NilClass (NoMethodError)" \
  '  nil.foo' '     ^'
expect_rbs 1 '' 'abort "No text"'
expect_lines err 'macro.rbs:1:1: No text' '  abort "No text"' '  ^'
expect_js 1 '' 'tarn.goto_line(7);'
expect_lines err 'macro.js: goto_line: argument 1 of (line): expected a line number from 1 to 2, got "7"'
expect_rbs 1 '' "$(printf 'def f\n  @tarn.goto_line(7)\nend\n\nf')"
expect_lines err 'macro.rbs:2: goto_line: argument 1 of (line): expected a line number from 1 to 2, got "7"' \
  '    @tarn.goto_line(7)' "$(printf "\tfrom macro.rbs:2:in \`f'")" "$(printf "\tfrom macro.rbs:5:in \`<main>'")"

# --keep-going: the call does nothing and the macro continues, but has failed
expect_js 1 'after' 'tarn.goto_line(7); tarn.message("after");' --keep-going

# JSON: every line is an object
json() {
  python3 - "$@" << 'PYTHON'
import json, sys
lines = [json.loads(line) for line in open('err', 'rb').read().decode().splitlines()]
sys.exit(0 if eval(sys.argv[1], {'e': lines}) else 'not so: %s in %s' % (sys.argv[1], lines))
PYTHON
  # shellcheck disable=SC2181
  [ $? -eq 0 ] || fail "$source"
}
if command -v python3 > /dev/null; then
  expect_rbs 1 '' "$(printf '@tarn.message("a\\"\\xff")\nx = nil.no')" --errors json --profile
  json '[x["type"] for x in e] == ["message", "error"] + 3 * ["profile"]'
  json '(e[1]["file"], e[1]["line"], e[1]["column"], e[1]["source"]) == ("macro.rbs", 2, 8, "x = nil.no")'
  json 'e[0]["text"] == "a\"\ufffd" and "NoMethodError" in e[1]["message"]'
  expect_rbs 1 '' '@tarn.goto_line("x")' --errors json --trace
  json '[(x["kind"], x["function"], x["argument"], x["expected"]) for x in e if x["type"] == "error"] \
== [("call", "goto_line", 1, "a line number from 1 to 2")]'
  json '{"type": "trace", "text": "goto_line(\"x\") -> wrong call"} in e'
  expect_rbs 1 '' "$several" --errors json
  json 'e[0]["details"][0].startswith("macro.rbs:3: syntax error")'
  expect 2 '' --errors json missing.js
  json 'e[0]["kind"] == "usage" and "missing.js" in e[0]["message"]'
  expect 4 '' --errors json --module "$fake" macro.js
  json 'e[0]["kind"] == "fault"'
else
  echo 'no python3: JSON is not checked'
fi

# Colour on a terminal, unless NO_COLOR is set
if command -v script > /dev/null; then
  colour=$(printf '\033\\[[0-9;]*3[1-6][0-9;]*m\|\033\\[[0-9;]*9[1-6][0-9;]*m')
  echo 'x = = 1;' > macro.js
  timeout 20 script -qec "wine '$macrorun' macro.js" terminal > /dev/null 2>&1
  grep -q 'Syntax error' terminal && grep -q "$colour" terminal || fail "no colour: $(cat -v terminal)"
  NO_COLOR=1 timeout 20 script -qec "wine '$macrorun' macro.js" terminal > /dev/null 2>&1
  grep -q 'Syntax error' terminal && ! grep -q "$colour" terminal || fail 'colour despite NO_COLOR'
  NO_COLOR='' timeout 20 script -qec "wine '$macrorun' macro.js" terminal > /dev/null 2>&1
  grep -q "$colour" terminal || fail 'no colour with an empty NO_COLOR'
fi

# --trace, --profile, --log
expect_rbs 0 'write("a\"b\n") -> 0' '@tarn.write("a\"b\n"); @tarn.get_line(1)' --trace
grep -qxF 'get_line(1) -> "a\"b"' err || fail "--trace: $(cat err)"
grep -qxF 'Debug: Initialising macro interface' err || fail '--trace: no debug lines'
echo 'sleep 1' > slow.rbs
expect_rbs 0 '' '5.times { @tarn.line_count }; @tarn.run_macro("slow.rbs")' --profile
awk 'NR == 2 { ok = $1 == "run_macro" && $2 == 1 && $3 >= 1000 && $4 + 0 > 5 }
     NR == 3 { ok = ok && $1 == "line_count" && $2 == 5 } END { exit !ok }' err ||
  fail "--profile: $(cat err)"
expect 4 '' --log module.log --module "$fake" macro.rbs
grep -qx 'a line of the module' module.log || fail '--log: the module has not found it'
long=$(printf '%0120d' 0)
mkdir -p "$long/$long"
expect 2 '--log nowhere/x: its folder does not exist' --log nowhere/x macro.rbs
expect 2 "/x: the full path has more than 255 characters" --log "$long/$long/x" macro.rbs
expect 2 '--log 日本.log: the system' --log 日本.log macro.rbs

# Messages, arguments, answers and nested macros
echo '@tarn.write(@tarn.argument("name") + @tarn.argument("other", "-") + @tarn.prompt("?") + @tarn.prompt("?"))' > ask.rbs
expect 0 'a=b-12' ask.rbs --arg name=a=b --answer 1 --answer 2
! grep -q asked err || fail "an argument was read: $(cat err)"
expect 1 'prompt: expected an answer, got none (use --answer' ask.rbs --arg name=x --answer 1 < /dev/null
expect 1 'argument: argument 1' ask.rbs --arg nmae=x
! grep -q asked err || fail "a macro that failed may have been about to ask: $(cat err)"
expect 0 'macrorun: --arg nmae: the macro did not read it' ask.rbs --arg name=x --arg nmae=x --answer 1 --answer 2
expect 0 'a12a12' ask.rbs --arg name=a --arg other= --answer 1 --answer 2 --repeat 2
echo '@tarn.write(@tarn.prompt("?", "d") + @tarn.prompt("?", ""))' > ask.rbs
expect 0 'd' ask.rbs < /dev/null
[ ! -s err ] || fail "defaults of prompts: $(cat err)"
printf 'd' | cmp - out || fail "defaults of prompts: $(cat out)"
mkdir inner
echo '@tarn.write("<"); ok = @tarn.run_macro("inner/one.rbs"); @tarn.write(ok.to_s + ">")' > outer.rbs
echo '@tarn.write("1"); raise "inside" if @tarn.run_macro("two.rbs") == 0; @tarn.write("3")' > inner/one.rbs
echo '@tarn.write("2")' > inner/two.rbs
expect 0 '<1231>' outer.rbs
printf 'def f = @tarn.goto_line(99)\nf' > inner/two.rbs
expect 0 '<10>' outer.rbs
grep -q '^inner.two.rbs:1: goto_line' err && grep -q '^inner/one.rbs:1:.*inside' err ||
  fail "nested errors: $(cat err)"
[ "$(grep -c "from inner.two.rbs:.:in" err)" -eq 2 ] && ! grep -q 'from.*outer' err ||
  fail "the chain of a nested wrong call: $(cat err)"
echo '@tarn.run_macro("inner/none.rbs"); @tarn.run_macro("self.rbs")' > self.rbs
expect 0 'no such macro: ' self.rbs
grep -q 'more than 16 deep' err || fail "endless macros: $(cat err)"

# A macro in UTF-16, which the module cannot read
printf '\377\376x' > wide.rbs
echo '@tarn.run_macro("wide.rbs")' > outer.rbs
for source in wide.rbs '--check wide.rbs' '--test .'; do
  # shellcheck disable=SC2086
  expect 2 'wide.rbs: it is saved as UTF-16; save it as UTF-8' $source
done
expect 0 'wide.rbs: it is saved as UTF-16' outer.rbs

# --check: every file, and nothing runs
echo '@tarn.message("has run"); at_exit { puts "has run" }; BEGIN { @tarn.message("has run") }' > good.rbs
printf 'x = 1\ny = = "ä"\n' > bad.rbs
printf 'tarn.message("has run");\nif (' > bad.js
printf 'tarn.message "has run"\nIf x Then\n' > bad.vbs
expect 0 '' --check good.rbs good.rbs
[ ! -s out ] && [ ! -s err ] || fail "--check: $(cat out err)"
expect 1 'bad.rbs:2:5: syntax error' --check good.rbs bad.rbs bad.js bad.vbs good.rbs
grep -q '^bad.js:2:' err && grep -q '^bad.vbs:' err && ! grep -q 'has run' err || fail "--check: $(cat err)"
printf 'y = "ä"\nx = { a: 1, a: 2 }\nz = 1 if y = 1\n' > warns.rbs
for form in text json; do
  expect 1 'warns.rbs:2: warning: key :a is duplicated' --errors=$form --check warns.rbs bad.rbs
  grep -q 'warns.rbs:3: warning: ' err && grep -q 'bad.rbs' err && ! grep -q 'macro:' err || fail "--check: $(cat err)"
done
! grep -qv '^{' err || fail "--check: no object: $(cat err)"
echo 'puts "said"' >> warns.rbs
echo '@tarn.run_macro("warns.rbs"); puts "after"' > outer.rbs
expect 0 'warns.rbs:2: warning: key :a is duplicated' outer.rbs --errors=json
[ ! -s out ] && ! grep -qv '^{' err && ! grep -q 'macro:' err && grep -q said err && grep -q after err || fail "a warning: $(cat out err)"
expect 2 'missing.rbs' --check missing.rbs bad.rbs
grep -q '^bad.rbs:2:5:' err || fail '--check stops at a missing file'

finish
