#!/bin/sh
# check.sh CASE CMAKE COMPILER PROJECT BUILD: builds the miniature in the folder BUILD, with the
# package that `spare` needs and without (CASE `build`), or checks one thing about what was built.
set -eu
case=$1 cmake=$2 compiler=$3 project=$4 build=$5
here=$project/tests/install/miniature
imaginary=-DImaginary_DIR=$here/imaginary

fail() {
    echo "$*"
    exit 1
}

configure() {
    "$cmake" -G Ninja -DCMAKE_CXX_COMPILER="$compiler" -DCMAKE_INSTALL_LIBDIR=lib \
        -DVELKOR_CMAKE="$project/cmake" -DCMAKE_BUILD_TYPE=Release "$@" 2>&1
}

# build_in NAME [OPTION...]: into BUILD/NAME, installed in its `prefix`.
build_in() {
    folder=$build/$1
    shift
    rm -rf "$folder"
    configure -S "$here" -B "$folder" "$@" >"$folder.log" || fail "$(cat "$folder.log")"
    "$cmake" --build "$folder"
    "$cmake" --install "$folder" --prefix "$folder/prefix"
}

# use NAME [OPTION...]: configures the consumer against BUILD/NAME, builds it and runs it.
use() {
    against=$build/$1/prefix
    shift
    folder=$build/consumer-$case
    rm -rf "$folder"
    configure -S "$here/consumer" -B "$folder" -DCMAKE_PREFIX_PATH="$against" "$@" >"$folder.log" ||
        fail "$(cat "$folder.log")"
    "$cmake" --build "$folder" >"$folder.log" || fail "$(cat "$folder.log")"
    "$folder/consumer"
}

# says TEXT COMMAND...: fails unless the command prints exactly the text.
says() {
    text=$1
    shift
    printed=$("$@") || fail "$printed"
    [ "$printed" = "$text" ] || fail "instead of '$text': $printed"
}

# refused REASON NAME [OPTION...]: fails unless the consumer can't be configured for the reason, which
# CMake breaks into lines.
refused() {
    reason=$1
    shift
    ! printed=$(use "$@") || fail "not refused: $printed"
    printf '%s\n' "$printed" | tr -s '\n ' ' ' | grep -qF "$reason" || fail "instead of '$reason': $printed"
}

case $case in
    build)
        mkdir -p "$build"
        build_in with "$imaginary"
        build_in without
        ;;
    says-what-is-left-out)
        says "velkor::spare is left out, not found: Imaginary 2.0 COMPONENTS unit
velkor::on-top is left out, not found: velkor::spare" \
            grep '^velkor::' "$build/without.log"
        ;;
    says-nothing-of-what-is-built) ! grep '^velkor::' "$build/with.log" ;;
    leaves-out-what-needs-a-newer-version)
        configure -S "$here" -B "$build/old" "$imaginary" -DIMAGINARY_VERSION=1.9 |
            grep -qx 'velkor::spare is left out, not found: Imaginary 2.0 COMPONENTS unit'
        ;;
    component-installs-alone)
        rm -rf "$build/alone"
        "$cmake" --install "$build/with" --component spare --prefix "$build/alone"
        (cd "$build/alone" && find . ! -type d | LC_ALL=C sort) | diff "$here/files.txt" -
        ;;
    component-is-found) says 42 use with "$imaginary" "-DCOMPONENTS=COMPONENTS;spare" ;;
    all-are-found-unnamed) says 42 use with "$imaginary" ;;
    unusable-one-is-passed-over-unnamed) says 6 use with ;;
    other-component-needs-nothing-of-it) says 6 use with "-DCOMPONENTS=COMPONENTS;framework" ;;
    optional-component-may-be-missing)
        says 6 use without "-DCOMPONENTS=COMPONENTS;framework;OPTIONAL_COMPONENTS;spare"
        ;;
    component-that-is-not-installed-is-refused)
        refused "velkor::spare is not installed in $build/without/prefix" \
            without "-DCOMPONENTS=COMPONENTS;spare"
        ;;
    component-whose-need-is-missing-is-refused)
        refused "velkor::spare needs Imaginary 2.0 COMPONENTS unit, which was not found" \
            with "-DCOMPONENTS=COMPONENTS;spare"
        ;;
    component-on-top-of-it-is-refused)
        refused "(velkor::on-top builds on it)" \
            with "-DCOMPONENTS=COMPONENTS;on-top"
        ;;
    pkg-config-module-is-enough)
        libdir=$build/with/prefix/lib
        # The flags are quoted for a shell.
        eval "set -- $(PKG_CONFIG_PATH=$libdir/pkgconfig pkg-config --cflags --libs velkor-spare)"
        "$compiler" -DWITH_SPARE "$here/consumer/main.cpp" -o "$build/by-module" "$@" \
            -Wl,-rpath,"$libdir"
        says 42 "$build/by-module"
        ;;
    *) fail "no such case: $case" ;;
esac
