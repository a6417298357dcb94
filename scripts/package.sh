#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Makes one zip of everything that a Windows machine needs, and prints its name:
#
#   scripts/package.sh [FILE.zip]      default: build/scriptruby-VERSION.zip
#
# Sets the machine up and builds first when needed. The zip appears whole or not at all.
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

[[ ${1:-} != -* ]] || STATUS=2 die "usage: scripts/package.sh [FILE.zip]"

VERSION=$(sed -n 's/^project(scriptruby VERSION \([0-9.]*\).*/\1/p' "$ROOT/CMakeLists.txt")
NAME=scriptruby-$VERSION
RESULT=$(readlink -m "${1:-$BUILD/$NAME.zip}")

# Libraries whose code is in macrorun, or in everything that the compiler links.
LICENSED=(libcli11-dev libdtl-dev nlohmann-json3-dev mingw-w64-common gcc-mingw-w64-base)

# In the folder $1.
collect_package() {
  local package
  mkdir -p "$1/licenses" &&
    cp -r "$BUILD/release/bin/"{macrorun.exe,scriptruby.dll,languages,ruby} "$1" &&
    cp -r "$ROOT/"{Examples,Docs,LICENSE} "$ROOT/Tools/package/README.md" "$1" &&
    # cmd needs both characters at each line's end to find its labels.
    for file in "$ROOT"/Tools/package/*.cmd; do
      sed 's/$/\r/' "$file" >"$1/${file##*/}" || return
    done &&
    for package in "${LICENSED[@]}"; do
      cp "/usr/share/doc/$package/copyright" "$1/licenses/$package-copyright" || return
    done &&
    cp "$("$ROOT/scripts/build-pcre2.sh")"/licenses/* "$1/licenses"
}

make_zip() (
  cd "$1" && cmake -E tar cf "$RESULT.part" --format=zip "$NAME" && mv "$RESULT.part" "$RESULT"
)

prepare macrorun macrorun_languages scriptruby rubyscript
folder=$(mktemp -d)
trap 'rm -rf "$folder" "$RESULT.part"' EXIT
step "collecting the package" collect_package "$folder/$NAME"
step "packing" make_zip "$folder"
printf '%s\n' "$RESULT"
