#!/bin/bash
# Instruction counts of each store operation, and of the engine's first
# launch and package events (engine_bench.cpp), beside their SQLite floor,
# under valgrind's callgrind: figures that do not move with the machine's load.
#
#   bash bench/callgrind.sh [FILTER] [MAX_BOXES]
#
# FILTER is a regular expression on STORAGE/OPERATION/BOXES/ (default: all);
# MAX_BOXES the largest layout measured (default 10000; 100000 takes minutes
# per operation under valgrind). Builds build-bench (or $KORRIN_BENCH_BUILD)
# as `scripts/dev.sh bench` does. Prints operation, boxes, floor and store
# instructions per call, their ratio, and on the largest layout of each
# operation the growth: the slope of log(instructions) against log(boxes)
# from the smallest layout (0 constant, 1 linear); then the share of the
# store side spent for the simulated device and the ratio without it (see
# sim_share). Only the calls themselves are counted: korrin-bench toggles
# collection around them. The engine's first launch goes up to a tenth of
# MAX_BOXES; its events run in a 10,000-box menu, or a 1,000-box one when
# MAX_BOXES is below 10,000.
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
# Operation names may hold spaces, so fields are split on "/" alone.
#
# sim: what of a dump ran for the simulated device, so that an engine row's
# distance from its floor can be told from the simulator's. The instructions
# in libkorrin-sim-platform itself, plus the calls it makes into other
# libraries (libc, libstdc++), inclusive, except those into the engine or the
# benchmark binary, which the device calls back. Read from the "ob=" (the
# object of the following cost lines) and "cob=" / "calls=" lines; a cost
# line right after "calls=" is that call's inclusive cost. An object's
# compressed name, "(N) path", may be given in an earlier dump only, so the
# dumps are read in order in one pass.
files=()
n=1
while [ -f "$out/cg.$n" ]; do files+=("$out/cg.$n"); n=$((n + 1)); done
[ ${#files[@]} -gt 0 ] || { echo "callgrind.sh: no dumps; see valgrind's log" >&2; exit 1; }
awk '
  function object(spec,   id, rest) {
    if (match(spec, /^\([0-9]+\)/)) {
      id = substr(spec, 2, RLENGTH - 2); rest = substr(spec, RLENGTH + 1); sub(/^ /, "", rest)
      if (rest != "") names[id] = rest
      return names[id]
    }
    return spec
  }
  function sim(name) { return name ~ /libkorrin-sim-platform/ }
  function engine(name) { return name ~ /libkorrin-data|korrin-bench/ }
  function report() { if (desc != "") printf "%s/%s/%.0f\n", desc, summary, total }
  FNR == 1 { report(); desc = ""; summary = 0; total = 0; ob = ""; cob = ""; incall = 0 }
  /^desc: Trigger: Client Request: / { desc = substr($0, 32); next }
  /^summary: / { summary = $2; next }
  /^ob=/ { ob = object(substr($0, 4)); next }
  /^cob=/ { cob = object(substr($0, 5)); next }
  /^calls=/ { incall = 1; next }
  /^[0-9+*-]/ {
    if (incall) {
      callee = (cob == "") ? ob : cob
      if (sim(ob) && !sim(callee) && !engine(callee)) total += $2
      incall = 0; cob = ""
    } else if (sim(ob)) {
      total += $2
    }
    next
  }
  /^fn=/ { cob = "" }
  END { report() }' "${files[@]}" \
  | awk -F'/' '
  function growth(a, b, n, m) { return (a > 0 && b > 0 && m > n) ? sprintf("%6.2f", log(b / a) / log(m / n)) : "     -" }
  function flush() {
    if (op == "") return
    for (i = 1; i <= rows; i++) {
      g = (i == rows && rows > 1) ? growth(f[1], f[rows], n[1], n[rows]) " " growth(s[1], s[rows], n[1], n[rows]) : "             "
      # Without the simulator: the store side less what ran for the device.
      own = (s[i] - sim[i]) / f[i]
      share = sim[i] > 0 ? sprintf("%5.1f%% %6.2f", 100 * sim[i] / s[i], own) : "     -      -"
      printf "%-34s %6d %11.0f %11.0f %6.2f %s %s\n", op, n[i], f[i], s[i], s[i] / f[i], g, share
    }
    rows = 0
  }
  BEGIN { printf "%-34s %6s %11s %11s %6s %6s %6s %6s %6s\n", "operation", "boxes", "floor Ir", "store Ir", "ratio", "floor~", "store~", "sim", "-sim" }
  {
    if ($2 != op || $3 != last) { if ($2 != op) flush(); op = $2; last = $3 }
    if ($4 == "floor") { rows++; n[rows] = $3; f[rows] = $6 / $5 } else { s[rows] = $6 / $5; sim[rows] = $7 / $5 }
  }
  END { flush() }'
