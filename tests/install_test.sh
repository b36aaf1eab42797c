#!/usr/bin/env bash
# Installs as the README says, moves the tree, and builds a program against it by pkg-config and by
# CMake, in C alone and in C++; then the same with the static library.
# Usage: install_test.sh BUILD_FOLDER SOURCE_FOLDER PLATFORM [COMPILER_FLAG...]
set -euo pipefail

build=$1 source=$2 platform=$3
flags=${*:4}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# Usage: expect TEXT EXPECTED_TEXT
expect() { diff --label expected --label got -u <(echo "$2") <(echo "$1"); }

# What tests/consumer.c prints: the table, what the command says of the same files, and what the simulated
# controller reports. Usage: expected LANGUAGE
expected() {
  local morwick=$prefix/bin/morwick
  cat <<'END_OF_TABLE'
VeltoQRN3NVMeController -1 9 9 Controller Characteristics
VeltoEmbeddedNVMeController -1 9 9 Controller Characteristics
KVRStorage 5 8 8 PropertyMatch
END_OF_TABLE
  "$morwick" stats -s kvr --long kvr.bin | sed 's/ *: / = /'
  "$morwick" snapshot -o csv snapshot.bin |
    awk -F , 'NR == 1 { split($0, names) } NR == 2 { for (i = 1; names[i] !~ /_0/; ++i) print names[i], $i }'
  [ "$1" = CXX ] || "$morwick" snapshot --header snapshot_header.bin snapshot.bin
  [ "$platform" != simulated ] || cat <<'END_OF_READING'
Morwick: findNandExporter: Controller found: VeltoQRN3NVMeController
Morwick: findNandExporter: Controller found: VeltoQRN3NVMeController
VeltoQRN3NVMeController: version 7, host reads 918273645, band erases 40961
END_OF_READING
}

# On another platform the controllers are those of the machine: nobody knows before what they report.
# Usage: consume LANGUAGE PROGRAM
consume() {
  local known=
  [ "$platform" = simulated ] || known=/^Morwick:/Q
  cd "$source/examples"
  expect "$(cat snapshot.bin kvr.bin snapshot_header.bin |
    GRELLON_SCENARIO=$scenarios/statistics.toml "$2" 2>/dev/null | sed "$known")" "$(expected "$1")"
}

