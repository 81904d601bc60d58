#!/bin/sh
# check_session.sh SESSION PROGRAM [ARGUMENT...]: serves by PROGRAM with the arguments, and fails
# unless the lines of the file SESSION that begin with "$ " print what stands below each of them.
# They are carried out as they are: curl takes the port 8080 for the one that PROGRAM has picked.
set -eu
cd "$(dirname -- "$0")/../.."
session=$1
shift

work=$(mktemp -d)
mkfifo "$work/said"
"$@" --listen 127.0.0.1:0 </dev/null >"$work/said" 2>"$work/log" &
server=$!
trap 'kill "$server"; wait "$server" || :; rm -r "$work"' EXIT

exec 3<"$work/said"
read -r line <&3 || { cat "$work/log" >&2; exit 1; }
port=${line##*:}
cat >"$work/.curlrc" <<END
connect-to = "127.0.0.1:8080:127.0.0.1:${port%/}"
noproxy = "*"
END
export CURL_HOME="$work"

sed -n 's/^\$ //p' "$session" | while read -r command; do
    printf '$ %s\n' "$command"
    sh -c "$command" 2>/dev/null | sed '$a\'
done >"$work/printed"
diff -u "$session" "$work/printed"
