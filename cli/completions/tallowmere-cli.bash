# Completions of tallowmere-cli for bash.

_tallowmere_cli() {
  local -A options=(
    [volumes]='--json'
    [identify]='-0 --null --json'
    [spec]='--hex -0 --null --json'
    [path]='--other-volumes -0 --null --json'
    [hfs]='-0 --null --json'
    [posix]='-0 --null --json'
    [name]='-0 --null --json'
    [append]='-0 --null --json'
    [aiff]='--rate --bits --channels --format --output --json'
    [census]='--json'
    [alias]='--hex -0 --null --json'
    [serve-check]='--json'
  )
  # The command is the first word that is neither an option nor the value of one. In "--option=value",
  # "=" is a separate word.
  local i command=
  for ((i = 1; i < COMP_CWORD; i++)); do
    case ${COMP_WORDS[i]} in
      --service | --deadline)
        [[ ${COMP_WORDS[i + 1]} == = ]] && ((i++))
        ((i++))
        ;;
      --) [[ -n $command ]] && return ;;  # only items follow
      -*) ;;
      *) command=${command:-${COMP_WORDS[i]}} ;;
    esac
  done

  local word=${COMP_WORDS[COMP_CWORD]} before=${COMP_WORDS[COMP_CWORD - 1]} words=
  [[ $word == = ]] && word=
  [[ $before == = ]] && before=${COMP_WORDS[COMP_CWORD - 2]}
  case $before in
    --service | --output) return ;;  # a file
    --deadline | --rate | --bits | --channels) ;;
    --format) words='NONE twos sowt in24 in32 fl32 fl64 ulaw alaw ima4 MAC3 MAC6' ;;
    *)
      if [[ $word == -* && -n $command ]]; then
        words="${options[$command]} -h --help"
      elif [[ $word == -* ]]; then
        words='--service --deadline --version -h --help'
      elif [[ -z $command ]]; then
        words=${!options[*]}
      else
        return
      fi
      ;;
  esac
  # The words listed here are not files.
  compopt +o default 2>/dev/null
  mapfile -t COMPREPLY < <(compgen -W "$words" -- "$word")
}

# Completes files where nothing is listed.
complete -o default -F _tallowmere_cli tallowmere-cli
