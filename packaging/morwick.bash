# shellcheck shell=bash
# bash completion for morwick, from the program's own help.

_morwick() {
  local program=$1 current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
  local command=${COMP_WORDS[1]} help line="" before="" suffix=""
  # bash splits --option=value into three words.
  if [ "$current" = = ]; then
    current="" before="="
  elif [ "$previous" = = ]; then
    previous=${COMP_WORDS[COMP_CWORD - 2]} before="="
  fi
  if [ "$COMP_CWORD" -eq 1 ] || [ "$command" = help ]; then
    help=$("$program" --help)
    line="{$(sed -n '1,/^Subcommands:/d; s/^  \([a-z]*\).*/\1/p' <<<"$help")}"
  else
    help=$("$program" help "$command" 2>/dev/null) || return
    # The line of the option that needs a value, or else the line of the arguments.
    line=$([[ $previous == -* ]] && grep -E "^  (-.,)?$previous [A-Z]{2}|^  $previous,--[a-z-]+ [A-Z]{2}" <<<"$help") ||
      line=$(grep -E '^  (FILE|OLD|BUFFER|STREAM)' <<<"$help")
    # STREAM=FILE: complete the stream before the sign, and a file after it.
    case $line in
      *STREAM=FILE*) [ "$before" = = ] && line=FILE || suffix="=" ;;
    esac
  fi
  case $current:$line in
    -*) mapfile -t COMPREPLY < <(compgen -W "$(grep -oE -- '--[a-z-]+' <<<"$help")" -- "$current") ;;
    *"{"*"}"*)
      line=${line#*\{}
      mapfile -t COMPREPLY < <(compgen -S "$suffix" -W "$(tr , ' ' <<<"${line%%\}*}")" -- "$current")
      [ -z "$suffix" ] || compopt -o nospace
      ;;
    *FILE* | *OLD*) mapfile -t COMPREPLY < <(compgen -f -- "$current") && compopt -o filenames ;;
  esac
}

complete -F _morwick morwick
