#!/usr/bin/env bash
# The shared libraries, morwick's own and the platform's, export what the public headers declare, and
# nothing else.
# Usage: exports_test.sh INCLUDE_FOLDER LIBRARY...
set -euo pipefail
source "$(dirname "$0")/documented.sh"

documented=$(documented_symbols "$1")
# Names with two underscores, those of the C++ standard library's templates, and gcov's mangle_path are
# the toolchain's own.
exported=$(nm -D --defined-only "${@:2}" | awk 'NF == 3 {print $3}' | sed 's/@.*//' |
  grep -v -e '^__' -e '^_Z[A-Z]*St' -e '^mangle_path$' | sort)

[ "$(wc -l <<<"$documented")" -ge 45 ] || { echo "the headers were not understood"; exit 1; }
diff <(echo "$documented") <(echo "$exported") && echo "exports agree"
