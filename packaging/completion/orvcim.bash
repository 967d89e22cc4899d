# Completion of orvcim(1) for bash. Commands, options and their values are those that its own help lists.

# The words in the first column of a part of the help: _orvcim_listed PART [COMMAND]...
_orvcim_listed() {
  local part=$1
  shift
  orvcim "$@" --help 2>/dev/null | awk -v part="$part:" '
    /^[A-Za-z]/ { inside = $0 == part }
    inside && /^  [^ ]/ { count = split($1, words, ","); for (i = 1; i <= count; i++) { sub("[={].*", "", words[i]); print words[i] } }'
}

_orvcim_formats() {
  orvcim --help 2>/dev/null | awk '$1 == "--format" { gsub(/\([^)]*\)|,| or /, " "); for (i = 3; i <= NF; i++) print $i }'
}

_orvcim() {
  local current=${COMP_WORDS[COMP_CWORD]} commands=() found word
  COMPREPLY=()
  # The commands so far; what stands between them are options and arguments.
  for word in "${COMP_WORDS[@]:1:COMP_CWORD-1}"; do
    if [[ $word == [a-z]* ]] && _orvcim_listed Subcommands "${commands[@]}" | grep --quiet --line-regexp -e "$word"; then
      commands+=("$word")
    fi
  done
  case ${COMP_WORDS[COMP_CWORD - 1]} in
  --format)
    found=$(_orvcim_formats)
    ;;
  --schema | --provider-path | --tls-cert | --tls-key | --pam-folder)
    mapfile -t COMPREPLY < <(compgen -f -- "$current")
    return
    ;;
  --read-group | --power-group)
    mapfile -t COMPREPLY < <(compgen -g -- "$current")
    return
    ;;
  *)
    if [[ $current == -* ]]; then
      found=$(_orvcim_listed Options "${commands[@]}")
      [[ ${#commands[@]} == 0 ]] || found+=" $(_orvcim_listed Options)"
    elif [[ ${commands[*]} == names || ${commands[*]} == instances ]]; then
      found=$(orvcim classes 2>/dev/null | awk 'NR > 1 { print $1 }')
    else
      found=$(_orvcim_listed Subcommands "${commands[@]}")
    fi
    ;;
  esac
  mapfile -t COMPREPLY < <(compgen -W "$found" -- "$current")
}
complete -F _orvcim orvcim
