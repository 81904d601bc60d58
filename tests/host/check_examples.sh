#!/bin/sh
# check_examples.sh PROGRAM DOCUMENT [LEFT_OUT]: each command behind a "$" of the document is carried
# out as it stands, and prints what stands below it; standard error counts as well. What is typed at
# a prompt is tried elsewhere, on a terminal. Commands that LEFT_OUT matches are left out. The
# commands share a copy of the examples. Where the output shows a time, any time will do, and any
# name behind it.
set -eu
program=$1
document=$2
left_out=${3-^$}
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
mkdir "$folder/copy"
cp -R "$(dirname -- "$0")/../../examples" "$folder/copy/examples"
cd "$folder/copy"
ln -s "$program" "$folder/velkor-config"
PATH=$folder:$PATH
export PATH

# One file for each command, and one for what it prints.
awk -v folder="$folder" -v left_out="$left_out" '
    function finish() {
        if (command != "" && output !~ /velkor> / && command !~ left_out) {
            file = sprintf("%s/%03d", folder, count)
            printf "%s", command > (file ".sh")
            printf "%s", output > (file ".out")
            close(file ".sh"); close(file ".out")
        }
        command = output = ""; continued = 0
    }
    /^    \$ / { finish(); ++count; command = substr($0, 7) "\n"; continued = /[\\|]$/; next }
    /^    / && command != "" {
        if (continued) { command = command substr($0, 5) "\n"; continued = /[\\|]$/; next }
        output = output substr($0, 5) "\n"
        next
    }
    { finish() }
    END { finish() }' "$document"

anytime() {
    if grep -q '[0-9]Z  ' "$expected"; then
        sed -E 's/[0-9-]+T[0-9:]+Z +[^ ]+/TIME WHO/; s/  +/  /g' "$1"
    else
        cat "$1"
    fi
}

examples=0
failed=0
for script in "$folder"/*.sh; do
    examples=$((examples + 1))
    expected=${script%.sh}.out
    sh "$script" >"$folder/printed" 2>&1 </dev/null || true
    anytime "$expected" >"$folder/wanted"
    anytime "$folder/printed" >"$folder/found"
    diff -u "$folder/wanted" "$folder/found" || { cat "$script" >&2; failed=1; }
done
[ $examples -ge 10 ] || { echo "only $examples examples were found" >&2; exit 1; }
exit $failed
