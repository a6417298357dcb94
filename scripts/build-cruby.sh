#!/usr/bin/env bash
# SPDX-License-Identifier: MIT
# Cross-builds CRuby for 32-bit Windows from Debian's source package, for the Ruby engine, and prints
# the folder that holds it:
#   include/   headers for embedding (ruby.h, ruby/config.h)
#   lib/       libmsvcrt-ruby310.dll.a
#   ruby/      what a Windows machine needs: bin, lib/ruby/3.1.0, licenses. It works wherever it is copied.
#   tests/     CRuby's own test suites, and what they load (tool/lib)
set -euo pipefail
# shellcheck source=scripts/cross-build.sh
source "$(dirname "$(readlink -f "${BASH_SOURCE[0]}")")/cross-build.sh"

PACKAGES+=(ruby)

# Lets the engine route win32ole's calls to and from COM (see OleEmbedder.h).
PATCH=$ROOT/scripts/win32ole.patch
RECIPE=$(sha256sum - "$PATCH" <<<"$RECIPE" | cut -c -64 | sha256sum)

SOURCE=ruby3.1
PACKAGE_VERSION=3.1.2-7+deb12u1
API=3.1.0
ARCH=i386-mingw32

# Each needs a library that Windows lacks, or is of no use on Windows.
LEFT_OUT=openssl,readline,readline-ext,zlib,dbm,gdbm,fiddle,psych,pty,syslog,socket

# Libraries that need those extensions, and tools for developers at a console.
UNUSABLE=(
  bundled_gems.rb drb drb.rb ipaddr.rb net open-uri.rb psych psych.rb readline.rb resolv-replace.rb
  resolv.rb rinda win32 yaml yaml.rb "$ARCH/win32"
  bundler bundler.rb debug.rb irb irb.rb mkmf.rb rdoc rdoc.rb reline reline.rb un.rb
)

# The static libgcc leaves only system DLLs to import; the blank option drops debug information. With
# a configure that is newer than the patched configure.ac, autoconf is not called for.
configure_ruby() (
  touch source/configure && rm -r source/ext/-test- && mkdir build && cd build &&
    ../source/configure --build=x86_64-linux-gnu --host=$HOST --prefix=/ --with-baseruby=/usr/bin/ruby \
      CC=$HOST-gcc-posix CXX=$HOST-g++-posix LDFLAGS=-static-libgcc optflags=-O2 debugflags= \
      --enable-shared --disable-jit-support --disable-install-doc --without-gmp --with-out-ext=$LEFT_OUT
)

# The whole "install" fetches bundled gems from the network; these parts of it do not.
install_ruby() {
  make -C build DESTDIR="$WORK/installed" install-bin install-lib install-ext-comm install-ext-arch
}

collect_headers() {
  local built=build/.ext/include/$ARCH/ruby
  mkdir -p result/lib &&
    cp -r source/include result/ &&
    cp "$built/config.h" result/include/ruby/ &&
    cp installed/lib/libmsvcrt-ruby310.dll.a result/lib/
}

collect_runtime() {
  local ruby=result/ruby library=result/ruby/lib/ruby/$API
  mkdir -p $ruby/bin "${library%/*}" &&
    cp installed/bin/{ruby.exe,msvcrt-ruby310.dll} $ruby/bin/ &&
    cp -r installed/lib/ruby/$API "$library" &&
    (cd "$library" && rm -rf "${UNUSABLE[@]}") &&
    find $ruby -regex '.*\.\(exe\|dll\|so\)' -exec $HOST-strip --strip-all {} +
}

# Parts of the compiler's and the C library's run-time are linked into every file.
collect_licenses() {
  local folder=result/ruby/licenses
  mkdir $folder &&
    cp source/{BSDL,COPYING,GPL,LEGAL} $folder/ &&
    cp source/debian/copyright $folder/debian-copyright &&
    cp /usr/share/doc/mingw-w64-common/copyright $folder/mingw-w64-copyright &&
    cp /usr/share/doc/gcc-mingw-w64-base/copyright $folder/gcc-copyright
}

collect_tests() {
  mkdir -p result/tests/tool &&
    cp -r source/{test,spec,bootstraptest} result/tests/ &&
    cp -r source/tool/lib result/tests/tool/
}

collect() {
  collect_headers && collect_runtime && collect_licenses && collect_tests
}

# Checks that every shipped library loads, and that the character tables are present.
check_runtime() {
  timeout 300 wine result/ruby/bin/ruby.exe -W0 --disable-gems -r rbconfig -e '
    folder = RbConfig::CONFIG["rubylibdir"]
    names = Dir.children(folder).grep(/\.rb\z/) + Dir.glob("**/*.so", base: RbConfig::CONFIG["rubyarchdir"])
    failed = names.reject do |name|
      require name
      true
    rescue Exception => error
      warn "#{name}: #{error.message}"
    end
    failed << "encodings" unless Encoding.list.size > 100 && "\u00fc".encode("Windows-1252").bytes == [252]
    failed << "Unicode" unless "Gr\u00fc\u00dfe".upcase == "GR\u00dcSSE" && "\u6f22".match?(/\p{Han}/u)
    abort "unusable: #{failed.join(" ")}" unless failed.empty?
  '
}

build() {
  step "patching CRuby" patch -d source -p1 -i "$PATCH"
  step "configuring CRuby" configure_ruby
  step "building CRuby (some minutes)" make -C build -j "$(nproc)"
  step "installing CRuby" install_ruby
  step "collecting CRuby" collect
  step "checking CRuby" check_runtime
}

print_cached cruby
