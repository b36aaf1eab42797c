# shellcheck shell=bash
# bash completion for morwick

_morwick() {
  local current=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
  local command=${COMP_WORDS[1]} words=""
  case $previous in
    -s | --stream) words="kvr ftl msp" ;;
    -c | --controller)
      words="VeltoQRN3NVMeController VeltoEmbeddedNVMeController KVRStorage"
      ;;
    -o | --output-format)
      [ "$command" = stats ] && words="normal json prometheus" || words="normal csv"
      ;;
    *)
      case $COMP_CWORD:$command in
        1:*) words="find stats snapshot capacity --help --version" ;;
        *:stats) words="--stream --controller --output-format --help" ;;
        *:snapshot) words="--header --output-format --help" ;;
        *) words="--help" ;;
      esac
      if [[ $COMP_CWORD -gt 1 && $current != -* ]]; then
        mapfile -t COMPREPLY < <(compgen -f -- "$current")
        return
      fi
      ;;
  esac
  mapfile -t COMPREPLY < <(compgen -W "$words" -- "$current")
}

complete -o filenames -F _morwick morwick
