#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Measures calls, runs and the start of the Ruby engine, each beside a peer's time from the same run,
# and prints a table; takes about a minute on an idle machine:
#
#   scripts/bench.sh [calls | later | first]
#
# Sets the machine up and builds first when needed.
set -euo pipefail
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

prepare benchmarks
exec timeout 600 wine "$BUILD/release/bin/benchmarks.exe" "$@"
