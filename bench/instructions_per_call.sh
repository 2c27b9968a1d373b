#!/usr/bin/env bash
# Counts the instructions ovmacro executes per macro call, with callgrind: a steadier figure than a time on a
# shared machine, and the one to watch when changing the invocation path. It expands N lines
# "x greet(aN, b) y" (the macro-call workload of compare_with_m4.sh, N = 20,000 by default) and an empty
# file, and divides the difference by N.
#
# Needs: valgrind. Builds ovmacro in Release into build/bench (as compare_with_m4.sh does).
# Usage: bench/instructions_per_call.sh [N]   (PROFILE=1 also prints callgrind's ten most costly functions)
set -euo pipefail
cd "$(dirname "$0")/.."
calls=${1:-20000}

command -v valgrind >/dev/null || { echo "instructions_per_call: valgrind is needed" >&2; exit 2; }
source bench/common.sh
build_release_ovmacro

work=$(mktemp -d "${TMPDIR:-/tmp}/ovmacro-calls.XXXXXX")
trap 'rm -rf "$work"' EXIT
{
  echo "$greet_definition"
  write_call_lines "$calls"
} >"$work/calls.ovm"
echo "$greet_definition" >"$work/empty.ovm"

# instructions FILE: the instructions callgrind counts for expanding FILE (start-up included).
instructions() {
  valgrind --tool=callgrind --callgrind-out-file="$work/$(basename "$1").cg" "$ovmacro" "$1" -o /dev/null 2>&1 |
    awk '/refs:/ { gsub(",", "", $NF); print $NF }'
}
total=$(instructions "$work/calls.ovm")
base=$(instructions "$work/empty.ovm")
awk -v t="$total" -v b="$base" -v n="$calls" \
  'BEGIN { printf "%d calls: %d instructions, %d at start-up, %.0f per call\n", n, t, b, (t - b) / n }'
if [[ ${PROFILE:-0} == 1 ]]; then
  callgrind_annotate "$work/calls.ovm.cg" 2>/dev/null | grep -E '^ *[0-9,]+ +\(' | sed -n '2,11p' | cut -c1-140
fi
