#!/usr/bin/env bash
# compare.sh TOOL EXPECTED_FILE EXPECTED_STATUS ARGS...: runs the tool (in the
# folder the arguments are relative to, standard input empty) and compares
# its standard output and exit status; TPLEX_UPDATE_EXPECTED=1 rewrites the file.
set -u
tool=$1 expected=$2 status=$3
shift 3
actual=$(mktemp)
trap 'rm -f "$actual"' EXIT
"$tool" "$@" </dev/null >"$actual"
rc=$?
# On Windows paths show "\" (doubled in JSON) where the expected files have "/".
[ "${TPLEX_TARGET_SYSTEM:-}" = Windows ] && sed -i 's#include\\\{1,2\}#include/#g' "$actual"
[ "${TPLEX_UPDATE_EXPECTED:-0}" = 1 ] && cp "$actual" "$expected"
[ "$rc" = "$status" ] || { echo "exit status $rc, expected $status: tplex $*"; exit 1; }
diff -u "$expected" "$actual" || { echo "output differs from $expected: tplex $*"; exit 1; }
