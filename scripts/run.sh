#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Runs one macro in the runner, over the text in FILE, and prints the document:
#
#   scripts/run.sh [OPTION...] MACRO [FILE]
#
# Options are macrorun's (--help lists them). Sets the machine up and builds first when needed.
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

[ $# -gt 0 ] || STATUS=2 die "usage: scripts/run.sh [OPTION...] MACRO [FILE] (--help lists the options)"

prepare macrorun scriptruby rubyscript
exec wine "$BUILD/release/bin/macrorun.exe" "$@"
