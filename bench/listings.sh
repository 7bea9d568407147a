#!/usr/bin/env bash
# Long listings: brixcli against sqlite3 printing the same columns of the same table, paired in
# one hyperfine run, and peak memory in every formatter.
#
#   bench/listings.sh [--runs N] [--out DIR]
#
# Builds nothing: expects brixcli and brixsim in ${BRIX_BUILD_DIR:-build}/bin. Makes its hosts
# (100,000 and 1,000,000 worlds; 100,000 options; 100,000 modules) in a temporary folder and
# writes the JSON of every group plus listings.md to DIR (default
# ${BRIX_BUILD_DIR:-build}/bench-results).
set -euo pipefail

top=$(cd "$(dirname "$0")/.." && pwd)
build=${BRIX_BUILD_DIR:-$top/build}
bin=$build/bin
out=$build/bench-results
runs=10
while [ $# -gt 0 ]; do
  case $1 in
    --runs) runs=$2; shift ;;
    --out) out=$2; shift ;;
    *) echo "usage: $0 [--runs N] [--out DIR]" >&2; exit 2 ;;
  esac
  shift
done
for tool in hyperfine jq sqlite3 /usr/bin/time "$bin/brixcli" "$bin/brixsim"; do
  command -v "$tool" >/dev/null || { echo "listings.sh: missing $tool (scripts/bootstrap, scripts/build)" >&2; exit 1; }
done
mkdir -p "$out"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
brixcli=$bin/brixcli

peak_rss() {  # the median of five runs, KiB
  for _ in 1 2 3 4 5; do /usr/bin/time -f %M "$@" 2>&1 >/dev/null | tail -n 1; done | sort -n |
    sed -n 3p
}
median_ms() {  # FILE INDEX
  jq -r ".results[$2].median * 1000" "$1"
}

# The five columns `system process list` shows by default, from the table it reads.
worlds_sql="SELECT id, cartel_id, name, domain, command_line FROM process_worlds ORDER BY id"
options_sql="SELECT path, type, int_value, int_default, int_min, int_max, str_value, str_default, valid_chars, description FROM adv_options ORDER BY branch, seq"
modules_sql="SELECT name, loaded, enabled FROM modules ORDER BY seq"

# GROUP SCALE COMMAND SQL
measure() {
  local group=$1 scale=$2 command=$3 sql=$4
  local root=$work/$group
  BRIX_HOST_ROOT=$root "$bin/brixsim" init --scale "$scale" >/dev/null
  BRIX_HOST_ROOT=$root hyperfine -N --style basic --warmup 1 --runs "$runs" \
    --export-json "$out/listing-$group.json" \
    -n "brixcli $command" "$brixcli $command" \
    -n "sqlite3 -column" "sqlite3 -readonly -column $root/host.db '$sql'" >"$out/listing-$group.log" 2>&1 ||
    { cat "$out/listing-$group.log" >&2; exit 1; }
  local ms ref rss=()
  ms=$(median_ms "$out/listing-$group.json" 0)
  ref=$(median_ms "$out/listing-$group.json" 1)
  for formatter in simple table json xml csv keyvalue; do
    rss+=("$(BRIX_HOST_ROOT=$root peak_rss $brixcli --formatter=$formatter $command)")
  done
  printf '| %s | `%s` | %.0f | %.0f | %.2f | %s |\n' "$scale" "$command" "$ms" "$ref" \
    "$(jq -n "$ms / $ref")" "$(IFS=/; echo "${rss[*]}")"
}

{
  echo "Load average at the start: $(cut -d' ' -f1-3 /proc/loadavg); $runs runs after 1 warm-up run."
  echo
  echo "| host | command | brixcli median ms | sqlite3 median ms | ratio | peak RSS KiB simple/table/json/xml/csv/keyvalue |"
  echo "|---|---|---:|---:|---:|---|"
  measure worlds-100k worlds=100000 "system process list" "$worlds_sql"
  measure worlds-1m worlds=1000000 "system process list" "$worlds_sql"
  measure options-100k options=100000 "system settings advanced list" "$options_sql"
  measure modules-100k modules=100000 "system module list" "$modules_sql"
} | tee "$out/listings.md"
