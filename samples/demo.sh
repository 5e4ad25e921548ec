#!/usr/bin/env bash
# Demonstrates appsync: packs the sample apps, synchronises a device with them, and draws its home screen.
#
# usage: samples/demo.sh [FOLDER]
#
# Creates all files in FOLDER, which must be missing or empty. Without FOLDER it uses a temporary folder and deletes it at
# the end. Runs the `appsync` on the PATH, or the one that ./dev build has built.
set -euo pipefail

samples="$(cd "$(dirname "${BASH_SOURCE[0]}")" && pwd)"
# shellcheck source=samples/demo-common.sh
source "$samples/demo-common.sh"

# contents DEVICE: prints its apps and their files, without the names of containers and the order of installation.
contents() {
  appsync apps "$1" | sort
  (cd "$1/root/var/mobile/Containers/Bundle" && find . -type f -exec sha256sum {} +) | sed 's|\./[^/]*/||' | sort
}

make_apps "$samples"

say 'Pack the apps'
for app in apps/*/; do
  app="${app%/}"
  run appsync pack "$app" -o "library/${app#apps/}.zip"
done

say 'Create a device and install everything'
run appsync init phone
run appsync sync phone library
run appsync apps phone
run appsync screen phone -o screen.png

say 'A second sync finds nothing to do'
run appsync sync phone library

say 'A new version of one app, and another one removed'
run sed -i 's/<string>1.0</<string>1.1</' apps/Tides/Tides.app/Info.plist
run appsync pack apps/Tides -o library/Tides-1.1.zip
run appsync sync phone library --remove org.example.gambit
run appsync apps phone
run appsync screen phone -o screen-2.png

say 'A removed app is sent again only on request'
run appsync sync phone library
run appsync sync phone library --only org.example.gambit

say 'This device installs through coordinators; one that installs directly ends with the same apps and files'
run appsync init direct-phone --direct
run appsync sync direct-phone library
if ! diff <(contents phone) <(contents direct-phone); then
  echo 'demo: the two devices differ' >&2
  exit 1
fi
echo 'The two devices are equal.'

if [[ $# -gt 0 ]]; then
  say "The devices and the pictures are in $1: phone, direct-phone, screen.png, screen-2.png"
else
  say 'All files are deleted; "samples/demo.sh FOLDER" keeps them, with pictures of the home screen'
fi
