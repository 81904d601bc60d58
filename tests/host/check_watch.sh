#!/bin/bash
# check_watch.sh PROGRAM EXAMPLE: watches a key of a copy of the property file EXAMPLE in a session
# of PROGRAM, and fails unless every way to change the file brings the new value up.
set -euo pipefail
program=$1
example=$2
patience=60 # seconds; only a broken program takes so long

folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

# A folder with the example where server.port is $2.
make_version() {
    mkdir "$folder/$1"
    sed "s/^server\.port.*/server.port = $2/" "$example" >"$folder/$1/file.properties"
}

make_version first 1
make_version second 6
ln -s first "$folder/current"
file=$folder/current/file.properties

coproc SESSION { exec "$program" --watch-files "$file"; }
session=$SESSION_PID
exec {answers}<&"${SESSION[0]}" {commands}>&"${SESSION[1]}"

expect() {
    local line=
    read -r -t "$patience" -u "$answers" line || true
    [ "$line" = "$1" ] && return
    printf 'expected: %s\nfound: %s\n' "$1" "$line" >&2
    exit 1
}

echo 'watch server.port' >&"$commands"
expect "server.port = '1'"

sed -i 's/^server\.port.*/server.port = 2/' "$file"
expect "server.port = '2'"

sed 's/^server\.port.*/server.port = 3/' "$example" >"$folder/new"
mv "$folder/new" "$file"
expect "server.port = '3'"

sed 's/^server\.port.*/server.port = 4/' "$example" >"$file"
expect "server.port = '4'"

rm "$file"
sed 's/^server\.port.*/server.port = 5/' "$example" >"$file"
expect "server.port = '5'"

# All that a link leads to is another folder at once.
ln -s second "$folder/next"
mv -T "$folder/next" "$folder/current"
expect "server.port = '6'"

echo quit >&"$commands"
wait "$session"
