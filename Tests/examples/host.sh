#!/bin/sh
# SPDX-License-Identifier: MIT
# host.sh MINIMAL_HOST MODULE FOLDER: the example of a host, with its macro, with one that fails and with
# one that is stopped.
# shellcheck source=Tests/wine.sh
. "$(dirname "$0")/../wine.sh"
host=$1
module=$(wine winepath -w "$2" 2> /dev/null | tr -d '\r')
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
cp "$3/greeting.rbs" "$folder"
cd "$folder" || exit 1
failed=0

# run MACRO CODE TEXT
run() {
  timeout 60 wine "$host" "$module" "$1" > out 2> err
  code=$?
  if [ $code -ne "$2" ] || ! cat out err | grep -qF "$3"; then
    echo "FAILED: $1: exit code $code, expected $2 and '$3':"
    cat out err
    failed=1
  fi
}

run greeting.rbs 0 'Hello, '
run greeting.rbs 0 '2 + 40 is 42'
echo '@tarn.add(1, 2); @tarn.print("then ", @tarn.pause(0))' > nothing.rbs
run nothing.rbs 0 'then 0'
echo '@tarn.nothing' > unknown.rbs
run unknown.rbs 1 'unknown macro scripting function:  nothing'
run missing.rbs 1 'could not be read'

echo '@tarn.print("begun"); loop { @tarn.pause(20) }' > endless.rbs
wine "$host" "$module" endless.rbs > out 2> err &
process=$!
tries=0
until grep -q begun out || [ $((tries += 1)) -gt 300 ]; do sleep 0.1; done
kill -INT $process
wait $process
code=$?
if [ $code -ne 3 ] || ! grep -q stopped err; then
  echo "FAILED: Ctrl+C: exit code $code: $(cat out err)"
  failed=1
fi
exit $failed
