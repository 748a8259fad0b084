#!/bin/sh
# Installs the built library into a temporary tree as a packager would
# (DESTDIR and a prefix), then builds and runs the C examples against that
# copy, once through pkg-config and once through the CMake package.
#   install_test.sh BUILD_DIR EXAMPLES_DIR [CFLAGS]
set -eu
build=$1
examples=$2
cflags=${3:-}
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

DESTDIR=$work/stage cmake --install "$build" --prefix /opt/qora >/dev/null
root=$work/stage/opt/qora
test -f "$root/include/qoraio32.h"

# The library under its SONAME, with the version links beside it.
pc=$(find "$root" -name qoraio32.pc)
export PKG_CONFIG_PATH="${pc%/*}"
libdir=$(pkg-config --variable=libdir qoraio32)
soname=$(readelf -d "$libdir/libqoraio32.so" | sed -n 's/.*SONAME.*\[\(.*\)\]/\1/p')
test "$soname" = libqoraio32.so.1
test -L "$libdir/libqoraio32.so" && test -L "$libdir/$soname"

# Runs write_file then read_file from $1 and checks what read_file prints.
check_examples() {
    LD_LIBRARY_PATH=$libdir "$1/write_file" "$1/small.qsf"
    LD_LIBRARY_PATH=$libdir "$1/read_file" "$1/small.qsf" >"$1/printed"
    printf '%s\n' "3 variables, 3 cases" "Id numeric" "Name string" "Born numeric" \
        " 1 Ada 1815-12-10" " 2 Alan 1912-06-23" " 3 Grace 1906-12-09" | diff - "$1/printed"
}

mkdir "$work/pc"
for example in read_file write_file; do
    # shellcheck disable=SC2046,SC2086
    cc -Wall -Wextra -Werror $cflags -o "$work/pc/$example" "$examples/$example.c" $(pkg-config --cflags --libs qoraio32)
done
check_examples "$work/pc"

# The build's own flags (word size, sanitizers) go first: CMake drops what
# follows -Werror when it probes the compiler's pointer size.
cmake -S "$examples" -B "$work/cm" -DCMAKE_PREFIX_PATH="$root" -DCMAKE_C_FLAGS="$cflags -Wall -Wextra -Werror" >/dev/null
cmake --build "$work/cm" >/dev/null
check_examples "$work/cm"
echo "installed library, pkg-config and CMake package work"
