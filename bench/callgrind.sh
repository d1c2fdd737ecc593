#!/bin/bash
# Instruction counts of each store operation and of its SQLite floor, under
# valgrind's callgrind: figures that do not move with the machine's load.
#
#   bash bench/callgrind.sh [FILTER] [MAX_BOXES]
#
# FILTER is a regular expression on STORAGE/OPERATION/BOXES/ (default: all);
# MAX_BOXES the largest layout measured (default 10000; 100000 takes minutes
# per operation under valgrind). Builds build-bench (or $KORRIN_BENCH_BUILD)
# as `scripts/dev.sh bench` does. Prints operation, boxes, floor and store
# instructions per call, their ratio, and on the largest layout of each
# operation the growth: the slope of log(instructions) against log(boxes)
# from the smallest layout (0 constant, 1 linear). Only the calls themselves
# are counted: korrin-bench toggles collection around them.
set -euo pipefail
cd "$(dirname "$0")/.."
build=${KORRIN_BENCH_BUILD:-build-bench}
filter=${1:-}
max=${2:-10000}

if [ ! -x "$build/bench/korrin-bench" ]; then
  cmake -S . -B "$build" -DCMAKE_BUILD_TYPE=Release -DKORRIN_BENCHMARKS=ON -DKORRIN_TESTS=OFF >/dev/null
fi
cmake --build "$build" -j2 --target korrin-bench >/dev/null

out=$(mktemp -d)
trap 'rm -rf "$out"' EXIT
valgrind --tool=callgrind --collect-atstart=no --callgrind-out-file="$out/cg" \
  --log-file="$out/valgrind.log" "$build/bench/korrin-bench" --callgrind "$filter" "$max"

# Each dump: "desc: Trigger: Client Request: STORAGE/OPERATION/BOXES/SIDE/PASSES"
# and "summary: IR". Dumps come operation by operation, sizes ascending.
n=1
while [ -f "$out/cg.$n" ]; do
  name=$(grep -a '^desc: Trigger: Client Request: ' "$out/cg.$n" | sed 's/^desc: Trigger: Client Request: //')
  total=$(grep -a '^summary: ' "$out/cg.$n" | sed 's/^summary: //')
  echo "$name $total"
  n=$((n + 1))
done | awk -F'[/ ]' '
  function growth(a, b, n, m) { return (a > 0 && b > 0 && m > n) ? sprintf("%6.2f", log(b / a) / log(m / n)) : "     -" }
  function flush() {
    if (op == "") return
    for (i = 1; i <= rows; i++) {
      g = (i == rows && rows > 1) ? growth(f[1], f[rows], n[1], n[rows]) " " growth(s[1], s[rows], n[1], n[rows]) : ""
      printf "%-34s %7d %13.0f %13.0f %6.2f %s\n", op, n[i], f[i], s[i], s[i] / f[i], g
    }
    rows = 0
  }
  BEGIN { printf "%-34s %7s %13s %13s %6s %6s %6s\n", "operation", "boxes", "floor Ir", "store Ir", "ratio", "floor~", "store~" }
  {
    if ($2 != op || $3 != last) { if ($2 != op) flush(); op = $2; last = $3 }
    if ($4 == "floor") { rows++; n[rows] = $3; f[rows] = $6 / $5 } else { s[rows] = $6 / $5 }
  }
  END { flush() }'
