#!/usr/bin/env bash
# Demonstrates a restore: installs apps on a device, backs it up, and restores everything to a new device, with both ways to
# install.
#
# usage: samples/demo-restore.sh [FOLDER]
#
# Creates all files in FOLDER, which must be missing or empty. Without FOLDER it uses a temporary folder and deletes it at
# the end. Runs the `appsync` on the PATH, or the one that ./dev build has built.
set -euo pipefail

samples="$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)"
# shellcheck source=samples/demo-common.sh
source "$samples/demo-common.sh"

data=root/var/mobile/Containers/Data

# content_of DEVICE: prints what a restore must preserve: each app with version, state and files, and all data.
content_of() {
  (
    cd "$1"
    appsync apps . --json | grep -oE '"(identifier|version)": "[^"]*"|"(placeholder|installType)": [a-z0-9]+' |
      grep -v '"installType": [0-6]'
    find root/var/mobile/Containers/Bundle -path '*.app/*' -type f -exec sha256sum {} + | grep -v '/org\.example\.' |
      sed -E 's|root/.*/Bundle/[^/]*/||' | sort -k 2
    find "$data" -type f -exec sha256sum {} + | sort -k 2
  )
}

# fill DEVICE: installs all apps, adds data to two and a licence to one, and demotes two.
fill() {
  run appsync sync "$1" library
  mkdir -p "$1/$data/org.example.ledger" "$1/$data/org.example.gambit"
  echo 'rent 420' >"$1/$data/org.example.ledger/entries"
  echo 'e4 c5 Nf3' >"$1/$data/org.example.gambit/favourites"
  run appsync set "$1" demote=org.example.gambit demote-auto=org.example.kettle-2 licence=org.example.tides:licence
}

make_apps "$samples"
# Four more apps, for a fuller home screen.
for app in Almanac Kettle Metronome Verdant; do
  cp -R "apps/$app" "apps/$app-2"
  sed -i -E 's|(<string>org\.example\.[a-z]+)(</string>)|\1-2\2|' "apps/$app-2/$app.app/Info.plist"
done
echo 'licence of the device demo' >licence
say 'Pack twelve apps'
for app in apps/*/; do
  app="${app%/}"
  appsync pack "$app" -o "library/${app#apps/}.zip" >/dev/null
done
ls library

for mode in coordinated direct; do
  say "A device that installs ${mode}, with twelve apps"
  run appsync init "phone-$mode" "--$mode"
  fill "phone-$mode"
  run appsync apps "phone-$mode"
  run appsync screen "phone-$mode" -o "$mode-1-before.png"

  say 'Back it up, and delete it'
  run appsync backup "phone-$mode" "backup-$mode"
  content_of "phone-$mode" >"$mode-before.txt"
  run rm -rf "phone-$mode"

  say 'Restore it: all apps are placeholders'
  run appsync init "phone-$mode" "--$mode"
  run appsync set "phone-$mode" store=library
  run appsync restore "phone-$mode" "backup-$mode" --log "$mode-restore.log"
  run appsync apps "phone-$mode"
  run appsync screen "phone-$mode" -o "$mode-2-placeholders.png"

  say 'The next sync installs the packages'
  run appsync sync "phone-$mode" library
  run appsync apps "phone-$mode"
  run appsync screen "phone-$mode" -o "$mode-3-after.png"
  content_of "phone-$mode" >"$mode-after.txt"
  run diff "$mode-before.txt" "$mode-after.txt"
  run cmp "$mode-1-before.png" "$mode-3-after.png"
  run appsync backup "phone-$mode" "backup-$mode-after"
  run cmp {"backup-$mode","backup-$mode-after"}/Apps/org.example.tides/ApplicationSINF
  say "Apps, versions, files, data, licence and demotion are unchanged ($mode)"
done
run diff coordinated-after.txt direct-after.txt

if [[ $# -gt 0 ]]; then
  say "The devices, backups, logs and pictures are in $1"
else
  say 'All files are deleted; "samples/demo-restore.sh FOLDER" keeps them, with pictures of the home screen'
fi
