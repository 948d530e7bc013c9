#!/usr/bin/env bash
# The tool's command line: exit status 0 (clean), 1 (the input had
# failures), 2 (usage or I/O error), and the messages that go with them.
#
#   command_line.sh TOOL VERSION      (run in examples/)
set -u
tool=$1 version=$2
passed=0 failed=0

# expect STATUS PATTERN ARGS...: tplex ARGS exits with STATUS and prints a
# line matching the extended regular expression PATTERN (either stream).
expect() {
    expect_lines "$1" + "$2" "${@:3}"
}

# expect_lines STATUS COUNT PATTERN ARGS...: as expect, with exactly COUNT
# such lines (+ for one or more).
expect_lines() {
    local status=$1 count=$2 pattern=$3
    shift 3
    local out rc n
    out=$("$tool" "$@" 2>&1 </dev/null)
    rc=$?
    n=$(grep -Ec -- "$pattern" <<<"$out")
    if [ "$rc" = "$status" ] && { [ "$n" = "$count" ] || { [ "$count" = + ] && [ "$n" -gt 0 ]; }; }; then
        passed=$((passed + 1))
    else
        failed=$((failed + 1))
        echo "FAILED: tplex $* -> status $rc (expected $status), output:"
        printf '%s\n' "$out" | head -n 20
        echo "(expected $count line(s) matching: $pattern)"
    fi
}

# Version and help.
expect 0 "^tplex $version\$" --version
expect 0 '^usage: tplex tokens' help
for cmd in tokens dict check; do expect 0 '^  -I DIR' "$cmd" -h; done
expect 0 '^usage: tplex table FILE$' table --help
expect 0 '^  --json' tokens --help
expect 0 '^  --all' dict --help
expect 0 '^  --strict' check --help
expect 0 '^  --max-failures N$' tokens --help

# Usage errors.
expect 2 '^usage: tplex tokens'
expect 2 "unknown command 'frobnicate'" frobnicate signalling.tpl
expect 2 'no FILE given' tokens
expect 2 'no FILE given' check -I include
expect 2 "only one FILE" check signalling.tpl failures.tpl
expect 2 "unknown option '--all'" tokens --all signalling.tpl
expect 2 "unknown option '--json'" check --json signalling.tpl
expect 2 "unknown option '-x'" dict -x signalling.tpl
expect 2 '-I needs a value' check signalling.tpl -I
expect 2 '-D needs a value' check signalling.tpl -D
expect 2 "unknown option '-I'" table -I include x.tbl
expect 2 '--max-failures needs a count' check --max-failures x signalling.tpl
expect 2 '--max-failures needs a count' tokens signalling.tpl --max-failures
expect 2 "unknown option '--strict'" tokens --strict signalling.tpl

# Files and names the lexer refuses: the reason, then the library's code.
no_dirs='\(0xd3470209: No Includes to Search for Included File\)$'
cannot_open='\(0xd3470226: Cannot Open Source File\)$'
expect 2 "^tplex: cannot open nowhere.tpl: not found $no_dirs" check nowhere.tpl
expect 2 "^tplex: cannot open include: is a directory $no_dirs" tokens include
expect 2 "^tplex: cannot open -: not found; standard input is not read" check -
long=$(printf 'x%.0s' {1..196}).tpl
expect 2 "^tplex: cannot open $long: the name is longer than the 199 characters" check "$long"
# A missing file under an absolute name. A name that begins with "/" is
# absolute on a POSIX host only; on Windows it is relative, and a drive path
# is absolute.
if [ "${TPLEX_TARGET_SYSTEM:-}" = Windows ]; then
    expect 2 "^tplex: cannot open C:\\\\nowhere\\\\x\\.tpl: not found $cannot_open" \
        check 'C:\nowhere\x.tpl'
    expect 2 "^tplex: cannot open /nowhere/x.tpl: not found $no_dirs" check /nowhere/x.tpl
else
    expect 2 "^tplex: cannot open /nowhere/x.tpl: not found $cannot_open" check /nowhere/x.tpl
fi
expect 2 '^tplex: -D protocol: the name is already known' check -D protocol signalling.tpl
expect 2 '^tplex: -D x: the name is already known' check -D X -D x signalling.tpl
expect 2 '^tplex: -I include: Attempting too many Includes$' \
    check -I a -I b -I c -I d -I e -I f -I g -I h -I i -I include signalling.tpl

expect 2 '^tplex: cannot open nowhere.tbl: not found$' table nowhere.tbl
expect 1 '^tplex table: signalling.tpl: ' table signalling.tpl

# Accepted forms.
expect 0 '^signalling.tpl: 0 failures$' check -Iinclude -DTRACE signalling.tpl
expect 0 '^signalling.tpl: 0 failures$' \
    check -I a -I b -I c -I d -I e -I f -I g -I h -I include signalling.tpl
