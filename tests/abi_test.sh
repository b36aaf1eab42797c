#!/usr/bin/env bash
# The binary interface is that of the baseline, tests/morwick.abi: every public record with its offsets,
# every enumerator, and the signature of every exported function and global. Then each line of
# tests/cases/abi_breaks.txt breaks a copy of the headers, and must be noticed.
# ABI_UPDATE=yes in the environment takes into the baseline what was added, where nothing else was changed;
# ABI_UPDATE=reserved takes everything, for a field that came out of reserved room. Read the report first.
# Usage: abi_test.sh INCLUDE_FOLDER
set -euo pipefail
tests=$(realpath "$(dirname "$0")")
source "$tests/documented.sh"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

# Writes the binary interface of the headers in a folder. Each fact is the type of a variable: a function's
# signature, a record, and an enumerator's number plus 1000, so that it is positive, as the length of an array.
# Usage: describe INCLUDE_FOLDER FILE
describe() {
  {
    echo '#include "morwick/morwick.h"'
    for name in $(documented_symbols "$1"); do echo "__typeof__($name) *symbol_$name;"; done
    for name in $(documented_records "$1"); do echo "$name *record_$name;"; done
    for name in $(documented_enumerators "$1"); do echo "char enumerator_${name}[1000 + $name];"; done
  } >"$work/interface.c"
  include=$(realpath "$1")
  (cd "$work" && cc -std=c11 -g -shared -fPIC -I "$include" interface.c -o interface.so)
  abidw --no-corpus-path --no-comp-dir-path --no-show-locs --out-file "$2" "$work/interface.so"
}

describe "$1" "$work/now.abi"
case ${ABI_UPDATE:-} in
  yes) ! abidiff --harmless --no-added-syms "$tests/morwick.abi" "$work/now.abi" || cp "$work/now.abi" "$tests/morwick.abi" ;;
  reserved) cp "$work/now.abi" "$tests/morwick.abi" ;;
esac
abidiff --harmless "$tests/morwick.abi" "$work/now.abi" || {
  echo "What was added belongs into the baseline (ABI_UPDATE=yes). What was changed or removed breaks tools that"
  echo "were built before: they would read other fields and call other functions. A field that only came out of"
  echo "reserved or unprinted room breaks none (ABI_UPDATE=reserved)."
  exit 1
}

while IFS='|' read -r header edit; do
  cp -rT "$1" "$work/include"
  sed -i -E "$edit" "$work/include/morwick/${header% }"
  describe "$work/include" "$work/broken.abi"
  ! abidiff --harmless "$tests/morwick.abi" "$work/broken.abi" >/dev/null || { echo "not noticed, or changes nothing: $edit"; exit 1; }
done < <(grep '^[a-z]' "$tests/cases/abi_breaks.txt")
echo "the interface is as it was, and every break of it was noticed"
