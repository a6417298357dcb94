# SPDX-License-Identifier: MIT
# shellcheck shell=bash
# What the commands share: set-up of a Debian machine, the Wine prefix and the build. Progress goes to
# standard error; the output of a step goes to a log that is shown when the step fails.

set -euo pipefail

ROOT=$(cd "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/.." && pwd)
BUILD=$ROOT/build
LOGS=$BUILD/logs

PACKAGES=(
  clang-19 clang-tidy-19 lld-19 llvm-19 libclang-rt-19-dev
  g++-mingw-w64-i686-posix mingw-w64-i686-dev g++-multilib
  cmake ninja-build googletest libcli11-dev nlohmann-json3-dev libdtl-dev
  wine wine32:i386
)

export WINEARCH=win32
export WINEPREFIX=$BUILD/wineprefix
export WINEDEBUG=-all
# Wine converts file names by this locale.
export LC_ALL=C.UTF-8

say() { printf '%s\n' "$*" >&2; }

die() {
  say "error: $*"
  exit "${STATUS:-1}"
}

# Runs in the background and shows the progress of a step every 30 seconds, until it is killed or
# the command that started it ends.
show_progress() {
  trap 'kill $!; exit' TERM
  SECONDS=0 # of this shell's own
  while sleep 30 & wait $! && kill -0 $$ 2>/dev/null; do
    say "   after $((SECONDS / 60)) min $((SECONDS % 60)) s: $(tail -n 1 "$1" | cut -c -80)"
  done
}

# step NAME COMMAND...: runs the command with its output in a log, and shows the log's end when it
# fails. The command is a condition here, so `set -e` is off inside: functions chain with &&.
step() {
  local name=$1 log progress
  shift
  mkdir -p "$LOGS"
  log=$LOGS/${name// /-}.log
  say "-- $name"
  show_progress "$log" 9>&- &
  progress=$!
  if ! "$@" >"$log" 2>&1 </dev/null 9>&-; then # no daemon keeps the lock
    kill $progress
    tail -n 40 "$log" >&2
    die "$name failed (whole output: $log)"
  fi
  kill $progress
  wait $progress || true
}

missing_packages() {
  local package
  for package in "${PACKAGES[@]}"; do
    [ "$(dpkg-query -W -f='${db:Status-Status}' "$package" 2>/dev/null)" = installed ] ||
      printf '%s\n' "$package"
  done
}

as_root() {
  if [ "$(id -u)" = 0 ]; then
    "$@"
  elif command -v sudo >/dev/null; then
    sudo "$@"
  else
    say "root is needed for: $*"
    return 1
  fi
}

# Takes both architectures from the release itself: the security suite's i386 index can be out of
# step with amd64, and its failed download is not fatal.
install_packages() {
  local codename
  codename=$(. /etc/os-release && printf %s "${VERSION_CODENAME:-}")
  as_root dpkg --add-architecture i386 || return
  as_root apt-get update || say "some package indexes could not be fetched; going on"
  as_root env DEBIAN_FRONTEND=noninteractive apt-get install -y --no-install-recommends \
    ${codename:+-t "$codename"} "$@"
}

# A prefix without a display: windows and message boxes work, nothing is drawn.
make_wine_prefix() {
  wineboot -i &&
    wine reg add 'HKCU\Software\Wine\Drivers' /v Graphics /d null /f &&
    wineserver -w &&
    touch "$WINEPREFIX/.complete"
}

# Locks descriptor 9, which a command holds while it sets up or builds.
lock() {
  flock -n 9 && return
  say "-- waiting for another command that builds"
  flock 9
}

# install_missing: the packages in PACKAGES that the machine lacks.
install_missing() {
  command -v dpkg >/dev/null || die "this is not a Debian system: install by hand ${PACKAGES[*]}"
  local missing
  mapfile -t missing < <(missing_packages)
  if [ ${#missing[@]} -gt 0 ]; then
    say "installing packages: ${missing[*]}"
    step "installing packages" install_packages "${missing[@]}"
  fi
}

# set_up: everything a fresh machine needs before a build, each part only when it is missing.
set_up() {
  install_missing
  if [ ! -e "$WINEPREFIX/.complete" ]; then
    rm -rf "$WINEPREFIX"
    mkdir -p "$BUILD"
    step "making the Wine prefix" make_wine_prefix
  fi
}

# Starts Wine's server and keeps it for a minute after its last program: starting it takes longer
# than a macro does. The first program starts Wine's services, which hold its output open, so that
# output must not be a pipe of the caller.
start_wine() {
  wineserver -p60 >/dev/null 2>&1 </dev/null || true # it is running already
  wine cmd /c exit >/dev/null 2>&1 </dev/null || true
}

# build_release CRUBY PCRE2 [TARGET...]: builds, and configures first when that is necessary.
build_release() {
  local cruby=$1 pcre2=$2 made=$BUILD/release/build.ninja
  shift 2
  if ! [ "$made" -nt "$ROOT/CMakePresets.json" ] ||
    ! [ "$made" -nt "$ROOT/cmake/i686-w64-mingw32-clang.cmake" ] ||
    ! grep -qxF "SCRIPTRUBY_CRUBY:PATH=$cruby" "$BUILD/release/CMakeCache.txt" ||
    ! grep -qxF "SCRIPTRUBY_PCRE2:PATH=$pcre2" "$BUILD/release/CMakeCache.txt"; then
    step "configuring" cmake -S "$ROOT" --preset release --fresh \
      "-DSCRIPTRUBY_CRUBY=$cruby" "-DSCRIPTRUBY_PCRE2=$pcre2"
  fi
  ninja -C "$BUILD/release" -n "$@" 2>/dev/null | grep -q 'no work to do' ||
    step "building (some minutes the first time)" cmake --build "$BUILD/release" ${1:+--target "$@"}
}

# prepare [TARGET...]: set-up, build and Wine's server; one process at a time. CRuby and PCRE2 come
# first, since their scripts take the lock themselves.
prepare() {
  local cruby pcre2
  cruby=$("$ROOT/scripts/build-cruby.sh")
  pcre2=$("$ROOT/scripts/build-pcre2.sh")
  mkdir -p "$BUILD"
  exec 9>"$BUILD/.lock"
  lock
  set_up
  build_release "$cruby" "$pcre2" "$@"
  exec 9>&-
  start_wine
}
