#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Compares the size of the tests with the size of the code that ships:
#
#   scripts/count-lines.sh            prints the lines of each folder and the share of the tests
#   scripts/count-lines.sh --check    fails when the share exceeds the limit
#
# Counts the lines of C, C++, Ruby, Python and shell files known to git that are neither blank nor a
# comment. A line is a comment when it starts with // or #, so preprocessor lines do not count. Golden
# files and test data do not count.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

LIMIT=58 # percent; lower it when the share falls

count() { # count FOLDER
  git ls-files -z -- "$1/*."{cpp,cc,c,h,hpp,rb,rbs,py,sh} |
    { xargs -0 -r grep -hsvE '^[[:space:]]*(//|#|$)' || true; } | wc -l
}

code=0
for folder in Core Scripting Tools Tests; do
  lines=$(count "$folder")
  printf '%-10s%6d\n' "$folder" "$lines"
  [ "$folder" = Tests ] || code=$((code + lines))
done
share=$(((100 * lines + code - 1) / code))
echo "The tests have $lines lines, the code has $code: $share% (limit: $LIMIT%)"
if [ "${1:-}" = --check ] && [ "$share" -gt "$LIMIT" ]; then
  echo "error: the tests are too large: remove or merge weak ones (scripts/count-lines.sh shows the folders)" >&2
  exit 1
fi