# The examples in the headers, with so little room that each way of their loops is taken.
for header in $(cd "$source/include/morwick" && grep -l '^ \*     .*;$' ./*.h); do
  sed -n '/^ \*     .*;$/,/^ \*$/s/^ \*     //p' "$source/include/morwick/$header" |
    sed 's/room = 4096/room = 16/' >"$work/${header%.h}.example"
  grep -q "\"$(basename "$header" .h).example\"" "$source/tests/consumer.c" ||
    { echo "tests/consumer.c does not have the example of $header"; exit 1; }
done

# Builds programs against the tree $1 and runs them; $2 names their build folders.
build_and_consume() {
  local language compile tree=$1 name=$2
  cat >"$work/CMakeLists.txt" <<'END_OF_PROJECT'
cmake_minimum_required(VERSION 3.25)
project(consumer LANGUAGES ${language})
find_package(morwick 1 REQUIRED)
add_executable(consumer ${source}/tests/consumer.c)
set_source_files_properties(${source}/tests/consumer.c PROPERTIES LANGUAGE ${language})
target_include_directories(consumer PRIVATE ${CMAKE_SOURCE_DIR})
target_link_libraries(consumer PRIVATE morwick::morwick)
END_OF_PROJECT
  PKG_CONFIG_PATH=$(dirname "$(find "$tree" -name morwick.pc)")
  export PKG_CONFIG_PATH
  for language in C CXX; do
    [ $language = C ] && compile="cc -std=c11" || compile="c++ -std=c++20 -x c++"
    # shellcheck disable=SC2046,SC2086  # lists of flags
    $compile -I "$work" $flags "$source/tests/consumer.c" -x none -o "$work/consumer" \
      $(pkg-config --cflags --libs morwick)
    LD_LIBRARY_PATH=$(pkg-config --variable=libdir morwick) consume $language "$work/consumer"
    cmake -G Ninja -S "$work" -B "$work/$name-$language" -Dlanguage=$language -Dsource="$source" \
      -DCMAKE_PREFIX_PATH="$tree" -DCMAKE_${language}_FLAGS="$flags" >/dev/null
    cmake --build "$work/$name-$language" >/dev/null
    consume $language "$work/$name-$language/consumer"
  done
}

cmake --install "$build" --prefix "$work/installed" >/dev/null
DESTDIR=$work/root cmake --install "$build" --prefix /usr >/dev/null
for root in "" "$work/root"; do
  for service in morwick-metrics grellon; do  # the unit of the last one is looked into below
    unit=$(find "${root:-$work/installed}" -name $service.service)
    program=$root$(sed -n 's/^ExecStart=\([^ ]*\).*/\1/p' "$unit")
    [[ -x $program && -f ${unit%service}timer ]] || { echo "$unit starts nothing"; exit 1; }
  done
  counts=$(find "${root:-$work/installed}" -name grellon-mtail.service -exec sed -n 's/^ExecStart=.* //p' {} +)
  [ -f "$root$counts/grellon.mtail" ] || { echo "grellon-mtail.service counts nothing"; exit 1; }
  scenario=$root$(sed -n 's/^Environment=GRELLON_SCENARIO=//p' "$unit")
  [ -f "$scenario" ] || { echo "$unit plays nothing"; exit 1; }
done
[ -f "$work/root/etc/grellon/scenario.toml" ]

prefix=$work/moved
scenarios=$prefix/share/morwick/packaging/scenarios
mv "$work/installed" "$prefix"
if [ "$platform" = simulated ]; then
  GRELLON_SCENARIO=$scenarios/empty.toml "$prefix/sbin/grellon" 2>&1 | grep -q "stopping grellon"
  GRELLON_SCENARIO=$scenario "$prefix/bin/morwick" find >/dev/null 2>&1
fi
(cd "$prefix/share" && ls man/man8/grellon.8 man/man1/morwick.1 man/man3/{libmorwick,morwick_records}.3 \
  bash-completion/completions/morwick doc/morwick/CHANGES.md morwick/docs/scenario.md morwick/docs/morwick.schema.json \
  morwick/docs/archive.md morwick/docs/fleet.md morwick/packaging/prometheus/morwick.rules.yml morwick/packaging/grafana/morwick.json \
  morwick/examples/latency.gp morwick/examples/fleet.py morwick/examples/fleet.png) >/dev/null
build_and_consume "$prefix" given

# The example that is installed, and the program that the README shows, built as it says.
(
  cd "$work"
  # shellcheck disable=SC2046,SC2086  # lists of flags
  cc -std=c11 -Wall -Wextra -Werror $flags "$prefix/share/doc/libmorwick-dev/examples/inspect.c" -o inspect \
    $(pkg-config --cflags --libs morwick)
  export LD_LIBRARY_PATH=$prefix/lib
  if [ "$platform" = simulated ]; then
    export GRELLON_SCENARIO=$scenarios/statistics.toml
    expect "$(./inspect 2>/dev/null | grep -v -e ^Morwick -e '^the ')" "$(
      "$prefix/bin/morwick" stats -s kvr --long "$prefix/share/morwick/examples/kvr.bin" | sed 's/ *: / /'
      echo "256 bytes of statistics, which end right after a record")"
    ./inspect | grep -q "the snapshot header is whole"
  fi
  build=$(sed -n 's/^ *\(cc example.c .*\)/\1/p' "$source/README.md")
  # shellcheck disable=SC2016  # no commands
  sed -n '/^```c$/,/^```$/{/^```/d;p}' "$source/README.md" >example.c
  eval "$build $flags"
  expect "$(./a.out "$prefix/share/morwick/examples/kvr.bin")" "123456789 sectors written"
)

cmake -G Ninja -S "$source" -B "$work/static" -DBUILD_SHARED_LIBS=OFF -DMORWICK_PLATFORM="$platform" \
  -DCMAKE_C_FLAGS="$flags" -DCMAKE_CXX_FLAGS="$flags" >/dev/null
cmake --build "$work/static" --target morwick header-pages >/dev/null
cmake --install "$work/static" --prefix "$work/archives" --component libmorwick-dev >/dev/null
build_and_consume "$work/archives" static
