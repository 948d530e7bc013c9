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
build=$1 consumer=$2 source=$3 cc=$4 sanitize=$5
case "$sanitize" in
    ON|on|1|TRUE|true|YES|yes)
        echo "skipped: a sanitizer build is not installed for consumers"
        exit 77 ;;
esac

tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
prefix="$tmp/prefix"
passed=0 failed=0
pass() { passed=$((passed + 1)); }
fail() { failed=$((failed + 1)); echo "FAILED: $*"; }
# step DESCRIPTION COMMAND...: runs the command quietly, shows its output on failure.
step() {
    local what=$1
    shift
    if "$@" >"$tmp/log" 2>&1; then pass; else fail "$what"; cat "$tmp/log"; fi
}

step "cmake --install" cmake --install "$build" --prefix "$prefix"

# The layout.
for f in include/tplex/lexer.h include/tplex/table_output.h include/tplex/services.h lib/libtplex.so lib/libtplex.a \
    lib/pkgconfig/tplex.pc lib/cmake/tplex/tplexConfig.cmake \
    lib/cmake/tplex/tplexConfigVersion.cmake lib/cmake/tplex/tplexTargets.cmake bin/tplex; do
    if [ -e "$prefix/$f" ]; then pass; else fail "not installed: $f"; fi
done
soname=$(readelf -d "$prefix/lib/libtplex.so" | sed -n 's/.*(SONAME).*\[\(.*\)\]/\1/p')
if [ "$soname" = libtplex.so.1 ] && [ -e "$prefix/lib/$soname" ]; then pass
else fail "soname '$soname' of lib/libtplex.so, or its link, missing"; fi
step "installed tool runs" "$prefix/bin/tplex" --version

# find_package(tplex): the shared library and the static archive.
step "configure with find_package" cmake -S "$consumer" -B "$tmp/cmake" \
    -DCMAKE_C_COMPILER="$cc" -DCMAKE_PREFIX_PATH="$prefix"
step "build with find_package" cmake --build "$tmp/cmake"
for exe in consumer consumer_static; do
    if out=$("$tmp/cmake/$exe" "$source") && grep -q 'tokens$' <<<"$out"; then pass
    else fail "$exe (find_package) on $source: $out"; fi
done
if ldd "$tmp/cmake/consumer" | grep -q "$prefix/lib/libtplex.so.1"; then pass
else fail "consumer does not load the installed libtplex.so.1"; fi

# pkg-config, through CMake's module and by hand.
export PKG_CONFIG_PATH="$prefix/lib/pkgconfig"
step "configure with pkg-config" cmake -S "$consumer" -B "$tmp/pc" \
    -DCMAKE_C_COMPILER="$cc" -DCONSUMER_USE_PKGCONFIG=ON
step "build with pkg-config" cmake --build "$tmp/pc"
if out=$(LD_LIBRARY_PATH="$prefix/lib" "$tmp/pc/consumer" "$source") &&
    grep -q 'tokens$' <<<"$out"; then pass
else fail "consumer (pkg-config module) on $source: $out"; fi
# shellcheck disable=SC2046
step "cc with pkg-config --cflags --libs" "$cc" -std=c99 -Wall -Werror -o "$tmp/direct" \
    "$consumer/main.c" $(pkg-config --cflags --libs tplex)
if out=$(LD_LIBRARY_PATH="$prefix/lib" "$tmp/direct" "$source") && grep -q 'tokens$' <<<"$out"
then pass; else fail "consumer (pkg-config by hand) on $source: $out"; fi
# The static archive by hand: the parser services are in it, not in the
# shared library, so the consumer links libtplex.a.
# shellcheck disable=SC2046
step "cc with pkg-config --static" "$cc" -std=c99 -Wall -Werror -DTPLEX_STATIC \
    -o "$tmp/direct_static" "$consumer/main.c" $(pkg-config --cflags tplex) \
    -Wl,-Bstatic $(pkg-config --static --libs tplex) -Wl,-Bdynamic
if out=$("$tmp/direct_static" "$source") && grep -q 'tokens$' <<<"$out"
then pass; else fail "consumer (static, pkg-config by hand) on $source: $out"; fi
if [ "$(pkg-config --modversion tplex)" = "$(sed -n 's/.*TPLEX_VERSION_STRING "\(.*\)"/\1/p' \
    "$prefix/include/tplex/lexer.h")" ]; then pass
else fail "pkg-config --modversion differs from TPLEX_VERSION_STRING"; fi

echo "$passed passed, $failed failed"
[ "$failed" = 0 ]
