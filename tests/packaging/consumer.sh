#!/usr/bin/env bash
# Installs the build into a temporary prefix, checks the installed layout,
# then builds the consumer project against it through find_package(tplex)
# and through pkg-config, and runs what it built.
#
#   consumer.sh BUILD_DIR CONSUMER_DIR SOURCE C_COMPILER SANITIZE
#
# Skipped (status 77) in the sanitizer build: its libraries carry the
# sanitizer runtime, which a consumer program would have to load first.
set -u
build=$1 consumer=$2 source=$3 cc=$4
case "$5" in ON | on | 1 | TRUE | true | YES | yes)
    echo "skipped: a sanitizer build is not installed for consumers"; exit 77 ;;
esac
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
prefix="$tmp/prefix" lib="$tmp/prefix/lib"
failed=0
# step DESCRIPTION COMMAND...: runs the command quietly, shows its output on failure.
step() {
    "${@:2}" >"$tmp/log" 2>&1 && return
    failed=$((failed + 1)); echo "FAILED: $1"; cat "$tmp/log"
}
counts() { "$@" "$source" | grep -q 'tokens$'; }  # a consumer program lexes the source

step "cmake --install" cmake --install "$build" --prefix "$prefix"
for f in include/tplex/lexer.h include/tplex/table_output.h include/tplex/services.h \
    lib/libtplex.so.1 lib/libtplex.a lib/pkgconfig/tplex.pc lib/cmake/tplex/tplexConfig.cmake \
    lib/cmake/tplex/tplexConfigVersion.cmake bin/tplex; do
    step "installed: $f" test -e "$prefix/$f"
done
step "soname libtplex.so.1" grep -q 'SONAME.*\[libtplex.so.1\]' <(readelf -d "$lib/libtplex.so")
step "installed tool runs" "$prefix/bin/tplex" --version

# find_package(tplex): the shared library and the static archive.
step "find_package" cmake -S "$consumer" -B "$tmp/cmake" -DCMAKE_C_COMPILER="$cc" -DCMAKE_PREFIX_PATH="$prefix"
step "build with find_package" cmake --build "$tmp/cmake"
step "consumer (find_package)" counts "$tmp/cmake/consumer"
step "consumer_static (find_package)" counts "$tmp/cmake/consumer_static"
step "consumer loads the installed library" grep -q "$lib/libtplex.so.1" <(ldd "$tmp/cmake/consumer")

# pkg-config, through CMake's module and by hand; the static archive (with
# the parser services, which only it holds) by hand.
export PKG_CONFIG_PATH="$lib/pkgconfig"
step "pkg-config module" cmake -S "$consumer" -B "$tmp/pc" -DCMAKE_C_COMPILER="$cc" -DCONSUMER_USE_PKGCONFIG=ON
step "build with pkg-config" cmake --build "$tmp/pc"
step "consumer (pkg-config module)" counts env LD_LIBRARY_PATH="$lib" "$tmp/pc/consumer"
# shellcheck disable=SC2046
step "cc with pkg-config --static" "$cc" -std=c99 -Wall -Werror -DTPLEX_STATIC -o "$tmp/static" \
    "$consumer/main.c" $(pkg-config --cflags tplex) -Wl,-Bstatic $(pkg-config --static --libs tplex) -Wl,-Bdynamic
step "consumer (static, pkg-config by hand)" counts "$tmp/static"
step "pkg-config --modversion is TPLEX_VERSION_STRING" grep -q "TPLEX_VERSION_STRING \"$(pkg-config --modversion tplex)\"" \
    "$prefix/include/tplex/lexer.h"
echo "$failed failed"
[ "$failed" = 0 ]
