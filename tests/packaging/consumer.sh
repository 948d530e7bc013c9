#!/usr/bin/env bash
# Installs the build into a temporary prefix, checks the installed layout,
# then builds the consumer project against it through find_package(tplex)
# and by hand through pkg-config, and runs what it built.
#
#   consumer.sh BUILD_DIR CONSUMER_DIR SOURCE C_COMPILER
set -u
build=$1 consumer=$2 source=$3 cc=$4
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
step "installed layout" ls -d "$prefix"/include/tplex/{lexer,table_output,services}.h "$prefix/bin/tplex" \
    "$lib"/{libtplex.so.1,libtplex.a,pkgconfig/tplex.pc,cmake/tplex/tplexConfig{,Version}.cmake}
step "soname libtplex.so.1" grep -q 'SONAME.*\[libtplex.so.1\]' <(readelf -d "$lib/libtplex.so")
step "installed tool runs" "$prefix/bin/tplex" --version

# find_package(tplex): the shared library and the static archive (with the
# parser services and table output, which only it holds).
step "find_package" cmake -S "$consumer" -B "$tmp/cmake" -DCMAKE_C_COMPILER="$cc" -DCMAKE_PREFIX_PATH="$prefix"
step "build with find_package" cmake --build "$tmp/cmake"
for p in consumer consumer_static; do step "$p (find_package)" counts "$tmp/cmake/$p"; done
step "consumer loads the installed library" grep -q "$lib/libtplex.so.1" <(ldd "$tmp/cmake/consumer")

# pkg-config by hand, linking the static archive as services.h shows.
export PKG_CONFIG_PATH="$lib/pkgconfig"
# shellcheck disable=SC2046
step "cc with pkg-config --static" "$cc" -std=c99 -Wall -Werror -DTPLEX_STATIC -o "$tmp/static" \
    "$consumer/main.c" $(pkg-config --cflags tplex) -Wl,-Bstatic $(pkg-config --static --libs tplex) -Wl,-Bdynamic
step "consumer (static, pkg-config)" counts "$tmp/static"
step "pkg-config --modversion is TPLEX_VERSION_STRING" grep -q "TPLEX_VERSION_STRING \"$(pkg-config --modversion tplex)\"" \
    "$prefix/include/tplex/lexer.h"
echo "$failed failed"
[ "$failed" = 0 ]
