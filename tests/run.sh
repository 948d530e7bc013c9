#!/usr/bin/env bash
# Runs the whole test suite: installs what it needs (Debian), then builds and
# tests the library twice, once plainly and once under AddressSanitizer and
# UndefinedBehaviorSanitizer, warnings as errors.
#
#   tests/run.sh            everything
#   tests/run.sh plain      only the plain build
#   tests/run.sh sanitize   only the sanitizer build
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

fuzz_targets() {
    need_packages clang libclang-rt-14-dev
    bash "$root/fuzz/run.sh" "${TPLEX_FUZZ_SECONDS:-60}"
}

need_packages cmake g++ make libgtest-dev pkg-config file

what=${1:-all}
case "$what" in
    plain)    build_and_test plain ;;
    sanitize) build_and_test sanitize -DTPLEX_SANITIZE=ON ;;
    fuzz)     fuzz_targets ;;
    all)
        build_and_test plain
        build_and_test sanitize -DTPLEX_SANITIZE=ON
        fuzz_targets
        ;;
    *) echo "usage: tests/run.sh [all|plain|sanitize|fuzz]" >&2; exit 2 ;;
esac
echo "== all tests passed"
