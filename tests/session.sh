#!/usr/bin/env bash
# Plays a session, a file of commands as a person types them ("$ command", "> and more of it") and of
# what they print, indented by four, with the exit status in brackets when it is not 0; fails with the
# difference. In a document, a file of Markdown, the commands are indented too, and what is indented
# without one before it is not played.
# GRELLON, MORWICK and SOURCE name the programs and the tree, FAST_SLEEP, FAST_WATCH and ODD_DRIVER
# libraries to preload; ctest sets them. SANITIZED is set for sanitizers, which cannot run with little memory.
# Usage: session.sh SESSION; with SESSION_UPDATE=yes what is printed now is written into the session, but not
# into a document.
set -uo pipefail
session=$(realpath "$1")
work=$(mktemp -d)
trap 'kill "${pid:-}" "$watcher" 2>/dev/null; rm -rf "$work" "$work.now"' EXIT
cd "$work" || exit 1
: "${SANITIZED:=}"
cp -r "$SOURCE"/examples/{*.bin,fleet} .
[[ $session != *.md ]] || { SESSION_UPDATE= && sed -E 's/^    ([$>] )/\1/' "$session" >document && session=$PWD/document; }
export LD_PRELOAD=

# With pauses a thousand times shorter. verify_asan_link_order: a sanitizer would insist on being loaded first.
fast() { LD_PRELOAD=$FAST_SLEEP ASAN_OPTIONS=verify_asan_link_order=0 "$@"; }
# A watch, with pauses and seconds a thousand times shorter.
fast_watch() { LD_PRELOAD=$FAST_WATCH ASAN_OPTIONS=verify_asan_link_order=0 "$MORWICK" watch "$@"; }
# Runs a command with at most that many KiB of memory, so that a leak ends it; a sanitizer needs more.
with_memory() { ([ "$SANITIZED" ] || ulimit -v "$1" && "${@:2}"); }
# The screen of a terminal at a command's end, as tests/terminal.py has it, without times and rates.
screen() {
  /usr/bin/python3 "$SOURCE/tests/terminal.py" "$@" 2>&1 |
    sed 's/^[-0-9]* [:0-9]*, [.0-9]* s/TIME/; s/ [0-9.-]*\.[0-9]*/ RATE/' | tr -s ' '
}
# Runs morwick with a clock that stands at these milliseconds since 1970.
at() { NOW=$1 LD_PRELOAD=$FAST_WATCH ASAN_OPTIONS=verify_asan_link_order=0 "$MORWICK" "${@:2}" 2>/dev/null; }
# Runs the command. With -o json its output and messages are kept for the checks at the end: the schema,
# and that the simulated drivers complain of no handle that was left open.
morwick() {
  case " $* " in *" json "*) ;; *) "$MORWICK" "$@"; return ;; esac
  "$MORWICK" "$@" >object 2>errors
  local status=$?
  tee -a complaints <errors >&2
  tee -a objects <object
  return $status
}
grellon() { "$GRELLON" "$@"; }
scenario() { printf %b "$1" >scenario.toml && export GRELLON_SCENARIO=scenario.toml; }
# The 32-bit little-endian numbers, one after the other.
le32() { perl -e 'print pack "V*", map { /^0x/ ? hex : $_ } @ARGV' -- "$@"; }
# A snapshot header: record size, number of fields. Then each of its fields: kind, offset, size, text.
layout() { le32 0 6 "$1" 5 0 0 40 0 0 0 "$2" 0; }
field() { perl -e 'print pack "V3 a16", @ARGV' -- "$@"; }

# Runs a program as somebody who may not read everything, as root may.
unprivileged() { if [ "$UID" = 0 ]; then setpriv --bounding-set=-all --inh-caps=-all "$@"; else "$@"; fi; }
# Runs a script of the shell with file systems of its own. Where it may not mount any, the script runs without.
mounting() {
  local own
  for own in "unshare -m" "unshare -rm" unprivileged; do $own true 2>error && break; done
  $own sh -c "$1"
}
# Runs a program that reads its input from a terminal, which hangs up once all is read.
hang_up() { /usr/bin/python3 "$SOURCE/tests/hang_up.py" "$@"; }
# Runs a program and sends it a signal after some time. Usage: after SECONDS SIGNAL PROGRAM...
after() { timeout --foreground --preserve-status -s "$2" "$1" "${@:3}"; }

# Runs a program whose standard input and output do not block, as another program may have left them.
unblocked() {
  /usr/bin/python3 -c 'import os, sys
for file in 0, 1: os.set_blocking(file, False)
os.execvp(sys.argv[1], sys.argv[1:])' "$@"
}
# Waits, for 20 seconds at most, until a command succeeds.
await() {
  for _ in {1..1000}; do "$@" && return; sleep 0.02; done
  echo "in vain: $*"
}

# The daemon in the background: start it (with a library preloaded), wait until its log says something,
# signal and await it.
start() {
  : >log
  LD_PRELOAD=${1:-} ASAN_OPTIONS=verify_asan_link_order=0 "$GRELLON" >log 2>&1 &
  pid=$!
}
wait_for() { await grep -q -- "$1" log; }
stop() { SECONDS=0; kill "-$1" "$pid"; wait "$pid"; echo "status $?, $([ $SECONDS -le 6 ] && echo "in time" || echo "after $SECONDS s")"; }

# Ends the session after two minutes in one command, and says in which.
while sleep 1 >/dev/null 2>&1; do
  [ -z "$(find "$work.now" -mmin +2 2>/dev/null)" ] && continue
  echo "this does not end: $(cat "$work.now")"
  commands=$(</proc/$$/task/$$/children)
  kill $$
  for each in $commands; do [ "$each" = "$BASHPID" ] || kill -KILL "$each"; done
done &
watcher=$!
disown  # or a session's own `wait` would wait for it

perform() {
  [ -n "$command" ] || return
  printf '%s\n' "$command" >"$work.now"
  eval "$command" >output 2>&1 </dev/null
  local status=$?
  sed 's/^/    /' output
  [ $status -eq 0 ] || echo "    [$status]"
  command=
}
command=
{
  while IFS= read -r -u 9 line; do
    case $line in
      '$ '*) perform; command=${line#\$ } ;;
      '> '*) command+=$'\n'${line#> } ;;
      '    '*) [ -n "$command" ] || printf '%s\n' "$line"; continue ;;
      *) perform ;;
    esac
    printf '%s\n' "$line"
  done 9<"$session"
  perform
} >played
[ "${SESSION_UPDATE:-}" = yes ] && cp played "$session"
diff -U6 -F '^\$ ' --label expected --label played "$session" played || exit 1
! grep -s -e "still open" -e "already released" complaints || exit 1
[ ! -s objects ] || { split -a 5 -l 1 objects object. && printf -- '-i%s\n' object.* |
  xargs /usr/bin/python3 -m jsonschema "$SOURCE/docs/morwick.schema.json"; } || exit 1
echo "as expected"
