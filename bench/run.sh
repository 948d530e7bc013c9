#!/usr/bin/env bash
# The lexer benchmark, in one command: builds the library (Release), the peer
# scanners, the read ceilings, the corpus generator and the driver; generates
# the corpora; checks that every scanner delivers the same tokens; then times
# them and prints one table.
#
#   bench/run.sh [--size 32M] [--reps 21] [--seed 1] [--callgrind-size 2M]
#                [--no-callgrind] [--wall] [--build DIR]
#
# Corpora: the language's own text (plain, crlf, directive) and four token
# mixes (dense, dense5k, numbers, short; see gen/corpus_gen.cpp).
#
# Columns: MB/s (10^6 bytes per second of the process's CPU time, or of wall
# time with --wall, from the start of main to the end; median of the runs),
# million tokens per second, instructions per byte (callgrind, total Ir of
# the whole process over the bytes read, on a --callgrind-size corpus), peak
# RSS (ru_maxrss, the largest of the runs) and the time per byte relative to
# the re2c peer on the same corpus (on plain for crlf and directive), as the
# median of the ratios of runs paired in the same round. Timed runs leave
# out the checksum (mode -c); the check before them computes it.
set -euo pipefail

here=$(cd "$(dirname "$0")" && pwd)
root=$(cd "$here/.." && pwd)
size=32M
reps=21
seed=1
cg_size=2M
callgrind=1
clock=cpu_seconds
clock_label="CPU time"
build="$here/build"
while [ $# -gt 0 ]; do
    case "$1" in
        --size) size=$2; shift 2 ;;
        --reps) reps=$2; shift 2 ;;
        --seed) seed=$2; shift 2 ;;
        --callgrind-size) cg_size=$2; shift 2 ;;
        --no-callgrind) callgrind=0; shift ;;
        --wall) clock=seconds; clock_label="wall time"; shift ;;
        --build) build=$2; shift 2 ;;
        -h|--help) sed -n '2,22p' "$0"; exit 0 ;;
        *) echo "run.sh: unknown option $1 (try --help)" >&2; exit 2 ;;
    esac
done
jobs=$(nproc 2>/dev/null || echo 2)

# ---------------------------------------------------------------- tools
need=()
for p in cmake:cmake g++:g++ make:make flex:flex re2c:re2c valgrind:valgrind; do
    command -v "${p%%:*}" >/dev/null 2>&1 || need+=("${p##*:}")
