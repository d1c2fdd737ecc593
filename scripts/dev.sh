#!/usr/bin/env bash
# Sets up a Debian 12 machine for the engine, builds it, and runs one thing:
#   scripts/dev.sh demo       the simulator's demo
#   scripts/dev.sh test       the whole test suite
#   scripts/dev.sh sanitize   the whole test suite under ASan and UBSan
#   scripts/dev.sh bench      the benchmarks (a Release build of their own)
# Missing Debian packages are installed with apt-get (as root) only when missing.
set -euo pipefail
cd "$(dirname "$0")/.."

# The library needs SQLite and Boost's headers; korrin-sim adds
# Boost.Program_options, libedit and dtl; the tests GoogleTest and GoogleMock.
packages=(g++ make cmake pkg-config libsqlite3-dev libboost-dev libboost-program-options-dev
          libedit-dev libdtl-dev libgtest-dev libgmock-dev)

install_missing_packages() {
  local missing=() p
  packages+=("$@")
  for p in "${packages[@]}"; do
    dpkg-query -W -f='${Status}' "$p" 2>/dev/null | grep -q 'install ok installed' || missing+=("$p")
  done
  [ ${#missing[@]} -eq 0 ] && return 0
  if [ "$(id -u)" -ne 0 ]; then
    echo "dev.sh: missing Debian packages: ${missing[*]}; run as root to install them" >&2
    exit 1
  fi
  echo "dev.sh: installing ${missing[*]}" >&2
  apt-get update -q
  DEBIAN_FRONTEND=noninteractive apt-get install -y -q --no-install-recommends "${missing[@]}"
}

# build DIR [cmake options...]
build() {
  local dir=$1
  shift
  cmake -S . -B "$dir" "$@" >/dev/null
  cmake --build "$dir" -j"$(nproc)"
}

run_tests() {
  ctest --test-dir "$1" -j"$(nproc)" --output-on-failure
}

case "${1:-}" in
  demo)
    install_missing_packages
    build build
    exec build/tools/korrin-sim/korrin-sim demo
    ;;
  test)
    install_missing_packages
    build build
    run_tests build
    ;;
  sanitize)
    install_missing_packages
    build build-sanitize -DCMAKE_BUILD_TYPE=Debug -DKORRIN_SANITIZE=ON
    export ASAN_OPTIONS=detect_leaks=1:abort_on_error=1
    export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
    run_tests build-sanitize
    ;;
  bench)
    install_missing_packages libbenchmark-dev
    build build-bench -DCMAKE_BUILD_TYPE=Release -DKORRIN_BENCHMARKS=ON -DKORRIN_TESTS=OFF
    build-bench/bench/korrin-bench
    ;;
  *)
    echo "usage: scripts/dev.sh demo|test|sanitize|bench" >&2
    exit 2
    ;;
esac
