#!/bin/sh
# SPDX-License-Identifier: MIT
# reference.sh MACRORUN FAKE_MODULE: the list of macro functions, Docs/functions.md and the stubs
# agree; --help and the table of options agree.
# shellcheck source=Tests/macrorun/cli/runner.sh
. "$(dirname "$0")/runner.sh"
page=$root/Docs/functions.md

expect 2 'markdown' --functions=html
expect 2 'cannot write nowhere' --stubs -o nowhere/tarn.rb
expect 0 '' --functions=markdown
cp out page
diff "$page" page || fail "Docs/functions.md is out of date: scripts/run.sh --functions=markdown -o Docs/functions.md"

# The stubs are valid Ruby with the names and parameters of the list, and do not replace @tarn
expect 0 '' --functions -o list
expect 0 '' --stubs -o tarn.rb
cat > macro.rbs << 'RUBY'
def call_of(name, parameters)
  open = ""
  list = parameters.map do |kind, parameter|
    before, after = kind == :opt ? ["[", open << "]"] : ["", ""]
    before + (parameter == parameters[0][1] ? "" : ", ") + parameter.to_s + (kind == :rest ? "..." : "")
  end
  "#{name}(#{list.join}#{open})"
end

load "./tarn.rb"
page = File.read("page")
types = {"nothing" => "void", "a number" => "Integer", "a text" => "String"}
comments = File.read("tarn.rb").scan(/((?:^  # .+\n|^  #\n)+)  def (\w+)/).to_h { |text, name| [name.to_sym, text] }
Tarn.instance_methods(false).sort.each do |name|
  parameters = Tarn.instance_method(name).parameters
  tags = comments[name].scan(/@param (\w+) \[[\w<>]+(, nil)?\] \S/)
  wanted = parameters.map { |kind, parameter| [parameter.to_s, (", nil" if kind == :opt)] }
  type = types[page[/^### #{name}\n.*?^Result: (.*?)\.$/m, 1]]
  raise "#{name}: #{tags}" unless tags == wanted && comments[name].end_with?("# @return [#{type}]\n")
  @tarn.write(call_of(name, parameters) + "\n")
end
RUBY
expect 0 '' macro.rbs
sed -n 's/^  \([a-z_]*([^)]*)\).*/\1/p' list | LC_ALL=C sort > calls
[ "$(wc -l < calls)" -ge 70 ] && LC_ALL=C sort out | diff calls - || fail 'the stubs are not those of the list'
grep -q '^  sort_lines.* (options: descending, ignore_case, unique)$' list || fail 'the list has no options'
grep -qx '  # @param count \[Integer, nil\] 0 or more; default: all that follow' tarn.rb || fail 'a stub does not name the default'
grep -qx '@tarn ||= Tarn.new' tarn.rb || fail 'the stubs have no @tarn'

# Each option is in the guide's table, and a test uses it
guide=$root/Docs/macrorun.md
expect 0 '' --help
for option in $(sed -n 's/^  \(-.,\)\?\(--[a-z-]*\).*/\2/p' out); do
  grep -q -- "^| \(\`-.\`, \)\?\`${option}[\` ]" "$guide" || fail "$option is not in the table"
  cat "$root"/Tests/macrorun/cli/*.sh "$root"/Tests/macrorun/cli/*.txt | grep -q -- "$option\b" || fail "no test uses $option"
done
[ "$(grep -c '^| `-' "$guide")" -eq "$(grep -c '^  -' out)" ] || fail 'the table has options that do not exist'

finish
