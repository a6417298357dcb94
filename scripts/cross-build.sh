# SPDX-License-Identifier: MIT
# shellcheck shell=bash
# Shared by build-cruby.sh and build-pcre2.sh, which cross-build the source package SOURCE, version
# PACKAGE_VERSION, for 32-bit Windows and print the folder with the result. The folder is in a cache
# outside the build folder. It appears in one rename, so it is never incomplete. A change to a
# command here or in the caller gives a new folder. The script takes the build lock itself: call it
# unlocked.
# shellcheck source=scripts/lib.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

PACKAGES+=(dpkg-dev)

# shellcheck disable=SC2034 # for the scripts that source this file
HOST=i686-w64-mingw32
CACHE=${SCRIPTRUBY_CACHE:-$HOME/.cache/scriptruby}
RECIPE=$(grep -hv '^ *#' "$0" "${BASH_SOURCE[0]}" | sha256sum)

# Uses a separate source list, so that the machine's lists do not change and root is not needed.
fetch_source() {
  local codename mirror
  codename=$(. /etc/os-release && printf %s "$VERSION_CODENAME")
  mirror=$(apt-get indextargets --format '$(SITE)' "Codename: $codename" | head -n 1)
  local apt=(
    apt-get -o Dir::Etc::sourcelist="$WORK/source.list" -o Dir::Etc::sourceparts=-
    -o Dir::State::lists="$WORK/lists" -o Dir::Cache::pkgcache= -o Dir::Cache::srcpkgcache=
    -o APT::Sandbox::User=root -o APT::Update::Error-Mode=any
  )
  printf 'deb-src [signed-by=%s] %s %s main\n' /usr/share/keyrings/debian-archive-keyring.gpg \
    "${mirror:-http://deb.debian.org/debian}" "$codename" >"$WORK/source.list"
  mkdir -p "$WORK/lists/partial" &&
    "${apt[@]}" update &&
    "${apt[@]}" source "$SOURCE=$PACKAGE_VERSION" &&
    mv "$SOURCE-${PACKAGE_VERSION%%-*}" source
}

# Deletes the remains of interrupted builds: under the lock, no other build uses them.
build_into_cache() {
  local name=$1 result=$2
  rm -rf "$CACHE/.$name"-*
  WORK=$(mktemp -d "$CACHE/.$name-XXXXXX")
  cd "$WORK"
  step "fetching the source of $SOURCE $PACKAGE_VERSION" fetch_source
  build # in the folder WORK, out of `source`: makes `result`
  chmod 755 result
  mv -T result "$result"
  cd "$CACHE"
  rm -rf "$WORK"
}

# print_cached NAME: prints the folder in the cache. Calls the caller's `build` if it is missing.
print_cached() {
  local name=$1 result=$CACHE/$1-${PACKAGE_VERSION%%-*}-${RECIPE:0:12}
  if [ ! -d "$result" ]; then
    [[ $CACHE != *[[:space:]]* ]] || die "$name cannot be built in a folder with a blank: set SCRIPTRUBY_CACHE"
    mkdir -p "$BUILD" "$CACHE"
    exec 9>"$BUILD/.lock"
    lock
    set_up
    exec 9>"$CACHE/.lock"
    lock
    [ -d "$result" ] || build_into_cache "$name" "$result"
  fi
  printf '%s\n' "$result"
}
