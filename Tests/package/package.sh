#!/bin/sh
# SPDX-License-Identifier: MIT
# package.sh SOURCE_FOLDER: the zip, unpacked into a folder with a blank and letters beyond ASCII, for
# a user on whose machine nothing else is.
folder=$(mktemp -d)
export WINEARCH=win32 WINEDEBUG=-all LC_ALL=C.UTF-8
failed=0
fail() {
  echo "FAILED: $*"
  failed=1
}

"$1/scripts/package.sh" "$folder/package.zip" > "$folder/log" 2>&1 || fail "package.sh: $(cat "$folder/log")"
export WINEPREFIX="$folder/prefix"
trap 'wineserver -k; rm -rf "$folder"' EXIT
mkdir "$folder/Käse & Brot" "$folder/Süße Macros"
cd "$folder/Käse & Brot" || exit 1
cmake -E tar xf ../package.zip
cd scriptruby-* || exit 1
package=$PWD
wineboot -i > "$folder/log" 2>&1
wine reg add 'HKCU\Software\Wine\Drivers' /v Graphics /d null /f > "$folder/log" 2>&1

# By command line, from elsewhere
cd Examples || exit 1
timeout 60 wine ../macrorun.exe csv-to-table.rbs csv-to-table.in > "$folder/out" 2> "$folder/err"
cmp "$folder/out" csv-to-table.out || fail "macrorun: $(cat "$folder/err")"
timeout 60 wine ../macrorun.exe sort-unique.js sort-unique.in > "$folder/out" 2> "$folder/err"
cmp "$folder/out" sort-unique.out || fail "macrorun with JScript: $(cat "$folder/err")"

# By double click, for which the shell calls cmd; by dropping a macro, as the shell starts the file
cd .. || exit 1
timeout 60 wine cmd /c try-example.cmd < /dev/null > "$folder/out" 2>&1
grep -q '| Jürgen Groß ' "$folder/out" || fail "try-example.cmd: $(cat "$folder/out")"
printf 'line\n' > '../../Süße Macros/mark.in'
echo 'File.write("ran.txt", @tarn.get_line(1))' > '../../Süße Macros/mark.rbs'
timeout 60 wine start /unix "$package/run-macro.cmd" \
  "$(wine winepath -w "$folder/Süße Macros/mark.rbs" 2> /dev/null | tr -d '\r')" > "$folder/log" 2>&1
tries=0
until [ -s "$folder/Süße Macros/ran.txt" ] || [ $((tries += 1)) -gt 300 ]; do sleep 0.1; done
[ "$(cat "$folder/Süße Macros/ran.txt")" = line ] || fail "run-macro.cmd: $(cat "$folder/log")"

# Registered, and not any more
class='HKCU\Software\Classes\RubyScript\CLSID'
timeout 60 wine cmd /c register.cmd < /dev/null > "$folder/out" 2>&1 || fail "register.cmd: $(cat "$folder/out")"
wine reg query "$class" > "$folder/log" 2>&1 || fail "register.cmd has not registered"
timeout 60 wine cmd /c unregister.cmd < /dev/null > "$folder/out" 2>&1 || fail "unregister.cmd: $(cat "$folder/out")"
! wine reg query "$class" > "$folder/log" 2>&1 || fail "unregister.cmd has not unregistered"

! grep -v "$(printf '\r')\$" ./*.cmd > "$folder/out" || fail "lines that cmd may not take: $(cat "$folder/out")"

# What has to travel with it: the licences of all that is inside, and what the documents link to
for file in LICENSE ruby/licenses/COPYING ruby/licenses/gcc-copyright ruby/licenses/mingw-w64-copyright \
  licenses/pcre2-LICENCE licenses/libcli11-dev-copyright licenses/libdtl-dev-copyright \
  licenses/nlohmann-json3-dev-copyright licenses/mingw-w64-common-copyright \
  licenses/gcc-mingw-w64-base-copyright; do
  [ -s "$file" ] || fail "no $file in the package"
done
for page in README.md Docs/*.md; do
  for link in $(sed 's/](/\n](/g' "$page" | sed -n 's/^](\([^):#]*\)[)#].*/\1/p'); do
    [ -e "$(dirname "$page")/$link" ] || fail "$page links to $link, which is not there"
  done
done
exit $failed
