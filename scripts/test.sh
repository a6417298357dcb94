#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Runs all tests: sets the machine up and builds first when needed. Arguments go to ctest.
set -euo pipefail
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

PACKAGES+=(python3)
prepare
"$ROOT/scripts/count-lines.sh" --check >&2
say "-- testing"
cd "$ROOT"
exec ctest --preset release -j "$(nproc)" "$@"
