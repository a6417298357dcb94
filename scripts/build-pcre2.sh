#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Cross-builds PCRE2, the regular expressions of macrorun, for 32-bit Windows from Debian's source
# package and prints the folder that holds it:
#   include/pcre2.h, lib/libpcre2-8.a   8-bit characters, UTF and Unicode properties, no JIT
#   licenses/                           what a package with the library in it has to carry
# The folder is in a cache outside the build folder and appears in one rename, so it is whole or not
# there. Changing this file makes another one. Call it before taking the build lock: it takes that itself.
set -euo pipefail
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/lib.sh"

PACKAGES+=(dpkg-dev)

VERSION=10.42
HOST=i686-w64-mingw32

CACHE=${SCRIPTRUBY_CACHE:-$HOME/.cache/scriptruby}
RECIPE=$(sha256sum <"${BASH_SOURCE[0]}")
NAME=pcre2-$VERSION-${RECIPE:0:12}
RESULT=$CACHE/$NAME

# A list of its own: the machine's sources stay as they are, and root is not needed. The package's
# revision is the release's present one.
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
    "${apt[@]}" source pcre2 &&
    mv "pcre2-$VERSION" source
}

configure_pcre2() (
  mkdir build && cd build &&
    ../source/configure --build=x86_64-linux-gnu --host=$HOST --disable-shared --enable-static \
      --disable-jit --enable-unicode --disable-pcre2grep-libz --disable-pcre2grep-libbz2 \
      CC=$HOST-gcc-posix CFLAGS='-O2 -ffunction-sections -fdata-sections'
)

# Parts of the compiler's run-time may be linked in; macrorun carries their licences anyway.
collect() {
  mkdir -p result/{include,lib,licenses} &&
    cp build/src/pcre2.h result/include/ &&
    cp build/.libs/libpcre2-8.a result/lib/ &&
    cp source/LICENCE result/licenses/pcre2-LICENCE &&
    cp source/debian/copyright result/licenses/pcre2-debian-copyright
}

# What an interrupted build left behind goes away; the lock says that nobody works there.
build_pcre2() {
  rm -rf "$CACHE"/.pcre2-*
  WORK=$(mktemp -d "$CACHE/.$NAME.XXXXXX")
  cd "$WORK"
  step "fetching the source of PCRE2 $VERSION" fetch_source
  step "configuring PCRE2" configure_pcre2
  step "building PCRE2" make -C build -j "$(nproc)" libpcre2-8.la
  step "collecting PCRE2" collect
  chmod 755 result
  mv -T result "$RESULT"
  cd "$CACHE"
  rm -rf "$WORK"
}

if [ ! -d "$RESULT" ]; then
  [[ $CACHE != *[[:space:]]* ]] || die "PCRE2 cannot be built in a folder with a blank: set SCRIPTRUBY_CACHE"
  mkdir -p "$BUILD" "$CACHE"
  exec 9>"$BUILD/.lock"
  flock 9
  set_up
  exec 9>"$CACHE/.lock"
  flock 9
  [ -d "$RESULT" ] || build_pcre2
fi
printf '%s\n' "$RESULT"
