#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Runs all tests: sets the machine up and builds first when needed. Arguments go to ctest.
source "$(dirname "${BASH_SOURCE[0]}")/lib.sh"

mkdir -p "$BUILD"
exec 9>"$BUILD/.lock"
flock 9
set_up
build_release
exec 9>&-

start_wine
cd "$ROOT"
say "-- testing"
exec ctest --preset release -j "$(nproc)" "$@"
