#!/usr/bin/env bash
# The shared library exports what the public headers declare, and nothing else.
# Usage: exports_test.sh LIBRARY INCLUDE_FOLDER
set -euo pipefail

documented=$(cat "$2"/morwick/*.h | tr '\n' ' ' | grep -oE 'MORWICK_EXPORT [^][;({]*[][(;]' |
  grep -v '__attribute__' | sed -E 's/.*[ *]([A-Za-z0-9_]+)[^A-Za-z0-9_]$/\1/' | sort)
# Names with two underscores, and gcov's mangle_path, are the toolchain's own.
exported=$(nm -D --defined-only "$1" | awk '{print $3}' | sed 's/@.*//' | grep -v -e '^__' -e '^mangle_path$' | sort)

[ "$(wc -l <<<"$documented")" -ge 30 ] || { echo "the headers were not understood"; exit 1; }
diff <(echo "$documented") <(echo "$exported") && echo "exports agree"
