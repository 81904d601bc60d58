#!/bin/sh
# run_with_pkg_config.sh COMPILER LIBDIR SOURCE PROGRAM: builds SOURCE into PROGRAM with the flags
# that pkg-config gives for the libraries installed in LIBDIR, and runs it.
set -eu
compiler=$1 libdir=$2 source=$3 program=$4
# The flags are quoted for a shell.
eval "set -- $(PKG_CONFIG_PATH="$libdir/pkgconfig" pkg-config --cflags --libs velkor)"
"$compiler" -std=c++17 "$source" -o "$program" "$@" -Wl,-rpath,"$libdir"
exec "$program"
