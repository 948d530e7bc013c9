#!/usr/bin/env bash
# Builds the libFuzzer targets with clang (AddressSanitizer and
# UndefinedBehaviorSanitizer, LeakSanitizer on) and runs each for a bounded
# time, two at a time, from its seed corpus. Fails on any finding: a crash,
# a broken invariant, a leak, a timeout or running out of memory. (Warnings
# are not errors here: the gcc builds of tests/run.sh hold that line, and a
# clang-only warning is no finding.)
#
#   fuzz/run.sh [SECONDS [TARGET...]]     default: 60 seconds, every target
#
# Environment: TPLEX_FUZZ_BUILD (build folder, default build-tests/fuzz),
# TPLEX_FUZZ_JOBS (targets at a time, default 2).
# Findings are written to <build>/findings/<target>/; the corpus a run grows
# stays in <build>/corpus/<target>/ and seeds the next run. A finding that
# is fixed belongs in fuzz/regressions/<target>/, replayed by the
# test suite (fuzz/replay).
set -euo pipefail
cd "$(dirname "$0")/.."
root=$(pwd)
seconds=${1:-60}
shift || true
build=${TPLEX_FUZZ_BUILD:-$root/build-tests/fuzz}
jobs=${TPLEX_FUZZ_JOBS:-2}

# Every target and its options; a target whose program was not built (its
# module is not in the tree yet) is left out.
declare -A options=(
    [lexer]="-max_len=10000 -dict=$root/fuzz/lexer.dict"
    [table_output]="-max_len=4096"
    [table_check]="-max_len=4096"
    [file_names]="-max_len=1024"
)
targets=("$@")
[ ${#targets[@]} -eq 0 ] && targets=("${!options[@]}")

echo "== fuzz build"
cmake -S "$root" -B "$build" -DCMAKE_BUILD_TYPE=RelWithDebInfo \
    -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
    -DTPLEX_FUZZ=ON -DTPLEX_ALLOC_HOOK=ON \
    -DTPLEX_BUILD_TESTS=OFF -DTPLEX_BUILD_TOOLS=OFF >/dev/null
cmake --build "$build" -j "$(nproc 2>/dev/null || echo 2)"

run_target() {  # target: runs it, leaves its log and status in $build/logs
    local t=$1 log="$build/logs/$t.log"
    local corpus="$build/corpus/$t" findings="$build/findings/$t"
    mkdir -p "$corpus" "$findings"
    set +e
    # shellcheck disable=SC2086
    "$build/fuzz/fuzz_$t" ${options[$t]} -max_total_time="$seconds" -timeout=10 \
        -rss_limit_mb=2048 -print_final_stats=1 -artifact_prefix="$findings/" \
        "$corpus" "$root/fuzz/corpus/$t" >"$log" 2>&1
    echo $? >"$build/logs/$t.status"
    set -e
}

mkdir -p "$build/logs"
running=0
for t in "${targets[@]}"; do
    if [ -z "${options[$t]+x}" ]; then echo "unknown fuzz target: $t" >&2; exit 2; fi
    if [ ! -x "$build/fuzz/fuzz_$t" ]; then echo "== fuzz $t: not built, skipped"; continue; fi
    echo "== fuzz $t: ${seconds}s"
    run_target "$t" &
    running=$((running + 1))
    if [ "$running" -ge "$jobs" ]; then wait -n || true; running=$((running - 1)); fi
done
wait

failed=0
for t in "${targets[@]}"; do
    [ -f "$build/logs/$t.status" ] || continue
    status=$(cat "$build/logs/$t.status")
    rm -f "$build/logs/$t.status"
    runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$build/logs/$t.log")
    rate=$(sed -n 's/^stat::average_exec_per_sec: *//p' "$build/logs/$t.log")
    if [ "$status" -eq 0 ]; then
        echo "== fuzz $t: ok, ${runs:-?} runs, ${rate:-?} exec/s"
    else
        failed=1
        echo "== fuzz $t: FAILED (exit $status); log $build/logs/$t.log" >&2
        grep -E 'ERROR|SUMMARY|invariant broken|Test unit written' "$build/logs/$t.log" >&2 || tail -20 "$build/logs/$t.log" >&2
    fi
done
exit $failed
