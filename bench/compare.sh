#!/usr/bin/env bash
# Whole-process timings and peak memory of brixcli against the system's own one-line tools.
#
#   bench/compare.sh [--quick] [--no-scale] [--out DIR]
#
# Builds nothing: expects brixcli and brixsim in ${BRIX_BUILD_DIR:-build}/bin. Makes its own host
# roots in a temporary folder (never the user's default host), runs hyperfine without a shell
# (-N) and writes one JSON file per group plus summary.md to DIR (default
# ${BRIX_BUILD_DIR:-build}/bench-results). --quick takes fewer runs (for CI); --no-scale skips
# the large hosts made with `brixsim init --scale`.
set -euo pipefail

top=$(cd "$(dirname "$0")/.." && pwd)
build=${BRIX_BUILD_DIR:-$top/build}
bin=$build/bin
out=$build/bench-results
runs=100
warmup=10
scaled=1
while [ $# -gt 0 ]; do
  case $1 in
    --quick) runs=20; warmup=3 ;;
    --no-scale) scaled=0 ;;
    --out) out=$2; shift ;;
    *) echo "usage: $0 [--quick] [--no-scale] [--out DIR]" >&2; exit 2 ;;
  esac
  shift
done
for tool in hyperfine jq /usr/bin/time "$bin/brixcli" "$bin/brixsim"; do
  command -v "$tool" >/dev/null || { echo "compare.sh: missing $tool (scripts/bootstrap, scripts/build)" >&2; exit 1; }
done
mkdir -p "$out"
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT

brixcli=$bin/brixcli
export BRIX_HOST_ROOT=$work/default
"$bin/brixsim" init >/dev/null

# A listing in the kernel's module-list format with as many lines as `system module list`
# prints, for machines (containers) that have no /proc/modules of their own.
modules=/proc/modules
if [ ! -r "$modules" ] || [ "$(wc -l <"$modules")" -eq 0 ]; then
  modules=$work/modules
  count=$("$brixcli" --formatter=csv system module list | tail -n +2 | wc -l)
  for ((i = 0; i < count; ++i)); do
    printf 'mod_%03d 16384 %d - Live 0x0000000000000000\n' "$i" $((i % 3))
  done >"$modules"
fi

# hyperfine GROUP NAME COMMAND [NAME COMMAND]...   (RUNS/WARMUP in the environment override)
bench() {
  local group=$1
  shift
  local n=${RUNS:-$runs} w=${WARMUP:-$warmup}
  local args=()
  while [ $# -gt 0 ]; do
    args+=(-n "$1" "$2")
    shift 2
  done
  hyperfine -N --style basic --warmup "$w" --runs "$n" --export-json "$out/$group.json" \
    "${args[@]}" >"$out/$group.log" 2>&1 || { cat "$out/$group.log" >&2; exit 1; }
}

# Peak resident set size in KiB: the median of five runs.
peak_rss() {
  for _ in 1 2 3 4 5; do /usr/bin/time -f %M "$@" 2>&1 >/dev/null | tail -n 1; done | sort -n |
    sed -n 3p
}

bench getters \
  "brixcli system uuid get" "$brixcli system uuid get" \
  "brixcli system hostname get" "$brixcli system hostname get" \
  "brixcli system time get" "$brixcli system time get" \
  "brixcli system stats uptime get" "$brixcli system stats uptime get" \
  "hostname" "hostname" \
  "date" "date" \
  "uptime" "uptime"
bench lists \
  "brixcli system process list" "$brixcli system process list" \
  "brixcli system module list" "$brixcli system module list" \
  "ps -e" "ps -e" \
  "cat modules" "cat $modules"

# name|reference|command: the table rows of the summary.
rows=(
  "brixcli system uuid get|hostname|$brixcli system uuid get"
  "brixcli system hostname get|hostname|$brixcli system hostname get"
  "brixcli system time get|date|$brixcli system time get"
  "brixcli system stats uptime get|uptime|$brixcli system stats uptime get"
  "brixcli system process list|ps -e|$brixcli system process list"
  "brixcli system module list|cat modules|$brixcli system module list"
  "hostname||hostname"
  "date||date"
  "uptime||uptime"
  "ps -e||ps -e"
  "cat modules||cat $modules"
)

scale_rows=()
if [ "$scaled" = 1 ]; then
  for worlds in 10000 50000 100000; do
    export BRIX_HOST_ROOT=$work/worlds-$worlds
    "$bin/brixsim" init --scale "worlds=$worlds" >/dev/null
    RUNS=10 WARMUP=1 bench "process-list-$worlds" "process list, $worlds worlds" "$brixcli system process list"
    scale_rows+=("process-list-$worlds|$brixcli system process list")
  done
  export BRIX_HOST_ROOT=$work/options-10000
  "$bin/brixsim" init --scale options=10000 >/dev/null
  RUNS=20 WARMUP=2 bench advanced-list-10000 "advanced list, 10000 options" "$brixcli system settings advanced list"
  scale_rows+=("advanced-list-10000|$brixcli system settings advanced list")
  export BRIX_HOST_ROOT=$work/large
  "$bin/brixsim" init --scale worlds=100000,options=10000,modules=10000 >/dev/null
  bench uuid-large "uuid get, large host" "$brixcli system uuid get"
  scale_rows+=("uuid-large|$brixcli system uuid get")
  export BRIX_HOST_ROOT=$work/default
fi

median_ms() {  # FILE NAME
  jq -r --arg name "$2" '.results[] | select(.command == $name) | .median * 1000' "$1"
}

{
  echo "Load average at the end: $(cut -d' ' -f1-3 /proc/loadavg); $runs runs after $warmup warm-up runs."
  echo
  echo "| command | median ms | reference | median ms | ratio | peak RSS KiB |"
  echo "|---|---:|---|---:|---:|---:|"
  for row in "${rows[@]}"; do
    IFS='|' read -r name reference command <<<"$row"
    file=$out/getters.json
    jq -e --arg name "$name" '.results[] | select(.command == $name)' "$file" >/dev/null ||
      file=$out/lists.json
    ms=$(median_ms "$file" "$name")
    rss=$(BRIX_HOST_ROOT=$work/default peak_rss $command)
    if [ -n "$reference" ]; then
      ref=$(median_ms "$file" "$reference")
      printf '| `%s` | %.2f | `%s` | %.2f | %.2f | %s |\n' "$name" "$ms" "$reference" "$ref" \
        "$(jq -n "$ms / $ref")" "$rss"
    else
      printf '| `%s` | %.2f | | | | %s |\n' "$name" "$ms" "$rss"
    fi
  done
  if [ ${#scale_rows[@]} -gt 0 ]; then
    echo
    echo "| scaled host | median ms | peak RSS KiB |"
    echo "|---|---:|---:|"
    for row in "${scale_rows[@]}"; do
      IFS='|' read -r group command <<<"$row"
      ms=$(jq -r '.results[0].median * 1000' "$out/$group.json")
      name=$(jq -r '.results[0].command' "$out/$group.json")
      case $group in
        process-list-*) root=$work/worlds-${group##*-} ;;
        advanced-list-*) root=$work/options-${group##*-} ;;
        *) root=$work/large ;;
      esac
      rss=$(BRIX_HOST_ROOT=$root peak_rss $command)
      printf '| %s | %.2f | %s |\n' "$name" "$ms" "$rss"
    done
  fi
} | tee "$out/summary.md"
