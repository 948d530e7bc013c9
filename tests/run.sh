#!/usr/bin/env bash
# The whole test suite, warnings as errors; installs what it needs (Debian).
#
#   tests/run.sh [all]      every step below, in this order
#   tests/run.sh lint       layers, README's word tables, clang-format, clang-tidy
#   tests/run.sh plain      the plain build and its tests
#   tests/run.sh sanitize   the same under AddressSanitizer and UndefinedBehaviorSanitizer
#   tests/run.sh windows    the Windows builds under Wine (TPLEX_NO_32BIT=1 takes
#                           the 64-bit path on any host)
#   tests/run.sh fuzz       each fuzz target for TPLEX_FUZZ_SECONDS (default 60)
set -euo pipefail
cd "$(dirname "$0")/.."
root=$(pwd)
jobs=$(nproc 2>/dev/null || echo 2)

need_packages() {
    local missing=() p sudo=
    for p in "$@"; do dpkg -s "$p" >/dev/null 2>&1 || missing+=("$p"); done
    [ ${#missing[@]} -eq 0 ] && return 0
    [ "$(id -u)" -ne 0 ] && sudo=sudo
    echo "== installing: ${missing[*]}"
    $sudo apt-get update -qq
    DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
}

build_and_test() {  # name, extra cmake options...; only_test=NAME runs that test alone
    local name=$1 dir="$root/build-tests/$1"
    shift
    echo "== $name build"
    cmake -S "$root" -B "$dir" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTPLEX_BUILD_TESTS=ON \
        -DTPLEX_WERROR=ON -DTPLEX_ALLOC_HOOK=ON "$@" >/dev/null
    cmake --build "$dir" -j "$jobs"
    echo "== $name tests${only_test:+: $only_test only}"
    (cd "$dir" && ctest --output-on-failure -j "$jobs" ${only_test:+-R "^$only_test\$"})
}

# Whether this host runs 32-bit x86 programs (some kernels cannot: 32-bit Wine
# then fails with "Exec format error"): a three-instruction program that exits
# with 42, under a time limit. TPLEX_NO_32BIT=1 answers no on any host.
host_runs_32bit() {
    [ "${TPLEX_NO_32BIT:-0}" = 1 ] && { probe_result="TPLEX_NO_32BIT=1 is set"; return 1; }
    local dir status=0
    dir=$(mktemp -d)
    printf '.globl _start\n_start: movl $1, %%eax\n movl $42, %%ebx\n int $0x80\n' >"$dir/p.s"
    as --32 -o "$dir/p.o" "$dir/p.s" 2>/dev/null && ld -m elf_i386 -o "$dir/p" "$dir/p.o" 2>/dev/null ||
        { rm -rf "$dir"; probe_result="no 32-bit x86 program could be linked here to try"; return 1; }
    timeout 10 "$dir/p" </dev/null >/dev/null 2>&1 || status=$?
    rm -rf "$dir"
    [ "$status" = 42 ] || { probe_result="a 32-bit x86 program exits with status $status here, not 42"; return 1; }
}

# One Wine server for every test program of a build, stopped however this
# ends; its services start here, away from ctest, whose output pipes they
# would hold open. WINEPREFIX, WINEARCH and the loader are the caller's.
wine_build_and_test() {  # name, wine loader, wineserver, cmake options...
    local name=$1 loader=$2 server=$3; shift 3
    export WINEDEBUG=-all WINEDLLOVERRIDES="mscoree,mshtml="
    [ -f "$WINEPREFIX/system.reg" ] || echo "== creating the Wine prefix $WINEPREFIX"
    "$server" -p </dev/null >/dev/null 2>&1 || true
    # shellcheck disable=SC2064 # the server's path as it is now
    trap "'$server' -k >/dev/null 2>&1 || true" EXIT
    "$loader" wineboot </dev/null >/dev/null 2>&1
    build_and_test "$name" -DTPLEX_WINE="$loader" "$@"
    "$server" -k >/dev/null 2>&1 || true
    trap - EXIT
}

# The Windows builds (MinGW-w64, GoogleTest built along). Where the host runs
# 32-bit programs, every Windows test runs under 32-bit Wine. Elsewhere the
# i686 build is compiled (its layouts are checked at compile time) and its
# DLL's exports checked, and every test runs in an x86-64 build under wine64.
windows_build_and_test() {
    local probe_result="" ran skipped
    echo "== Windows: probing whether this host runs 32-bit x86 programs"
    if host_runs_32bit; then
        echo "== Windows: it does: the 32-bit DLL's tests run under 32-bit Wine"
        dpkg --print-foreign-architectures | grep -qx i386 ||
            { echo "== adding the i386 architecture (for 32-bit Wine)"; dpkg --add-architecture i386; }
        need_packages g++-mingw-w64-i686 googletest wine wine32:i386
        export WINEPREFIX=${TPLEX_WINEPREFIX:-/tmp/tplex-wine-$(id -u)} WINEARCH=win32
        wine_build_and_test windows "$(command -v wine)" "$(command -v wineserver)" \
            -DCMAKE_TOOLCHAIN_FILE="$root/cmake/mingw-w64-i686.cmake"
        ran="32-bit: compile-time layout checks, export table, unit tests, tool tests, C loader (32-bit Wine)"
        skipped="none"
    else
        echo "== Windows: it does not ($probe_result): the i686 DLL is built and checked"
        echo "   without running, and every Windows test runs in a 64-bit build under 64-bit Wine"
        need_packages g++-mingw-w64-i686 g++-mingw-w64-x86-64 googletest wine64
        only_test=windows_dll_interface build_and_test windows32 \
            -DCMAKE_TOOLCHAIN_FILE="$root/cmake/mingw-w64-i686.cmake"
        export WINEPREFIX=${TPLEX_WINEPREFIX64:-/tmp/tplex-wine64-$(id -u)} WINEARCH=win64
        export WINELOADER=/usr/lib/wine/wine64 WINESERVER=/usr/lib/wine/wineserver64
        wine_build_and_test windows64 "$WINELOADER" "$WINESERVER" \
            -DCMAKE_TOOLCHAIN_FILE="$root/cmake/mingw-w64-x86_64.cmake"
        ran="32-bit: compile-time layout checks, export table, __cdecl; 64-bit: export table, unit tests, tool tests, C loader (64-bit Wine)"
        skipped="every 32-bit program at run time (unit tests, tool tests, the C loader with its 5212-byte frame stride check), since $probe_result"
    fi
    echo "== Windows checks that ran: $ran"
    echo "== Windows checks that could not run: $skipped"
}

lint() {
    need_packages clang-format clang-tidy
    echo "== lint"
    bash "$root/tests/layers.sh" "$root"
    bash "$root/tests/readme_words.sh"
    local layers  # the library's folders, as CMakeLists.txt lists them
    read -r -a layers <<<"$(sed -n 's/^set(TPLEX_LAYERS \(.*\))$/\1/p' "$root/CMakeLists.txt")"
    local sources=("${layers[@]}" tools tests fuzz include bench)
    (cd "$root" && find "${sources[@]}" -path bench/build -prune -o \
        \( -name '*.c' -o -name '*.cpp' -o -name '*.h' \) -print | xargs clang-format --dry-run -Werror)
    local dir="$root/build-tests/lint"
    cmake -S "$root" -B "$dir" -DCMAKE_EXPORT_COMPILE_COMMANDS=ON -DTPLEX_BUILD_TESTS=OFF >/dev/null
    (cd "$root" && find "${layers[@]}" tools -name '*.cpp' \
        ! -name platform_windows.cpp | xargs clang-tidy -p "$dir" --quiet)
}

fuzz_targets() {
    need_packages clang libclang-rt-14-dev
    bash "$root/fuzz/run.sh" "${TPLEX_FUZZ_SECONDS:-60}"
}

need_packages cmake g++ make libgtest-dev pkg-config file

what=${1:-all}
case "$what" in
    lint)     lint ;;
    plain)    build_and_test plain ;;
    sanitize) build_and_test sanitize -DTPLEX_SANITIZE=ON ;;
    windows)  windows_build_and_test ;;
    fuzz)     fuzz_targets ;;
    all)
        lint
        build_and_test plain
        build_and_test sanitize -DTPLEX_SANITIZE=ON
        windows_build_and_test
        fuzz_targets
        ;;
    *) echo "usage: tests/run.sh [all|lint|plain|sanitize|windows|fuzz]" >&2; exit 2 ;;
esac
echo "== all tests passed"
