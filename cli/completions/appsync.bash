# Completion of appsync for bash. Needs nothing but bash 4.4.

# Identifiers of the apps on the device that the command line names.
_appsync_apps() {
  [[ -f "$device/device.db" ]] || return 0
  "$program" apps "$device" --json 2>/dev/null | sed -n 's/^ *"identifier": "\([A-Za-z0-9._-]*\)",*$/\1/p'
}

# _appsync_offer BEFORE CANDIDATE...: offers the candidates that start with the typed word. BEFORE precedes each candidate
# in the same word. Readline replaces only the part after the last = or : of a word.
_appsync_offer() {
  local before="$1" candidate
  shift
  for candidate in "$@"; do
    candidate="$before$candidate"
    [[ "$candidate" != "$typed"* ]] || COMPREPLY+=("${candidate:${#kept}}")
  done
}

_appsync_offer_apps() {
  local apps
  mapfile -t apps < <(_appsync_apps)
  _appsync_offer "$1" ${apps[@]+"${apps[@]/%/${2-}}"}
}

# _appsync_offer_paths BEFORE KIND: KIND is an action of compgen, "file" or "directory".
_appsync_offer_paths() {
  local paths
  mapfile -t paths < <(compgen -A "$2" -- "${typed:${#1}}")
  compopt -o filenames 2>/dev/null
  _appsync_offer "$1" ${paths[@]+"${paths[@]}"}
}

_appsync_offer_settings() {
  local key="${typed%%=*}" value="${typed#*=}"
  if [[ "$typed" != *=* ]]; then
    compopt -o nospace 2>/dev/null
    _appsync_offer '' app-installation= app-removal= coordination= assertion= store= demote= demote-auto= licence=
    return
  fi
  case "$key" in
    app-installation | app-removal) _appsync_offer "$key=" yes no unset ;;
    coordination) _appsync_offer "$key=" on off unset ;;
    demote | demote-auto) _appsync_offer_apps "$key=" ;;
    store) _appsync_offer "$key=" unset && _appsync_offer_paths "$key=" directory ;;
    assertion | licence)
      if [[ "$value" != *:* ]]; then
        compopt -o nospace 2>/dev/null
        _appsync_offer_apps "$key=" :
      elif [[ "$key" == assertion ]]; then
        _appsync_offer "$key=${value%%:*}:" granted denied unknown failing unset
      else
        _appsync_offer_paths "$key=${value%%:*}:" file
      fi
      ;;
  esac
}

# _appsync_offer_positional COMMAND NUMBER, counted from 1.
_appsync_offer_positional() {
  case "$1 $2" in
    'pack 1' | 'sync 2' | 'backup 2' | 'restore 2') _appsync_offer_paths '' directory ;;
    'plist 1') _appsync_offer_paths '' file ;;
    'tap 2' | 'cancel 2') _appsync_offer_apps '' ;;
    set\ [2-9]*) _appsync_offer_settings ;;
    pack* | plist*) ;;
    *\ 1) _appsync_offer_paths '' directory ;;
  esac
}

# _appsync_offer_value OPTION BEFORE
_appsync_offer_value() {
  case "$1" in
    -o | --output | --log) _appsync_offer_paths "$2" file ;;
    --to) _appsync_offer "$2" xml binary json ;;
    --remove | --only) _appsync_offer_apps "$2" ;;
  esac
}

_appsync_options() {
  local options=(-h --help)
  case "$1" in
    init) options+=(--coordinated --direct) ;;
    pack | screen) options+=(-o --output) ;;
    sync) options+=(--remove --only --json --log) ;;
    restore) options+=(--json --log) ;;
    apps | report | history) options+=(--json) ;;
    plist) options+=(--to -o --output) ;;
  esac
  _appsync_offer '' "${options[@]}"
}

_appsync() {
  local line="${COMP_LINE:0:COMP_POINT}" words=() word option='' awaited='' positionals=()
  # shellcheck disable=SC2162 # backslashes are removed, as by the shell
  read -a words <<<"$line"
  [[ "$line" != *[!\\][[:blank:]] ]] || words+=('')
  COMPREPLY=()

  # The typed part of the word, and the part of it that Readline keeps.
  local piece="${2//[\\\"\']/}" typed="${words[-1]#[\"\']}" kept
  [[ "$typed" == *"$piece" ]] || typed="$piece" # blanks in quotes
  kept="${typed%"$piece"}"
  if [[ ${#words[@]} -le 2 ]]; then
    [[ "$typed" == -* ]] && _appsync_offer '' -h --help --version && return
    _appsync_offer '' init pack sync backup restore tap cancel apps report screen history set clear plist
    return
  fi

  for word in "${words[@]:2:${#words[@]}-3}"; do
    if [[ -n "$awaited" ]]; then
      awaited=''
    elif [[ "$word" == -* ]]; then
      option="$word"
      [[ ! "$word" =~ ^(-o|--output|--log|--to|--remove|--only)$ ]] || awaited="$word"
    else
      positionals+=("$word")
    fi
  done

  local program="${1/#\~\//$HOME/}" device="${positionals[0]-}" expected="${#positionals[@]}"
  device="${device/#\~\//$HOME/}"
  if [[ -n "$awaited" ]]; then
    _appsync_offer_value "$awaited" ''
  elif [[ "$typed" == --*=* ]]; then
    _appsync_offer_value "${typed%%=*}" "${typed%%=*}="
  elif [[ "$typed" == -* ]]; then
    _appsync_options "${words[1]}"
  elif [[ "${words[1]}" == sync && $expected -ge 2 ]]; then
    _appsync_offer_value "$option" '' # --remove and --only accept several apps
  else
    _appsync_offer_positional "${words[1]}" "$((expected + 1))"
  fi
}

complete -F _appsync appsync
