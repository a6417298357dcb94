#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Makes the pictures of the documents: Docs/pictures/NAME.svg from NAME.dot (Graphviz) or NAME.puml
# (PlantUML). Installs both programs when they are missing.
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

PACKAGES=(graphviz plantuml)
mkdir -p "$BUILD"
install_missing
cd "$ROOT/Docs/pictures"
for source in *.dot *.puml; do
  picture=${source%.*}.svg
  case $source in
  *.dot) dot -Tsvg "$source" -o "$picture" ;;
  *.puml) plantuml -tsvg -nometadata -charset UTF-8 "$source" ;;
  esac
  say "Docs/pictures/$picture"
done
