# Completion of velksharing for bash: groups, commands and options, as --help names them.

_velksharing_words() {
  "$@" --help 2>/dev/null | awk '
    /^Subcommands:/ { commands = 1 }
    /^(Options|Positionals|Example):/ { commands = 0 }
    commands && /^  [a-z]/ { print $1 }
    /^  -/ { sub(/^.*,/, "", $1); print $1 }'
}

_velksharing() {
  local word=${COMP_WORDS[COMP_CWORD]} previous=${COMP_WORDS[COMP_CWORD - 1]}
  local -a command=("${COMP_WORDS[0]}")
  COMPREPLY=()
  case $previous in
    --password-file | --session-file | --path | --qr-svg | backup)
      mapfile -t COMPREPLY < <(compgen -f -- "$word")
      return
      ;;
    --owner | --user | --as)
      mapfile -t COMPREPLY < <(compgen -u -- "$word")
      return
      ;;
    --group)
      mapfile -t COMPREPLY < <(compgen -g -- "$word")
      return
      ;;
    --state)
      mapfile -t COMPREPLY < <(compgen -W "active pending used-up expired disabled" -- "$word")
      return
      ;;
    --redirect)
      mapfile -t COMPREPLY < <(compgen -W "none url_param always" -- "$word")
      return
      ;;
    --sort)
      mapfile -t COMPREPLY < <(compgen -W \
        "id hash project owner start expire uses use-count" -- "$word")
      return
      ;;
  esac
  ((COMP_CWORD > 1)) && command+=("${COMP_WORDS[1]}")
  ((COMP_CWORD > 2)) && command+=("${COMP_WORDS[2]}")
  mapfile -t COMPREPLY < <(compgen -W "$(_velksharing_words "${command[@]}")" -- "$word")
}

complete -F _velksharing velksharing
