#!/bin/sh
# check_soname.sh READELF FOLDER NUMBER LIBRARY...: fails unless each library in FOLDER is known to
# the loader by its name with NUMBER.
set -eu
readelf=$1 folder=$2 number=$3
shift 3
for library; do
    "$readelf" -d "$folder/libvelkor-$library.so" | grep -F "[libvelkor-$library.so.$number]"
done
