#!/usr/bin/env bash
# Installs into an empty prefix, then builds and runs two consumers against what is there: one in C
# through pkg-config, one in C++ through CMake.
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

PKG_CONFIG_PATH=$(dirname "$(find "$prefix" -name morwick.pc)")
export PKG_CONFIG_PATH
# shellcheck disable=SC2046,SC2086  # lists of flags
cc -std=c11 $flags "$source/tests/consumer.c" -o "$work/consumer_c" \
  $(pkg-config --define-prefix --cflags --libs morwick)
libraries=$(pkg-config --define-prefix --variable=libdir morwick)
expect "$(LD_LIBRARY_PATH=$libraries "$work/consumer_c" | tail -n 1)" "7 pages"

mkdir "$work/cmake"
cp "$source/tests/consumer.cpp" "$work/cmake"
cat >"$work/cmake/CMakeLists.txt" <<'END'
cmake_minimum_required(VERSION 3.25)
project(consumer LANGUAGES CXX)
set(CMAKE_CXX_STANDARD 20)
find_package(morwick 1 REQUIRED)
add_executable(consumer consumer.cpp)
target_link_libraries(consumer PRIVATE morwick::morwick)
END
cmake -G Ninja -S "$work/cmake" -B "$work/cmake/build" -DCMAKE_PREFIX_PATH="$prefix" \
  -DCMAKE_CXX_FLAGS="$flags" >/dev/null
cmake --build "$work/cmake/build" >/dev/null
expect "$("$work/cmake/build/consumer")" "32 GB, 1338 characters"

expect "$("$prefix/bin/morwick" capacity 30000)" "32"
GRELLON_SCENARIO="$source/packaging/scenarios/empty.toml" "$prefix/sbin/grellon" 2>&1 |
  grep -q "stopping grellon daemon"
for file in share/man/man8/grellon.8 share/man/man1/morwick.1 share/man/man3/libmorwick.3 \
  share/bash-completion/completions/morwick lib/systemd/system/grellon.service; do
  [ -f "$prefix/$file" ] || { echo "$file is not installed"; exit 1; }
done
grep -q "^ExecStart=.*/sbin/grellon" "$prefix/lib/systemd/system/grellon.service"
echo "installed and used"
