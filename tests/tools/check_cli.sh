#!/usr/bin/env bash
# Runs one kelstat command and checks its exit status, its standard output (against a file of
# expected text) and its standard error (against a grep pattern).
# usage: check_cli.sh STATUS STDOUT-FILE|- STDERR-PATTERN|- STDIN-FILE|- -- COMMAND [ARGS...]
set -uo pipefail
expected_status=$1 expected_stdout=$2 stderr_pattern=$3 stdin_file=$4
shift 5
out=$(mktemp) err=$(mktemp)
trap 'rm -f "$out" "$err"' EXIT
if [[ "$stdin_file" == - ]]; then
  "$@" >"$out" 2>"$err" </dev/null
else
  "$@" >"$out" 2>"$err" <"$stdin_file"
fi
status=$?
failed=0
if [[ $status -ne $expected_status ]]; then
  echo "exit status $status, expected $expected_status"; failed=1
fi
if [[ "$expected_stdout" != - ]] && ! diff -u "$expected_stdout" "$out"; then
  echo "standard output differs from $expected_stdout"; failed=1
fi
if [[ "$stderr_pattern" != - ]] && ! grep -qE -- "$stderr_pattern" "$err"; then
  echo "standard error does not match /$stderr_pattern/:"; cat "$err"; failed=1
fi
exit $failed
