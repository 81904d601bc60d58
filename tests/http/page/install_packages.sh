#!/bin/sh
# install_packages.sh NPM FOLDER: installs in FOLDER, unless that is done, what package-lock.json
# beside this script says.
set -eu

here=$(dirname -- "$(readlink -f -- "$0")")
npm=$1
folder=$2

mkdir -p "$folder"
cmp -s "$here/package-lock.json" "$folder/installed.json" && exit 0
cp "$here/package.json" "$here/package-lock.json" "$folder"
"$npm" ci --prefix "$folder" --ignore-scripts --no-audit --no-fund
cp "$here/package-lock.json" "$folder/installed.json"
