# Completions of tallowmere-cli for bash.

_tallowmere_cli() {
  local -A options=(
    [volumes]='--json'
    [identify]='-0 --null --existing -q --quiet --json'
    [spec]='--hex -0 --null --null-output --existing -q --quiet --no-progress --json'
    [path]='--volume --volumes --byte-order --packed --skip --stride --other-volumes -0 --null --null-output --existing -q --quiet --no-progress --json'
    [hfs]='-0 --null --null-output --existing -q --quiet --no-progress --json'
    [posix]='--map --volumes -0 --null --null-output --existing -q --quiet --no-progress --json'
    [name]='-0 --null --null-output --existing -q --quiet --no-progress --json'
    [append]='-0 --null --null-output --existing -q --quiet --no-progress --json'
    [aiff]='--rate --bits --channels --format --output --json'
    [census]='-q --quiet --no-progress --json'
    [alias]='--target --map --volumes --hex -0 --null --null-output -q --quiet --no-progress --json'
    [serve-check]='--json'
    [help]=
  )
  # The command is the first word that is neither an option nor the value of one. In "--option=value",
  # "=" is a separate word.
  local i command=
  for ((i = 1; i < COMP_CWORD; i++)); do
    case ${COMP_WORDS[i]} in
      --service | --deadline | --volume | --volumes | --byte-order | --skip | --stride | --map)
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
    --service | --output | --volume | --volumes | --map) return ;;  # a file
    --deadline | --rate | --bits | --channels | --skip | --stride) ;;
    --byte-order) words='big little' ;;
    --format)
      # As one word for the shell, which quotes nothing here.
      [[ 'raw ' == "$word"* ]] && COMPREPLY=('raw\ ')
      words='NONE twos sowt in24 in32 fl32 fl64 ulaw alaw ima4 MAC3 MAC6'
      ;;
    *)
      if [[ $word == -* && -n $command ]]; then
        words="${options[$command]} -h --help"
      elif [[ $word == -* ]]; then
        words='--service --deadline -V --version -h --help'
      elif [[ -z $command || $command == help ]]; then
        words=${!options[*]}
      else
        return
      fi
      ;;
  esac
  # The words listed here are not files.
  compopt +o default 2>/dev/null
  mapfile -t -O ${#COMPREPLY[@]} COMPREPLY < <(compgen -W "$words" -- "$word")
}

# Completes files where nothing is listed.
complete -o default -F _tallowmere_cli tallowmere-cli
