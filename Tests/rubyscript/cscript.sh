#!/bin/sh
# SPDX-License-Identifier: MIT
# cscript.sh RUBYSCRIPT_DLL: the system's script host runs a macro. A manifest beside it names the
# engine; only the file extension is registered, for the time of the test.
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../wine.sh"
engine=$(dirname "$1")
folder=$(mktemp -d)
classes='HKLM\Software\Classes'
clean_up() {
  rm -rf "$folder"
  for key in .rbstest rbstest; do
    wine reg delete "$classes\\$key" /f > /dev/null 2>&1
  done
}
trap clean_up EXIT
mkdir "$folder/bin"
ln -s "$engine/../lib" "$folder/lib"
ln -s "$engine"/*.dll "$folder/bin/"
cp "$WINEPREFIX/drive_c/windows/system32/cscript.exe" "$folder/bin/"
cp "$engine/rubyscript.manifest" "$folder/bin/cscript.exe.manifest"
wine reg add "$classes\\.rbstest" /ve /d rbstest /f > /dev/null
wine reg add "$classes\\rbstest\\ScriptEngine" /ve /d RubyScript /f > /dev/null
cd "$folder" || exit 1

cat > macro.rbstest << 'END'
require "json"
arguments = @WScript.Arguments
@WScript.Echo JSON.generate([@WScript.Name, arguments.length, arguments.Item(1)])
@WScript.Quit 3
@WScript.Echo "not reached"
END
code=0
timeout 120 wine bin/cscript.exe macro.rbstest a b > out 2>&1 || code=$?
if [ "$(tr -d '\r' < out | tail -n 1)" != '["Windows Script Host",2,"b"]' ] || [ $code -ne 3 ]; then
  echo "FAILED: exit code $code, expected 3, and the name of the host" && cat out
  exit 1
fi
