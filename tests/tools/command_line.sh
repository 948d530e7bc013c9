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
    local status=$1 pattern=$2
    shift 2
    local out rc
    out=$("$tool" "$@" 2>&1 </dev/null)
    rc=$?
    if [ "$rc" = "$status" ] && grep -Eq -- "$pattern" <<<"$out"; then
        passed=$((passed + 1))
    else
        failed=$((failed + 1))
        echo "FAILED: tplex $* -> status $rc (expected $status), output:"
        printf '%s\n' "$out" | head -n 20
        echo "(expected a line matching: $pattern)"
    fi
}

# Version and help.
expect 0 "^tplex $version\$" --version
expect 0 '^usage: tplex tokens' help
for cmd in tokens dict check; do expect 0 '^  -I DIR' "$cmd" -h; done
expect 0 '^usage: tplex table FILE$' table --help
expect 0 '^  --json' tokens --help
expect 0 '^  --all' dict --help

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

# Files and names the lexer refuses.
expect 2 '^tplex: cannot open nowhere.tpl: No Includes to Search for Included File$' \
    check nowhere.tpl
# A missing file under an absolute name. A name that begins with "/" is
# absolute on a POSIX host only; on Windows it is relative, and a drive path
# is absolute.
if [ "${TPLEX_TARGET_SYSTEM:-}" = Windows ]; then
    expect 2 '^tplex: cannot open C:\\nowhere\\x\.tpl: Cannot Open Source File$' \
        check 'C:\nowhere\x.tpl'
    expect 2 '^tplex: cannot open /nowhere/x.tpl: No Includes to Search for Included File$' \
        check /nowhere/x.tpl
else
    expect 2 '^tplex: cannot open /nowhere/x.tpl: Cannot Open Source File$' check /nowhere/x.tpl
fi
expect 2 '^tplex: -D protocol: the name is already known' check -D protocol signalling.tpl
expect 2 '^tplex: -D x: the name is already known' check -D X -D x signalling.tpl
expect 2 '^tplex: -I include: Attempting too many Includes$' \
    check -I a -I b -I c -I d -I e -I f -I g -I h -I i -I include signalling.tpl

expect 2 '^tplex: cannot open nowhere.tbl: No such file or directory$' table nowhere.tbl
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
