#!/usr/bin/env bash
# clang-tidy over the sources that the cross build compiles, with the mingw headers that clang does not find by itself,
# and over those that only the native build compiles.
# usage: tools/lint.sh BUILD_FOLDER [FILE…]        A file that has not changed since it passed is not checked again.
set -euo pipefail
cd "$(dirname "$0")/.."

build=$1
shift
passed=$build/lint
mkdir -p "$passed"

headers=$(ls -d /usr/lib/gcc/x86_64-w64-mingw32/*-posix/include/c++ | tail -n 1)
export headers build passed native=build/native-sanitized

check() {
  local stamp checks='' options
  # The path-sensitive analyser takes most of the time and finds little in tests.
  case $1 in *_test.cpp | tests/*) checks='--checks=-clang-analyzer-*' ;; esac
  options=(-p "$build" --extra-arg=--target=x86_64-w64-mingw32 --extra-arg=-nostdinc++ --extra-arg=-isystem"$headers"
           --extra-arg=-isystem"$headers/x86_64-w64-mingw32")
  case $1 in tests/fuzz/* | tests/native/*) options=(-p "$native") ;; esac
  # What decides the outcome: the file, the checks, and every header of ours.
  stamp=$passed/$(cat "$1" .clang-tidy "$passed/headers" | sha256sum | cut -c-40)
  [ -e "$stamp" ] && return
  if ! clang-tidy --quiet ${checks:+"$checks"} "$1" "${options[@]}" --extra-arg=-Wno-unknown-warning-option \
    --extra-arg=-Wno-unused-command-line-argument 2> "$stamp.err"; then
    grep -v 'warnings\? generated' "$stamp.err" >&2
    rm -f "$stamp.err"
    echo "lint: $1" >&2
    return 1
  fi
  mv "$stamp.err" "$stamp"
}
export -f check

git ls-files --cached --others --exclude-standard -- '*.h' | sort | xargs cat | sha256sum > "$passed/headers"
if [ $# -eq 0 ]; then
  mapfile -t files < <(git ls-files --cached --others --exclude-standard -- '*.cpp')
else
  files=("$@")
fi
echo "== clang-tidy over ${#files[@]} files"
printf '%s\n' "${files[@]}" | xargs -P "$(nproc)" -I{} bash -c 'check {}'
