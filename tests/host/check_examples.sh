#!/bin/sh
# check_examples.sh PROGRAM DOCUMENT: each block of the document whose first line is "$ velkor-config
# ..." or a pipe into it is carried out as it stands, and prints what stands below each command.
# Standard error counts as well. Programs that ask for a terminal, and what is different each time,
# are left out: a command without output that writes no file, and one that shows a time or a name.
# The commands share a copy of the examples.
set -eu
program=$1
document=$2
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
mkdir "$folder/work"
cp -R "$(dirname -- "$0")/../../examples" "$folder/work/examples"
cd "$folder/work"
ln -s "$program" "$folder/velkor-config"
PATH=$folder:$PATH
export PATH

# One file for each command, and one for what it prints.
awk -v folder="$folder" '
    function finish() {
        if (command != "" && (output != "" || command ~ / > /) && output !~ /velkor> |[0-9]Z  / && count > 0) {
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

examples=0
failed=0
for script in "$folder"/*.sh; do
    examples=$((examples + 1))
    sh "$script" >"$folder/found" 2>&1 </dev/null || true
    diff -u "${script%.sh}.out" "$folder/found" || { cat "$script" >&2; failed=1; }
done
[ $examples -ge 10 ] || { echo "only $examples examples were found" >&2; exit 1; }
exit $failed
