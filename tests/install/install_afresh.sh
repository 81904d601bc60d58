#!/bin/sh
# install_afresh.sh CMAKE BUILD PREFIX: installs what was built in BUILD into the new folder PREFIX.
set -eu
rm -rf "$3"
"$1" --install "$2" --prefix "$3"
