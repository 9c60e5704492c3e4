#!/usr/bin/env bash
# Runs fuzz targets and prints what they did: executions, coverage edges, crashes. An input that breaks a promise is
# kept in build/fuzz/NAME/crashes; what a run learns stays in build/fuzz/NAME/corpus and is where the next one begins.
# usage: tools/fuzz.sh BUILD_FOLDER [--jobs N] (--short | SECONDS [EXECUTIONS]) [NAME…]
#   --short: a fixed number of executions from the seeds alone
#   SECONDS: for each target, or EXECUTIONS if those are reached first
set -euo pipefail
cd "$(dirname "$0")/.."

readonly short_executions=20000 seed=20260301
build=$1
shift
jobs=2
[ "$1" = --jobs ] && jobs=$2 && shift 2
export build seed short_executions limit=$1 executions=-1
shift
if [[ ${1:-} =~ ^[0-9]+$ ]]; then
  executions=$1
  shift
fi

run_target() { # NAME LONGEST
  local folder=build/fuzz/$1 corpus options log crashes kept
  corpus=$folder/corpus
  options=(-max_len="$2" -seed="$seed" -timeout=20 -rss_limit_mb=2048 -print_final_stats=1 -use_value_profile=0
           -artifact_prefix="$folder/crashes/" -dict="tests/fuzz/$1.dict")
  if [ "$limit" = --short ]; then
    corpus=$folder/short # thrown away: it would change the next run
    rm -rf "$corpus"
    options+=(-runs="$short_executions")
  else
    options+=(-runs="$executions" -max_total_time="$limit")
  fi
  mkdir -p "$corpus" "$folder/crashes"
  for kept in "$folder"/crashes/*; do # a crash that is mended is one no more
    [ -e "$kept" ] && "$build/fuzz/fuzz_$1" -timeout=20 "$kept" > /dev/null 2>&1 && rm "$kept"
  done
  log=$folder/log
  "$build/fuzz/fuzz_$1" "${options[@]}" "$corpus" "tests/fuzz/seeds/$1" > "$log" 2>&1 || true
  crashes=$(find "$folder/crashes" -type f ! -name 'slow-unit-*' | wc -l)
  # A run that ended before its figures were printed is a crash also when it left no input.
  grep -q '^stat::number_of_executed_units' "$log" || crashes=$((crashes == 0 ? 1 : crashes))
  printf '%-26s %12s %8s %8s\n' "$1" "$(sed -n 's/^stat::number_of_executed_units: *//p' "$log")" \
    "$(grep -o ' cov: [0-9]*' "$log" | tail -n 1 | cut -c7-)" "$crashes"
}
export -f run_target

mapfile -t targets < "$build/fuzz/targets"
if [ $# -gt 0 ]; then
  chosen=()
  for name in "$@"; do
    row=$(printf '%s\n' "${targets[@]}" | grep "^$name " || true)
    [ -n "$row" ] || { echo "there is no fuzz target '$name'; tests/fuzz/CMakeLists.txt has the list" >&2; exit 1; }
    chosen+=("$row")
  done
  targets=("${chosen[@]}")
fi

printf '%-26s %12s %8s %8s\n' target executions edges crashes
printf '%s\n' "${targets[@]}" | xargs -P "$jobs" -I{} bash -c 'run_target {}' | tee build/fuzz-figures
if awk '{ if ($4 != 0) bad = 1 } END { exit !bad }' build/fuzz-figures; then
  echo "there are crashes: their inputs are in build/fuzz/NAME/crashes, what was said in build/fuzz/NAME/log" >&2
  exit 1
fi
