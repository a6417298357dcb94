# SPDX-License-Identifier: MIT
# shellcheck shell=sh
# Sourced by the test scripts: the project's Wine prefix, unless the caller has chosen one.
root=$(cd "$(dirname "$0")" && pwd)
root=${root%/Tests/*}
: "${WINEPREFIX:=$root/build/wineprefix}" "${WINEARCH:=win32}" "${WINEDEBUG:=-all}"
export WINEPREFIX WINEARCH WINEDEBUG
