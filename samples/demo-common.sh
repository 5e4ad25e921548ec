# Shared part of the demos; source it with the demo's arguments and $samples set. Finds the command, changes to the folder of
# the demo, and defines say, run and make_apps.
# shellcheck shell=bash
command -v appsync >/dev/null || PATH="$samples/../build/bin:$PATH"
command -v appsync >/dev/null || {
  echo "demo: appsync is not built; run ./dev build" >&2
  exit 1
}

if [[ $# -gt 0 ]]; then
  mkdir -p "$1"
  folder="$(cd "$1" && pwd)"
  if [[ -n "$(ls -A "$folder")" ]]; then
    echo "demo: $1 is not empty; give a new folder" >&2
    exit 1
  fi
else
  folder="$(mktemp -d)"
  trap 'rm -rf "$folder"' EXIT
fi
cd "$folder"

bold='' plain=''
if [[ -t 1 ]]; then
  bold=$'\e[1m' plain=$'\e[0m'
fi

say() { printf '\n%s# %s%s\n' "$bold" "$*" "$plain"; }

# run COMMAND...: prints the command as a user would type it, then runs it.
run() {
  local word shown='$'
  for word in "$@"; do
    [[ "$word" == *[^a-zA-Z0-9_./=-]* ]] && word="'$word'"
    shown+=" $word"
  done
  printf '%s%s%s\n' "$bold" "$shown" "$plain"
  "$@"
}

# make_apps SAMPLES: copies the sample apps to apps/ and creates an empty library.
make_apps() {
  cp -R "$1" apps
  rm -f apps/*.sh apps/draw_icons.py
  mkdir library
}
