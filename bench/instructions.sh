#!/usr/bin/env bash
# Instructions executed by one brixcli process (callgrind counts them repeatably, whatever the
# machine's load) and the dynamic loader's relocation count, per command.
#
#   bench/instructions.sh [COMMAND WORDS...]     default: a few getters and lists
#
# Builds nothing: expects ${BRIX_BUILD_DIR:-build}/bin. Runs against a fresh default host.
set -euo pipefail

top=$(cd "$(dirname "$0")/.." && pwd)
bin=${BRIX_BUILD_DIR:-$top/build}/bin
command -v valgrind >/dev/null || { echo "instructions.sh: valgrind is missing (scripts/bootstrap)" >&2; exit 1; }
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
export BRIX_HOST_ROOT=$work/host
"$bin/brixsim" init >/dev/null

if [ $# -gt 0 ]; then
  commands=("$*")
else
  commands=("system uuid get" "system hostname get" "system process list" "system module list")
fi
printf '| command | instructions | in the dynamic loader | relocations |\n|---|---:|---:|---:|\n'
for command in "${commands[@]}"; do
  # shellcheck disable=SC2086
  valgrind --tool=callgrind --callgrind-out-file="$work/out" "$bin/brixcli" $command >/dev/null 2>&1
  total=$(callgrind_annotate "$work/out" 2>/dev/null | awk '/PROGRAM TOTALS/ {gsub(",", "", $1); print $1}')
  loader=$(callgrind_annotate --inclusive=yes "$work/out" 2>/dev/null |
    awk '/elf\/rtld.c:_dl_start |elf\/dl-open.c:dl_open_worker / {gsub(",", "", $1); sum += $1} END {print sum + 0}')
  # shellcheck disable=SC2086
  relocations=$(LD_DEBUG=statistics "$bin/brixcli" $command 2>&1 >/dev/null |
    awk '/final number of relocations:/ {print $NF}')
  printf '| `brixcli %s` | %s | %s | %s |\n' "$command" "$total" "$loader" "$relocations"
done
