#!/usr/bin/env bash
# The tool's command line: exit status 0 (clean), 1 (the input had failures),
# 2 (usage or I/O error), its messages, and whole outputs equal to the files
# in expected/ (TPLEX_UPDATE_EXPECTED=1 rewrites them).
#   command_line.sh TOOL VERSION TABLES_DIR      (run in examples/)
set -u
tool=$1 version=$2 tables=$3 here=$(cd "$(dirname "$0")" && pwd)
failed=0
windows=$([ "${TPLEX_TARGET_SYSTEM:-}" = Windows ] && echo 1)
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT

# expect STATUS PATTERN ARGS...: tplex ARGS exits with STATUS and prints a
# line matching the extended regular expression PATTERN (either stream);
# COUNT=N asks for exactly N such lines.
expect() {
    local out rc n
    out=$("$tool" "${@:3}" 2>&1 </dev/null)
    rc=$?
    n=$(grep -Ec -- "$2" <<<"$out")
    if [ "$rc" != "$1" ] || [ "$n" = 0 ] || [ "${COUNT:-$n}" != "$n" ]; then
        failed=$((failed + 1))
        printf 'FAILED: tplex %s -> status %s, wanted %s and %s line(s) matching %s:\n%s\n' \
            "${*:3}" "$rc" "$1" "${COUNT:-1+}" "$2" "$(head -n 20 <<<"$out")"
    fi
}

# same NAME STATUS ARGS...: tplex ARGS exits with STATUS and prints expected/NAME.
same() {
    "$tool" "${@:3}" </dev/null >"$tmp/out"
    local rc=$?
    [ "${TPLEX_UPDATE_EXPECTED:-0}" = 1 ] && cp "$tmp/out" "$here/expected/$1"
    if [ "$rc" != "$2" ] || ! diff -u "$here/expected/$1" "$tmp/out"; then
        failed=$((failed + 1)) && echo "FAILED: tplex ${*:3} -> status $rc, wanted $2 and expected/$1"
    fi
}

same check_failures_3.txt 1 check --max-failures=3 failures.tpl
same dict_signalling.txt 0 dict -I include signalling.tpl

expect 0 "^tplex $version\$" --version
expect 0 '^usage: tplex tokens' help
expect 0 '^  --max-failures N$' tokens --help
expect 2 '^usage: tplex tokens'
expect 2 'no FILE given' check -I include
expect 2 "only one FILE" check signalling.tpl failures.tpl
expect 2 "unknown option '--json'" check --json signalling.tpl
expect 2 '-I needs a value' check signalling.tpl -I
expect 2 '--max-failures needs a count' check --max-failures x signalling.tpl

# Files and names the lexer refuses: the reason, then the library's code.
no_dirs='\(0xd3470209: No Includes to Search for Included File\)$'
cannot_open='\(0xd3470226: Cannot Open Source File\)$'
expect 2 "^tplex: cannot open nowhere.tpl: not found $no_dirs" check nowhere.tpl
expect 2 "^tplex: cannot open include: is a directory $no_dirs" tokens include
expect 2 "^tplex: cannot open -: not found; standard input is not read" check -
long=$(printf 'x%.0s' {1..196}).tpl
expect 2 "^tplex: cannot open $long: the name is longer than the 199 characters" check "$long"
if [ "$windows" ]; then  # "/x" is absolute on a POSIX host only; a drive path on Windows
    expect 2 "^tplex: cannot open C:\\\\nowhere\\\\x\\.tpl: not found $cannot_open" check 'C:\nowhere\x.tpl'
else
    expect 2 "^tplex: cannot open /nowhere/x.tpl: not found $cannot_open" check /nowhere/x.tpl
fi
expect 2 '^tplex: -D x: the name is already known' check -D X -D x signalling.tpl
nine=(-I a -I b -I c -I d -I e -I f -I g -I h -I include)
expect 2 '^tplex: -I include: Attempting too many Includes$' check -I i "${nine[@]}" signalling.tpl
expect 1 '^tplex table: signalling.tpl: ' table signalling.tpl

# Accepted forms; failures past --max-failures are counted, not printed.
expect 0 '^signalling.tpl: 0 failures$' check -Iinclude -DTRACE -- signalling.tpl
expect 1 '^tplex: 1 more failure not shown \(--max-failures 16\)$' tokens --max-failures 16 failures.tpl

# Sources of the tool's own making, in a folder of their own.
cd "$tmp" || exit 2
mkdir inc
head -c 150 /dev/zero | tr '\0' '$' >dollars.tpl
printf 'STATE a;\n#ifdef X\n/* open\n' >inc/open.tpl
printf 'PROCESS p;\n#ifndef Y\n#include "inc\\open.tpl"\n' >main.tpl
expect 1 '^\.\.\. 50 more failures not shown \(--max-failures 100\)$' check dollars.tpl
COUNT=150 expect 1 '"Bad Character"$' tokens --max-failures 0 dollars.tpl
if [ "$(id -u)" != 0 ] && [ ! "$windows" ]; then  # root reads any file
    printf 'STATE a;\n' >secret.tpl && chmod 000 secret.tpl
    expect 2 "^tplex: cannot open secret.tpl: permission denied $no_dirs" check secret.tpl
fi
# Warnings: where a comment and two regions were opened.
expect 0 '^inc[/\\]open.tpl:3: warning: /\* comment opened here is still open at the end of the file \(line 3\)$' check main.tpl
region='warning: #ifdef/#ifndef region still open at the end of input$'
expect 0 "^main.tpl:2: $region" check main.tpl
expect 1 '^main.tpl: 0 failures, 3 warnings$' check --strict main.tpl
printf '#ifdef X\n%.0s' {1..21} >deep.tpl  # a 21st region is refused: the 20th keeps its line
COUNT=20 expect 1 "^deep.tpl:([1-9]|1[0-9]|20): $region" check deep.tpl

# A failed write of standard output is an I/O error.
if [ -w /dev/full ] && [ ! "$windows" ]; then
    if ! "$tool" tokens dollars.tpl 2>&1 >/dev/full | grep -q '^tplex: cannot write standard output' ||
        "$tool" --help >/dev/full 2>/dev/null || [ $? != 2 ]; then
        failed=$((failed + 1)) && echo "FAILED: writing to /dev/full is not an I/O error"
    fi
fi
cd "$OLDPWD" || exit 2

# The listing's key-press pause does not wait on an open input that is not a terminal.
exec 3< <(sleep 30)
sleeper=$!
timeout 20 "$tool" dict --all -I include signalling.tpl <&3 2>&1 | grep -q '^ End of Listing $' ||
    { failed=$((failed + 1)) && echo "FAILED: tplex dict --all waited on an open pipe (or failed)"; }
exec 3<&- && kill "$sleeper"

# The token stream of a short file, and the summary of a table file.
cd "$here" || exit 2
same tokens.txt 1 tokens tokens.tpl
same tokens.json 1 tokens --json tokens.tpl
cd "$tables" || exit 2
same table_sound.txt 0 table sound.tbl
echo "$failed failed"
[ "$failed" = 0 ]