done
if [ ${#need[@]} -gt 0 ]; then
    echo "== installing: ${need[*]}"
    sudo=""
    [ "$(id -u)" -ne 0 ] && sudo="sudo"
    $sudo apt-get update -qq
    DEBIAN_FRONTEND=noninteractive $sudo apt-get install -y -qq --no-install-recommends "${need[@]}"
fi

# ---------------------------------------------------------------- build
echo "== building the library (Release) and the benchmark in $build"
# Release, plus -g: the same code, with names and lines for the profile.
cmake -S "$root" -B "$build/tplex" -DCMAKE_BUILD_TYPE=Release -DTPLEX_BUILD_TESTS=OFF \
    -DTPLEX_BUILD_TOOLS=OFF -DCMAKE_C_FLAGS=-g -DCMAKE_CXX_FLAGS=-g >/dev/null
cmake --build "$build/tplex" -j "$jobs" >/dev/null
cmake -S "$here" -B "$build/bench" -DTPLEX_BUILD_DIR="$build/tplex" >/dev/null
cmake --build "$build/bench" -j "$jobs" >/dev/null
bin="$build/bench"
have_tplex=0
[ -x "$bin/tplex_driver" ] && have_tplex=1
[ $have_tplex -eq 1 ] || echo "!! no libtplex.so yet: the tplex rows are left out"

# ---------------------------------------------------------------- corpora
# The token mixes, read alike by every scanner; and every corpus.
mixes="plain dense dense5k numbers short"
variants="plain crlf directive dense dense5k numbers short"

# gen DIR SIZE: every variant into DIR; their expected results into
# DIR/expected.txt (one line per variant).
gen() {
    local dir=$1 sz=$2
    mkdir -p "$dir"
    : >"$dir/expected.txt"
    for v in $variants; do
        (cd "$dir" && "$bin/corpus_gen" --variant $v --size "$sz" --seed "$seed" --out $v.tpl) \
            >>"$dir/expected.txt"
    done
}
field() { # field KEY LINE
    local kv
    for kv in $2; do
        [ "${kv%%=*}" = "$1" ] && { echo "${kv#*=}"; return; }
    done
    echo ""
}
expected() { grep "^file=$2.tpl " "$1/expected.txt"; }

corpus="$build/corpus/$size-s$seed"
echo "== generating the $size corpora in $corpus"
gen "$corpus" "$size"
cat "$corpus/expected.txt"

# Rows: label, program, corpus variant; every mix's rows together.
rows=()
for v in $mixes; do
    [ $have_tplex -eq 1 ] && rows+=("tplex|tplex_driver|$v")
    if [ $v = plain ] && [ $have_tplex -eq 1 ]; then
        rows+=("tplex|tplex_driver|directive" "tplex|tplex_driver|crlf")
    fi
    rows+=("flex peer|flex_peer|$v" "re2c peer|re2c_peer|$v")
done
rows+=("fread+memchr|ceiling_fread|plain" "fgets|ceiling_fgets|plain")

# run PROGRAM MODE FILE [DIR]: one run from the corpus folder; prints the
# program's closing report (its last line on standard error).
run() {
    local prog=$1 mode=$2 file=$3 dir=${4:-$corpus}
    (cd "$dir" && "$bin/$prog" $mode "$file" 2>&1 >/dev/null | tail -n 1)
}

# ---------------------------------------------------------------- check
echo "== checking that every scanner delivers the expected tokens"
check_failed=0
check() { # check PROGRAM VARIANT
    local prog=$1 v=$2 exp got
    exp=$(expected "$corpus" $v)
    got=$(run "$prog" "" $v.tpl)
    local et ec gt gc
    et=$(field tokens "$exp"); ec=$(field checksum "$exp")
    gt=$(field tokens "$got"); gc=$(field checksum "$got")
    if [ "$et" = "$gt" ] && [ "$ec" = "$gc" ]; then
        printf '   ok   %-14s %-10s tokens=%s checksum=%s\n' "$prog" $v "$gt" "$gc"
    else
        printf '   FAIL %-14s %-10s tokens=%s checksum=%s, expected tokens=%s checksum=%s\n' \
            "$prog" $v "$gt" "$gc" "$et" "$ec"
        [ -n "$got" ] && echo "        $got"
        check_failed=1
    fi
}
for v in $mixes; do
    check flex_peer $v
    check re2c_peer $v
done
if [ $have_tplex -eq 1 ]; then
    for v in $variants; do check tplex_driver $v; done
fi
if [ $check_failed -ne 0 ]; then
    # Show where tplex and the re2c peer part on each mix.
    for v in $mixes; do
        [ $have_tplex -eq 1 ] || break
        (cd "$corpus" && "$bin/re2c_peer" -d $v.tpl >re2c.$v.dump 2>/dev/null || true)
        (cd "$corpus" && "$bin/tplex_driver" -d $v.tpl >tplex.$v.dump 2>/dev/null || true)
        first=$(cmp "$corpus/re2c.$v.dump" "$corpus/tplex.$v.dump" 2>/dev/null | awk '{print $NF}')
        if [ -n "$first" ]; then
            echo "== first difference on $v.tpl, token $first (kind value text):"
            echo "   re2c:  $(sed -n "${first}p" "$corpus/re2c.$v.dump")"
            echo "   tplex: $(sed -n "${first}p" "$corpus/tplex.$v.dump")"
            echo "   (full dumps: $corpus/re2c.$v.dump, $corpus/tplex.$v.dump)"
        fi
    done
    echo "!! the scanners disagree: nothing is timed" >&2
    exit 1
fi

# ---------------------------------------------------------------- timing
echo "== timing: $reps rounds, each running every row once (mode -c)"
results="$build/results"
rm -rf "$results"
mkdir -p "$results"
times="$results/times.txt"
: >"$times"
for r in "${rows[@]}"; do   # warm-up: page cache, dynamic loader
    IFS='|' read -r _ prog v <<<"$r"
    run "$prog" -c $v.tpl >/dev/null
done
for ((i = 1; i <= reps; i++)); do
    # Alternate which of tplex and re2c goes first.
    order=("${rows[@]}")
    if (( i % 2 == 0 )); then order=(); for ((j = ${#rows[@]} - 1; j >= 0; j--)); do order+=("${rows[j]}"); done; fi
    for r in "${order[@]}"; do
        IFS='|' read -r label prog v <<<"$r"
        out=$(run "$prog" -c $v.tpl)
        echo "$i|$label|$v|$(field $clock "$out")|$(field maxrss_kb "$out")|$(field tokens "$out")|$out" \
            >>"$times"
    done
    printf '.'
done
echo

# ---------------------------------------------------------------- callgrind
cg_dir="$build/corpus/$cg_size-s$seed"
declare -A ipb
if [ $callgrind -eq 1 ]; then
    echo "== callgrind on the $cg_size corpora"
    gen "$cg_dir" "$cg_size"
    for r in "${rows[@]}"; do
        IFS='|' read -r label prog v <<<"$r"
        outf="$results/callgrind.$prog.$v.out"
        (cd "$cg_dir" && valgrind --tool=callgrind --callgrind-out-file="$outf" \
            "$bin/$prog" -c $v.tpl >/dev/null 2>&1)
        ir=$(awk '/^(summary|totals):/ {print $2; exit}' "$outf")
        bytes=$(field bytes_read "$(expected "$cg_dir" $v)")
        ipb["$label|$v"]=$(awk -v ir="$ir" -v b="$bytes" 'BEGIN {printf "%.1f", ir / b}')
    done
    if [ $have_tplex -eq 1 ]; then
        for v in $mixes; do
            out="$results/callgrind.tplex_driver.$v.out"
            callgrind_annotate --inclusive=no "$out" >"$results/tplex_profile.$v.txt" \
                2>/dev/null || true
            callgrind_annotate --inclusive=yes "$out" >"$results/tplex_profile_inclusive.$v.txt" \
                2>/dev/null || true
            callgrind_annotate --auto=yes --context=2 "$out" \
                >"$results/tplex_profile_lines.$v.txt" 2>/dev/null || true
        done
    fi
fi

# ---------------------------------------------------------------- table
table="$results/table.md"
{
    echo "corpus: $size (seed $seed); $reps rounds; times: $clock_label; $([ $callgrind -eq 1 ] && echo "callgrind on $cg_size" || echo "no callgrind"); $(uname -m), $(nproc) cores; load $(cut -d' ' -f1-3 /proc/loadavg)"
    echo
    echo "| scanner | corpus | MB/s | Mtok/s | instr/byte | peak RSS | time/byte vs re2c |"
    echo "|---|---|---:|---:|---:|---:|---:|"
    for r in "${rows[@]}"; do
        IFS='|' read -r label prog v <<<"$r"
        bytes=$(field bytes_read "$(expected "$corpus" $v)")
        # The re2c row of the same mix is the measure (plain's for crlf and directive).
        bv=plain
        case " $mixes " in *" $v "*) bv=$v ;; esac
        base_bytes=$(field bytes_read "$(expected "$corpus" $bv)")
        awk -F'|' -v label="$label" -v v="$v" -v bv="$bv" -v bytes="$bytes" -v pb="$base_bytes" \
            -v ipb="${ipb["$label|$v"]:-n/a}" '
            function median(a, n,   i, j, t) {
                for (i = 2; i <= n; i++) { t = a[i]; for (j = i - 1; j >= 1 && a[j] > t; j--) a[j + 1] = a[j]; a[j + 1] = t }
                return n % 2 ? a[(n + 1) / 2] : (a[n / 2] + a[n / 2 + 1]) / 2
            }
            { key = $2 "|" $3 }
            key == "re2c peer|" bv { base[$1] = $4 }
            key == label "|" v { n++; t[n] = $4; round[n] = $1; if ($5 > rss) rss = $5; tok = $6 }
            END {
                for (i = 1; i <= n; i++) ratio[i] = (t[i] / bytes) / (base[round[i]] / pb)
                mt = median(t, n); mr = median(ratio, n)
                printf "| %s | %s | %.0f | %s | %s | %.2f MiB | %.2f |\n", label, v, bytes / mt / 1e6,
                    (tok > 0 ? sprintf("%.1f", tok / mt / 1e6) : "-"), ipb, rss / 1024, mr
            }' "$times"
    done
} >"$table"
echo
cat "$table"
for v in plain dense; do
    [ -s "$results/tplex_profile.$v.txt" ] || continue
    echo
    echo "tplex profile (callgrind, $v $cg_size, self cost), top functions:"
    awk '/Ir +file:function/ {go = 1; next} go && /^-+$/ {next}
         go && !NF && n {exit} go && NF {print "  " $0; if (++n == 12) exit}' \
        "$results/tplex_profile.$v.txt"
done
if [ -s "$results/tplex_profile.plain.txt" ]; then
    echo "  (full: $results/tplex_profile.<mix>.txt; inclusive and by source line beside them)"
fi

