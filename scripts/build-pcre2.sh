#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Cross-builds PCRE2, the regular expressions of macrorun, for 32-bit Windows from Debian's source
# package and prints the folder that holds it:
#   include/pcre2.h, lib/libpcre2-8.a   8-bit characters, UTF and Unicode properties, no JIT
#   licenses/                           to be included in every package that contains the library
set -euo pipefail
# shellcheck source=scripts/cross-build.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/cross-build.sh"

SOURCE=pcre2
PACKAGE_VERSION=10.42-1

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

build() {
  step "configuring PCRE2" configure_pcre2
  step "building PCRE2" make -C build -j "$(nproc)" libpcre2-8.la
  step "collecting PCRE2" collect
}

print_cached pcre2
