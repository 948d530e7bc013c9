#!/usr/bin/env bash
# Runs the whole test suite: installs what it needs (Debian), then builds and
# tests the library three times, once plainly, once under AddressSanitizer and
# UndefinedBehaviorSanitizer, and once cross-built for 32-bit Windows and run
# under Wine; warnings as errors. Then it runs each fuzz target (fuzz/run.sh)
# for a minute, with clang. First of all, the sources must be formatted
# (.clang-format) and clean under .clang-tidy.
#
#   tests/run.sh            everything
#   tests/run.sh lint       only the format and lint checks
#   tests/run.sh plain      only the plain build
#   tests/run.sh sanitize   only the sanitizer build
#   tests/run.sh windows    only the Windows build (tplex.dll, under Wine)
#   tests/run.sh fuzz       only the fuzz targets, each for TPLEX_FUZZ_SECONDS
#                           (default 60) with clang, failing on any finding
set -euo pipefail
cd "$(dirname "$0")/.."
root=$(pwd)
jobs=$(nproc 2>/dev/null || echo 2)

need_packages() {
    local missing=()
    for p in "$@"; do
        dpkg -s "$p" >/dev/null 2>&1 || missing+=("$p")
    done
    [ ${#missing[@]} -eq 0 ] && return 0
    local sudo=""
    [ "$(id -u)" -ne 0 ] && sudo="sudo"
    echo "== installing: ${missing[*]}"
    $sudo apt-get update -qq
    DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
}

build_and_test() {  # name, extra cmake options...
    local name=$1; shift
    local dir="$root/build-tests/$name"
    echo "== $name build"
    cmake -S "$root" -B "$dir" -DCMAKE_BUILD_TYPE=RelWithDebInfo -DTPLEX_BUILD_TESTS=ON \
        -DTPLEX_WERROR=ON -DTPLEX_ALLOC_HOOK=ON "$@" >/dev/null
    cmake --build "$dir" -j "$jobs"
    echo "== $name tests"
    (cd "$dir" && ctest --output-on-failure -j "$jobs")
}

# The Windows build: the i686 MinGW-w64 cross compiler, GoogleTest's sources
# to build along, and 32-bit Wine to run the programs in a prefix of its own.
windows_build_and_test() {
    if ! dpkg --print-foreign-architectures | grep -qx i386; then
        echo "== adding the i386 architecture (for 32-bit Wine)"
        dpkg --add-architecture i386
    fi
    need_packages g++-mingw-w64-i686 googletest wine wine32:i386
    export WINEPREFIX=${TPLEX_WINEPREFIX:-/tmp/tplex-wine-$(id -u)}
    export WINEARCH=win32 WINEDEBUG=-all WINEDLLOVERRIDES="mscoree,mshtml="
    [ -f "$WINEPREFIX/system.reg" ] || echo "== creating the Wine prefix $WINEPREFIX"
    # One Wine server for every test program, stopped however this ends. Its
    # services start here, away from ctest: they live as long as the server
    # and would hold a test's output pipe open, so ctest would never finish.
    wineserver -p </dev/null >/dev/null 2>&1 || true
    trap 'wineserver -k >/dev/null 2>&1 || true' EXIT
    wineboot </dev/null >/dev/null 2>&1
    build_and_test windows -DCMAKE_TOOLCHAIN_FILE="$root/cmake/mingw-w64-i686.cmake"
    wineserver -k >/dev/null 2>&1 || true
    trap - EXIT
}

# The library's folders include one way only (tests/layers.sh); every C and
# C++ source as .clang-format lays it out; the library and the tool clean
# under .clang-tidy's checks.
lint() {
    need_packages clang-format clang-tidy
    echo "== lint"
    bash "$root/tests/layers.sh" "$root"
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
