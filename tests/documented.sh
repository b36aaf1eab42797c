# shellcheck shell=bash
# Functions that list what the public headers in the folder $1 declare. Other scripts source this file.

headers() { cat "$1"/morwick/*.h | tr '\n' ' '; }

# The functions and globals that the shared libraries export.
documented_symbols() {
  headers "$1" | grep -oE 'MORWICK_EXPORT [^][;({]*[][(;]' | grep -v '__attribute__' |
    sed -E 's/.*[ *]([A-Za-z0-9_]+)[^A-Za-z0-9_]$/\1/' | sort
}

documented_records() { headers "$1" | grep -oE 'typedef struct [A-Za-z]+ \{' | cut -d ' ' -f 3; }

documented_enumerators() {
  headers "$1" | sed -E 's|/\*[^*]*\*/||g' | grep -oE 'enum [A-Za-z]* ?\{[^}]*\}' | grep -oE '\bk[A-Z]\w*'
}
