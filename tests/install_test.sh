#!/usr/bin/env bash
# Installs into an empty prefix, then builds and runs a program in C against what is there, through
# pkg-config and through CMake.
# Usage: install_test.sh BUILD_FOLDER SOURCE_FOLDER [COMPILER_FLAG...]
set -euo pipefail

build=$1 source=$2
flags=${*:3}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix

cmake --install "$build" --prefix "$prefix" >/dev/null

expect() {
  [ "$1" = "$2" ] || { printf 'expected "%s"\nbut got  "%s"\n' "$2" "$1"; exit 1; }
}

rows="VeltoQRN3NVMeController: 13/13 221/221 15/15 17/17 39/39 22/22 145/145 11/11 pagesPerVirtualBlock=7 pagesPerVirtualBlock=7 passWithTmodeHard=6
VeltoEmbeddedNVMeController: 13/13 15/15 17/17 39/39 22/22 145/145 11/11 pagesPerVirtualBlock=7 pagesPerVirtualBlock=7
KVRStorage: 13/13 15/15 17/17 39/39 22/22 145/145 11/11 pagesPerVirtualBlock=7 pagesPerVirtualBlock=7"

PKG_CONFIG_PATH=$(dirname "$(find "$prefix" -name morwick.pc)")
export PKG_CONFIG_PATH
# shellcheck disable=SC2046,SC2086  # lists of flags
cc -std=c11 $flags "$source/tests/consumer.c" -o "$work/with_pkg_config" \
  $(pkg-config --define-prefix --cflags --libs morwick)
libraries=$(pkg-config --define-prefix --variable=libdir morwick)
expect "$(LD_LIBRARY_PATH=$libraries "$work/with_pkg_config")" "$rows"

cat >"$work/CMakeLists.txt" <<END
cmake_minimum_required(VERSION 3.25)
project(consumer LANGUAGES C)
find_package(morwick 1 REQUIRED)
add_executable(with_cmake $source/tests/consumer.c)
target_link_libraries(with_cmake PRIVATE morwick::morwick)
END
cmake -G Ninja -S "$work" -B "$work/build" -DCMAKE_PREFIX_PATH="$prefix" -DCMAKE_C_FLAGS="$flags" >/dev/null
cmake --build "$work/build" >/dev/null
expect "$("$work/build/with_cmake")" "$rows"

expect "$("$prefix/bin/morwick" capacity 30000)" "32"
GRELLON_SCENARIO="$source/packaging/scenarios/empty.toml" "$prefix/sbin/grellon" 2>&1 |
  grep -q "stopping grellon daemon"
(cd "$prefix" && ls share/man/man8/grellon.8 share/man/man1/morwick.1 share/man/man3/libmorwick.3 \
  share/bash-completion/completions/morwick lib/systemd/system/grellon.service)
grep -q "^ExecStart=.*/sbin/grellon" "$prefix/lib/systemd/system/grellon.service"