expect 0 '^signalling.tpl: 0 failures$' check -I include -- signalling.tpl
# Without -I the included name is opened relative to the current folder.
expect 1 '^No Includes to Search for Included File$' check signalling.tpl
expect 1 '^failures.tpl: 17 failures$' check failures.tpl
expect 1 'FAILURE +0xd3470207 "Bad Character"$' tokens failures.tpl

# Failures past --max-failures are counted, not printed (0: no limit).
expect 1 '^\.\.\. 14 more failures not shown \(--max-failures 3\)$' check --max-failures 3 failures.tpl
expect 1 '^failures.tpl: 17 failures$' check --max-failures=3 failures.tpl
expect 1 '^tplex: 1 more failure not shown \(--max-failures 16\)$' tokens --max-failures 16 failures.tpl

# Sources of the tool's own making, in a folder of their own.
tmp=$(mktemp -d)
trap 'rm -rf "$tmp"' EXIT
cd "$tmp" || exit 2
mkdir inc
head -c 150 /dev/zero | tr '\0' '$' >dollars.tpl
printf 'STATE a;\n#ifdef X\n/* open\n' >inc/open.tpl
printf 'PROCESS p;\n#ifndef Y\n#include "inc\\open.tpl"\n' >main.tpl
printf 'STATE "gr\303\274\303\237e \376\303!";\n' >utf8.tpl

# Root reads any file: permission denied shows only to a plain user.
if [ "$(id -u)" != 0 ] && [ "${TPLEX_TARGET_SYSTEM:-}" != Windows ]; then
    printf 'STATE a;\n' >secret.tpl && chmod 000 secret.tpl
    expect 2 "^tplex: cannot open secret.tpl: permission denied $no_dirs" check secret.tpl
fi

expect 1 '^\.\.\. 50 more failures not shown \(--max-failures 100\)$' check dollars.tpl
expect_lines 1 150 '"Bad Character"$' tokens --max-failures 0 dollars.tpl

# Warnings: where a comment and two regions were opened.
comment='/\* comment opened here is still open at the end of the file \(line 3\)$'
region='warning: #ifdef/#ifndef region still open at the end of input$'
expect 0 "^inc[/\\]open.tpl:3: warning: $comment" check main.tpl
expect 0 "^main.tpl:2: $region" check main.tpl
expect 0 "^inc[/\\]open.tpl:2: $region" check main.tpl
expect 0 '^main.tpl: 0 failures, 3 warnings$' check main.tpl
expect 1 '^main.tpl: 0 failures, 3 warnings$' check --strict main.tpl

# As README tells parser authors: a minus sign touching a digit is the
# number's sign.
printf 'x-1\n' >minus.tpl
expect 0 '^minus.tpl:1: number +-1 "1"$' tokens minus.tpl

# JSON strings are UTF-8: stray bytes as \udcXX.
expect 0 '"text":"grüße \\udcfe\\udcc3!"' tokens --json utf8.tpl

# A failed write of standard output is an I/O error.
if [ -w /dev/full ] && [ "${TPLEX_TARGET_SYSTEM:-}" != Windows ]; then
    for args in "tokens dollars.tpl" "check main.tpl" "--help"; do
        # shellcheck disable=SC2086
        if err=$("$tool" $args 2>&1 >/dev/full </dev/null); then rc=0; else rc=$?; fi
        if [ "$rc" = 2 ] && grep -q '^tplex: cannot write standard output' <<<"$err"; then
            passed=$((passed + 1))
        else
            failed=$((failed + 1))
            echo "FAILED: tplex $args >/dev/full -> status $rc: $err"
        fi
    done
fi

# The listing pauses only when standard input and output are both
# terminals: with a terminal as input and a file as output, no prompt and
# no wait.
if command -v script >/dev/null && [ "${TPLEX_TARGET_SYSTEM:-}" != Windows ]; then
    cp "$OLDPWD"/signalling.tpl . && cp "$OLDPWD"/include/*.tpl inc/
    if timeout 20 script -qc "'$tool' dict --all -I inc signalling.tpl >listing.txt" /dev/null \
        </dev/null >/dev/null && grep -q '^ End of Listing $' listing.txt &&
        ! grep -q 'Press a key' listing.txt; then
        passed=$((passed + 1))
    else
        failed=$((failed + 1))
        echo "FAILED: tplex dict --all, input a terminal, output a file: prompted or waited"
    fi
fi
cd "$OLDPWD" || exit 2

# The listing's key-press pause does not wait on an input that is not a
# terminal, even one that stays open.
exec 3< <(sleep 30)
sleeper=$!
if out=$(timeout 20 "$tool" dict --all -I include signalling.tpl <&3 2>&1) &&
    grep -q '^ End of Listing $' <<<"$out"; then
    passed=$((passed + 1))
else
    failed=$((failed + 1))
    echo "FAILED: tplex dict --all waited on an open pipe (or failed)"
fi
exec 3<&-
kill "$sleeper" 2>/dev/null

echo "$passed passed, $failed failed"
[ "$failed" = 0 ]
