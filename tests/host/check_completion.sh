#!/bin/bash
# check_completion.sh PROGRAM: what bash offers by the completion that the program makes of itself.
set -eu
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
"$1" --manual bash >"$folder/completion"
cd "$folder"
touch one.properties '*' '[ab]' a
. ./completion
complete -p velkor-config >/dev/null

compopt() { :; }  # it works only while bash itself completes
failed=0

# expect OFFERED WORD...: the last word is the one that is completed.
expect() {
    local offered=$1
    shift
    COMP_WORDS=("$@")
    COMP_CWORD=$(($# - 1))
    _velkor_config || true
    local found="${COMPREPLY[*]-}"
    [[ $found == "$offered" ]] && return
    echo "${*}: offered '$found', not '$offered'" >&2
    failed=1
}

expect '--source --set --state' velkor-config --s
expect '--etcd' velkor-config --et
expect '' velkor-config --etcd o
expect '--watch-files' velkor-config one.properties --wa
expect 'one.properties' velkor-config o
expect 'one.properties' velkor-config --state o
expect '' velkor-config --env o
expect 'put' velkor-config -- pu
expect 'velkor.configuration.get' velkor-config one.properties -- velkor.configuration.g
expect '--type' velkor-config -- put key --t
expect 'string stringArray' velkor-config -- put key value --type s
expect '' velkor-config -- put key --for o
expect 'one.properties' velkor-config -- load o
expect 'history help' velkor-config -- help h
# Names that are patterns stay what they are.
expect '*' velkor-config '*'
expect '[ab]' velkor-config --state '['
exit $failed
