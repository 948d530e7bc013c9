#!/usr/bin/env bash
# Builds tplex in Release and runs the tool on the shipped example: a clean
# check without and with the TRACE switch, then the token stream.
# Installs what the build needs (Debian: cmake, g++, make) when it is missing,
# as root or through sudo.
#
#   examples/run.sh
set -euo pipefail
cd "$(dirname "$0")/.."
root=$(pwd)
build="$root/build-release"
jobs=$(nproc 2>/dev/null || echo 2)

need_packages() {
    local missing=()
    if command -v dpkg >/dev/null 2>&1; then
        for p in "$@"; do
            dpkg -s "$p" >/dev/null 2>&1 || missing+=("$p")
        done
    else
        # No Debian package database: look for the commands themselves.
        command -v cmake >/dev/null 2>&1 || missing+=(cmake)
        command -v g++ >/dev/null 2>&1 || missing+=(g++)
        command -v make >/dev/null 2>&1 || missing+=(make)
    fi
    [ ${#missing[@]} -eq 0 ] && return 0
    local sudo=""
    if [ "$(id -u)" -ne 0 ]; then
        if command -v sudo >/dev/null 2>&1; then
            sudo="sudo"
        else
            echo "examples/run.sh: missing ${missing[*]}; install them as root" >&2
            exit 2
        fi
    fi
    if ! command -v apt-get >/dev/null 2>&1; then
        echo "examples/run.sh: missing ${missing[*]} and no apt-get to install them" >&2
        exit 2
    fi
    echo "== installing: ${missing[*]}"
    $sudo apt-get update -qq
    DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq --no-install-recommends "${missing[@]}"
}

need_packages cmake g++ make

echo "== Release build in $build"
cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=Release -DTPLEX_BUILD_TESTS=OFF >/dev/null
cmake --build "$build" -j "$jobs"

tplex="$build/tools/tplex"
cd "$root/examples"
echo
echo "== tplex check -I include signalling.tpl"
"$tplex" check -I include signalling.tpl
echo
echo "== tplex check -I include -D TRACE signalling.tpl"
"$tplex" check -I include -D TRACE signalling.tpl
echo
echo "== tplex tokens -I include signalling.tpl"
"$tplex" tokens -I include signalling.tpl
echo
echo "== done: the tool is $tplex"
