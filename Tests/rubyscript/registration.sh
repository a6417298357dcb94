#!/bin/sh
# SPDX-License-Identifier: MIT
# registration.sh RUBYSCRIPT_DLL: regsvr32 writes entries for the user, and removes only these.
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../wine.sh"
dll=Z:$(echo "$1" | tr / '\\')
classes='HKCU\Software\Classes'
class='{5C0B6E2C-4F0D-4B6B-9E0F-7B1C3A9D52E4}'
foreign='{11111111-2222-3333-4444-555555555555}'
failures=0

# expect KEY TEXT: the key's own listing holds the text; "-" means that the key is missing.
expect() {
  found=$(wine reg query "$classes\\$1" 2> /dev/null) || found=
  if [ "$2" = - ]; then
    [ -z "$found" ]
  else
    printf '%s' "$found" | grep -qF -- "$2"
  fi && return
  echo "FAILED: $1: expected $2, found: $found"
  failures=$((failures + 1))
}

expect_ours() {
  expect "CLSID\\$class" OLEScript
  expect "CLSID\\$class\\InprocServer32" "$dll"
  expect "CLSID\\$class\\InprocServer32" Both
  expect "CLSID\\$class\\Implemented Categories" F0B7A1A1-9847-11CF-8F20-00805F2CD064
  expect "CLSID\\$class\\Implemented Categories" F0B7A1A2-9847-11CF-8F20-00805F2CD064
  expect "Tarn.RubyScript\\CLSID" "$class"
  expect "Tarn.RubyScript.1\\CLSID" "$class"
  expect "RubyScript\\CLSID" "$1"
}

expect_nothing() {
  for key in "CLSID\\$class" Tarn.RubyScript Tarn.RubyScript.1; do expect "$key" -; done
}

wine regsvr32 /s "$dll" && wine regsvr32 /s "$dll" || failures=1
expect_ours "$class"
expect RubyScript OLEScript
wine regsvr32 /s /u "$dll" || failures=1
expect_nothing
expect RubyScript -

# A name that another engine holds is left to it.
wine reg add "$classes\\RubyScript\\CLSID" /ve /d "$foreign" /f > /dev/null
wine reg add "$classes\\CLSID\\$foreign\\InprocServer32" /ve /d other.dll /f > /dev/null
wine regsvr32 /s "$dll" || failures=1
expect_ours "$foreign"
wine regsvr32 /s /u "$dll" || failures=1
expect_nothing
expect "RubyScript\\CLSID" "$foreign"
wine reg delete "$classes\\RubyScript" /f > /dev/null
wine reg delete "$classes\\CLSID\\$foreign" /f > /dev/null

[ $failures -eq 0 ]
