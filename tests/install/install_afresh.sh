#!/bin/sh
# install_afresh.sh CMAKE BUILD PREFIX [OPTION...]: installs what was built in BUILD into the new
# folder PREFIX.
set -eu
cmake=$1 build=$2 prefix=$3
shift 3
rm -rf "$prefix"
"$cmake" --install "$build" --prefix "$prefix" "$@"
