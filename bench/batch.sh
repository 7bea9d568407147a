#!/usr/bin/env bash
# 2,000 getters asked as 2,000 brixcli processes, and as one `brixcli --batch`.
#
#   bench/batch.sh [--lines N] [--runs N]
#
# Builds nothing: expects brixcli and brixsim in ${BRIX_BUILD_DIR:-build}/bin. Makes its own host
# in a temporary folder. The processes are started by xargs (one fork and exec a line, no shell
# in between), as a script's loop would start them. Prints a Markdown table of hyperfine's
# medians; the per-line cost in the batch is (batch - empty batch) / N.
set -euo pipefail

top=$(cd "$(dirname "$0")/.." && pwd)
bin=${BRIX_BUILD_DIR:-$top/build}/bin
lines=2000
runs=5
while [ $# -gt 0 ]; do
  case $1 in
    --lines) lines=$2; shift ;;
    --runs) runs=$2; shift ;;
    *) echo "usage: $0 [--lines N] [--runs N]" >&2; exit 2 ;;
  esac
  shift
done
for tool in hyperfine jq xargs "$bin/brixcli" "$bin/brixsim"; do
  command -v "$tool" >/dev/null || { echo "batch.sh: missing $tool (scripts/bootstrap, scripts/build)" >&2; exit 1; }
done
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
export BRIX_HOST_ROOT=$work/host
"$bin/brixsim" init >/dev/null

getters=("system uuid get" "system hostname get" "system time get" "system stats uptime get")
for ((i = 0; i < lines; ++i)); do echo "${getters[i % 4]}"; done >"$work/getters"
: >"$work/empty"

hyperfine -N --style basic --warmup 1 --runs "$runs" --export-json "$work/processes.json" \
  -n processes "xargs -a $work/getters -L 1 $bin/brixcli" >/dev/null
hyperfine -N --style basic --warmup 3 --runs $((runs * 4)) --export-json "$work/batch.json" \
  -n batch "$bin/brixcli --batch $work/getters" \
  -n empty "$bin/brixcli --batch $work/empty" >/dev/null

median() { jq -r --arg name "$2" '.results[] | select(.command == $name) | .median' "$1"; }
processes=$(median "$work/processes.json" processes)
batch=$(median "$work/batch.json" batch)
empty=$(median "$work/batch.json" empty)
echo "| $lines getters | median s | per getter ms |"
echo "|---|---:|---:|"
printf '| %s processes | %.3f | %.3f |\n' "$lines" "$processes" "$(jq -n "$processes * 1000 / $lines")"
printf '| one batch | %.3f | %.4f |\n' "$batch" "$(jq -n "$batch * 1000 / $lines")"
printf '| one batch, start-up (empty file) excluded | %.3f | %.4f |\n' "$(jq -n "$batch - $empty")" \
  "$(jq -n "($batch - $empty) * 1000 / $lines")"
echo
printf 'Batch / processes: 1/%.0f\n' "$(jq -n "$processes / $batch")"
