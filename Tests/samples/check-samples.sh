#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# check-samples.sh RUN_SAMPLE ENGINE SAMPLES LIST: CRuby's own programs print the same through the
# engine as through the ruby.exe beside it, byte for byte, and all succeed in both. The engine runs
# them in one process, so what one of them leaves behind shows in the next.
#
# LIST has a program of the folder SAMPLES a line, relative to it. A program that prints nothing has
# the word `silent` behind its name: then its value and its variables are shown.
set -euo pipefail
. "$(dirname "$0")/../wine.sh"
run_sample=$1 engine=$2 samples=$3 list=$4
ruby=$(dirname "$engine")/ruby.exe
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
mkdir "$folder/ruby" "$folder/engine"

# Addresses differ from run to run, and some values are long.
show_state() {
  printf 'value = begin\n'
  cat "$1"
  cat <<'RUBY'

end
local_variables.each do |name|
  puts "#{name} = #{binding.local_variable_get(name).inspect.gsub(/0x\h+/, "0x")[0, 2000]}"
end
RUBY
}

programs=()
while read -r program mode; do
  name=${program//\//-}
  programs+=("$name")
  if [ "$mode" = silent ]; then
    show_state "$samples/$program" >"$folder/$name"
  else
    cp "$samples/$program" "$folder/$name"
  fi
done < <(grep -v '^#' "$list")

failed=0
cd "$folder/ruby"
for name in "${programs[@]}"; do
  printf '==== %s\r\n' "$name"
  timeout 60 wine "$ruby" --disable-gems "../$name" </dev/null 2>../errors || {
    echo "ruby.exe fails in $name:" && cat ../errors
    failed=1
  } >&2
done >../ruby.out

cd "$folder/engine"
timeout 300 wine "$run_sample" "$engine" "${programs[@]/#/../}" </dev/null >../engine.out 2>../errors || {
  echo "the engine fails:" && cat ../errors
  failed=1
} >&2
cmp ../ruby.out ../engine.out || {
  diff -a -U 5 ../ruby.out ../engine.out | cut -c 1-200 | head -n 60
  failed=1
}
echo "${#programs[@]} programs"
exit $failed
