#!/usr/bin/env bash
# cppcheck over the sources: it follows values along every path of a file by other rules than clang-tidy does.
# usage: tools/cppcheck.sh BUILD_FOLDER [FILE…]        A file that has not changed since the last run is not read again.
# Chosen are errors and the groups warning, performance and portability, which report what is likely wrong. Not chosen are
# style and information: taste, and guesses about calls into libraries whose headers it does not read.
# A finding that is none is suppressed at its line, with the reason: // cppcheck-suppress ID ; why
# One class stands twice on purpose: the tests' stand-in for the upload library has its own.
set -euo pipefail
cd "$(dirname "$0")/.."

results=$1/cppcheck
shift
mkdir -p "$results"
if [ $# -eq 0 ]; then
  mapfile -t files < <(git ls-files --cached --others --exclude-standard -- '*.cpp')
else
  files=("$@")
fi
echo "== cppcheck over ${#files[@]} files"
printf '%s\n' "${files[@]}" | cppcheck --quiet -j "$(nproc)" --cppcheck-build-dir="$results" --error-exitcode=1 \
  --enable=warning,performance,portability --inline-suppr --platform=win64 --std=c++20 --library=windows --library=googletest \
  -I. -D_WIN32 -D_WIN64 -DUNICODE -D_UNICODE -DNOMINMAX \
  --suppress=ctuOneDefinitionRuleViolation:companions/upload/upload_context.h \
  --template='{file}:{line}:{column}: {severity}: {message} [{id}]' --file-list=-
