#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# check-dll.sh DLL: what a host and the loader rely on, read from the DLL that ships.
set -euo pipefail
dll=$1
failed=0

expect() { # expect WHAT WANTED FOUND
  if [ "$2" = "$3" ]; then
    echo "ok: $1"
  else
    printf 'not ok: %s\n  wanted: %s\n  found:  %s\n' "$1" "$2" "$3"
    failed=1
  fi
}

headers=$(llvm-readobj-19 --file-headers "$dll")
flags=$(grep -o 'IMAGE_DLL_CHARACTERISTICS_[A-Z_]*' <<<"$headers" | sort | tr '\n' ' ')
expect "32-bit" "COFF-i386" "$(sed -n 's/^Format: //p' <<<"$headers")"
# Not NO_SEH: the loader would then refuse the guard's handler.
expect "flags" \
  "IMAGE_DLL_CHARACTERISTICS_DYNAMIC_BASE IMAGE_DLL_CHARACTERISTICS_NX_COMPAT " "$flags"
expect "exports" "execute kill version " \
  "$(llvm-readobj-19 --coff-exports "$dll" | sed -n 's/^  Name: //p' | sort | tr '\n' ' ')"
expect "imported libraries" "ADVAPI32.dll KERNEL32.dll OLEAUT32.dll SHELL32.dll USER32.dll msvcrt.dll ole32.dll " \
  "$(llvm-readobj-19 --coff-imports "$dll" | sed -n 's/^  Name: //p' | LC_ALL=C sort | tr '\n' ' ')"
expect "a version resource" "yes" \
  "$(grep -q VERSIONINFO <<<"$(llvm-readobj-19 --coff-resources "$dll")" && echo yes)"
expect "at most 64 KiB" "yes" "$([ "$(stat -c %s "$dll")" -le 65536 ] && echo yes)"
expect "relocations" "yes" "$(grep -q 'BaseRelocationTableSize: 0x[1-9A-F]' <<<"$headers" && echo yes)"
exit $failed
