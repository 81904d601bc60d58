#!/bin/sh
# check_openapi.sh FILE FOLDER: fails unless the validator accepts the OpenAPI description in FILE.
# The validator is installed in FOLDER, as package-lock.json beside this script says, once.
set -eu

here=$(dirname -- "$(readlink -f -- "$0")")
file=$1
folder=$2

mkdir -p "$folder"
if ! cmp -s "$here/package-lock.json" "$folder/installed.json"; then
    cp "$here/package.json" "$here/package-lock.json" "$folder"
    npm ci --prefix "$folder" --ignore-scripts --no-audit --no-fund
    cp "$here/package-lock.json" "$folder/installed.json"
fi
node "$folder/node_modules/@seriousme/openapi-schema-validator/bin/validate-api-cli.js" "$file"
