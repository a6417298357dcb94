#!/bin/sh
# SPDX-License-Identifier: MIT
# stops.sh MACRORUN FAKE_MODULE: Ctrl+C and timeouts.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"
printf 'text\n' > input.txt

echo 'loop {}' > endless.rbs

now() { date +%s%3N; }

# interrupt SIGNALS: runs macro.rbs or macro.js ($1), sends Ctrl+C that often once the macro has
# started, and checks the exit code and the time since the last signal.
interrupt() {
  : > err # not the one of the run before, which has started
  wine "$macrorun" "$1" input.txt > out 2> err &
  process=$!
  i=0
  until grep -q started err || [ $i -eq 100 ]; do sleep 0.1; i=$((i + 1)); done
  kill -INT $process
  begin=$(now)
  if [ "$2" = 2 ]; then
    sleep 0.5
    kill -0 $process || fail "$source: did not need the second Ctrl+C"
    kill -INT $process
    begin=$(now)
  fi
  wait $process
  result=$?
  duration=$(($(now) - begin))
  [ $result -eq 3 ] && [ ! -s out ] || fail "$source: exit code $result, expected 3: $(cat err)"
  [ "$2" = 2 ] || grep -q ': stopped' err || fail "$source: does not say that it was stopped: $(cat err)"
  [ $duration -lt 1500 ] || fail "$source: $duration ms"
}

while IFS='|' read -r extension signals source; do
  echo "$source" > "macro.$extension"
  interrupt "macro.$extension" "$signals"
done << 'MACROS'
js|1|tarn.message("started"); while (true) tarn.line_count();
rbs|1|@tarn.message("started"); loop { begin; @tarn.line_count; rescue Exception; end }
rbs|1|@tarn.message("started"); loop {}
rbs|1|@tarn.message("started"); sleep
rbs|1|@tarn.message("started"); @tarn.run_macro("endless.rbs"); loop {}
js|2|tarn.message("started"); while (true);
MACROS

# An interrupted macro has run its ensure blocks
expect_rbs 3 'timed out' 'begin; sleep; ensure; File.write("ensured", "x"); end' --timeout 2
[ -e ensured ] || fail 'an interrupted macro has not run its ensure block'
expect_js 3 'the program ends' 'while (true);' --timeout 0.3

# The error names the place, if the engine knows it
expect_js 3 'macro.js: timed out' 'while (true) tarn.line_count();' --timeout 0.3
expect_rbs 3 '' "$(printf 'def f\n  sleep\nend\nf')" --timeout 2
expect_lines err 'macro.rbs:2:3: timed out' '    sleep' '    ^' "$(printf "\tfrom macro.rbs:2:in \`sleep'")" \
  "$(printf "\tfrom macro.rbs:2:in \`f'")" "$(printf "\tfrom macro.rbs:4:in \`<main>'")"
expect_rbs 3 '' "$(printf 'x = 1\nbegin\n  @tarn.line_count while true\nensure\n  x = 2\nend')" --timeout 2
expect_lines err 'macro.rbs:3: timed out' '    @tarn.line_count while true'
expect 3 '{"type":"error","kind":"stop","file":"macro.rbs","line":3,' --timeout 2 --errors=json macro.rbs
echo 'begin; sleep; ensure; sleep 0.2; File.write("ensured", "inner"); end' > inner.rbs
expect_rbs 3 'inner.rbs:1:8: timed out' '@tarn.run_macro("inner.rbs"); @tarn.message("after")' --timeout 2
grep -q inner ensured || fail 'the ensure block of a nested macro did not finish'
! grep -q after err || fail 'the outer macro continued after the stop'
expect_rbs 0 '' '@tarn.line_count' --timeout 30

# With several files, a stop ends the batch
expect 3 '0 of 2 files done, 1 failed, 1 not started' --timeout 0.3 endless.rbs --each input.txt input.txt

# answer KEYS [OPTION...]: types KEYS two seconds after the prompt, and sets `result` to the exit
# code. `exec` replaces the shell of `script`, which Ctrl+C would end.
answer() {
  keys=$1
  shift
  : > terminal
  { i=0
    until grep -q 'who?' terminal || [ $i -eq 100 ]; do sleep 0.1; i=$((i + 1)); done
    sleep 2; printf "$keys"; sleep 1
  } | timeout 30 script -qefc "exec wine '$macrorun' $* macro.js" terminal > /dev/null 2>&1
  result=$?
}

# The time of a prompt does not count
if command -v script > /dev/null; then
  echo 'tarn.message("answer: " + tarn.prompt("who?"));' > macro.js
  answer 'Bob\r' --timeout 1
  [ $result -eq 0 ] && grep -q 'answer: Bob' terminal || fail "a prompt: $result, $(cat -v terminal)"
  answer '\003'
  [ $result -eq 3 ] && grep -q stopped terminal && ! grep -q expected terminal ||
    fail "Ctrl+C at a prompt: $result, $(cat -v terminal)"
fi

finish
