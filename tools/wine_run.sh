#!/bin/sh
# Runs one program of the build under Wine, for CTest. Its output goes by way of a file: what Wine starts in the background
# meanwhile (its desktop process, for one) inherits it and outlives the program, and CTest waits for the end of a pipe.
output=$(mktemp) || exit 1
trap 'rm -f "$output"' EXIT
wine "$@" > "$output" 2>&1 < /dev/null
status=$?
cat "$output"
exit "$status"
