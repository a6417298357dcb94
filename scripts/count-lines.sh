#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Prints the lines of code of each folder, and those of the tests as a share of the rest and of all.
#
# What counts: the lines of C, C++ and Ruby files known to git that are neither blank nor a comment.
# A line is a comment when it starts, behind any blanks, with // or #; so preprocessor lines do not
# count.
set -euo pipefail
cd "$(dirname "${BASH_SOURCE[0]}")/.."

count() { # count FOLDER
  git ls-files -z -- "$1/*."{cpp,cc,c,h,hpp,rb,rbs} |
    { xargs -0 -r grep -hsvE '^[[:space:]]*(//|#|$)' || true; } | wc -l
}

code=0
for folder in Core Scripting Tools Benchmarks Tests; do
  lines=$(count "$folder")
  printf '%-10s%6d\n' "$folder" "$lines"
  [ "$folder" = Tests ] || code=$((code + lines))
done
percent() { echo "$(((1000 * lines / $1 + 5) / 10))%"; }
echo "Tests are $lines lines to $code of code, $(percent "$code"), and $(percent $((code + lines))) of both"
