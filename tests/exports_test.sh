#!/usr/bin/env bash
# The shared libraries, morwick's own and the platform's, export what the public headers declare with the
# version MORWICK_1, and nothing else; the package's list of symbols has the same ones.
# Usage: exports_test.sh INCLUDE_FOLDER LIBRARY...
set -euo pipefail
source "$(dirname "$0")/documented.sh"

documented=$(documented_symbols "$1" | sed 's/$/@MORWICK_1/')
# Names with two underscores and gcov's mangle_path are those of sanitizers and coverage.
exported=$(nm -D --defined-only "${@:2}" | awk 'NF == 3 && $2 != "A" {print $3}' | sed 's/@@/@/' |
  grep -v -e '^__' -e '^mangle_path@' | sort)
packaged=$(awk '/@MORWICK_1 / && !/^ MORWICK_1@/ {print $1}' "$(dirname "$0")/../debian/libmorwick1.symbols" | sort)

diff <(echo "$documented") <(echo "$exported")
diff <(echo "$documented") <(echo "$packaged") || { echo "debian/libmorwick1.symbols lists others"; exit 1; }
echo "exports agree"
