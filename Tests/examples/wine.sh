# SPDX-License-Identifier: MIT
# Sourced by the scripts here: the project's own Wine prefix, unless the caller has chosen one.
: "${WINEPREFIX:=$(cd "$(dirname "$0")/../.." && pwd)/build/wineprefix}"
: "${WINEARCH:=win32}" "${WINEDEBUG:=-all}"
export WINEPREFIX WINEARCH WINEDEBUG
