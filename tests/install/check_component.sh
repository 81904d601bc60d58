#!/bin/sh
# check_component.sh CMAKE BUILD FOLDER COMPONENT LIST: installs one component of what was built in
# BUILD into a new folder of FOLDER, and fails unless that gives exactly the files of LIST.
set -eu
here=$(dirname -- "$0")
"$here/install_afresh.sh" "$1" "$2" "$3/$4" --component "$4"
exec "$here/check_files.sh" "$3/$4" "$5"
