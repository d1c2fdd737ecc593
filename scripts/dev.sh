#!/usr/bin/env bash
# Sets up a Debian 12 machine for the engine, builds it, and runs one thing:
#   scripts/dev.sh demo       the simulator's demo
#   scripts/dev.sh serve [ARGS]
#                             the demo's phone in a browser (korrin-sim serve;
#                             ARGS such as --port N go to it)
#   scripts/dev.sh test       the whole test suite
#   scripts/dev.sh sanitize   the whole test suite under ASan and UBSan
#   scripts/dev.sh bench [ARGS]
#                             the benchmarks (a Release build of their own);
#                             ARGS go to Google Benchmark
#   scripts/dev.sh callgrind [FILTER [MAX_BOXES]]
#                             instruction counts of the store, the engine path
#                             and their floors, under callgrind
#   scripts/dev.sh arm        the library, korrin-sim and the whole test suite
#                             built for 32-bit ARM and run under qemu-user
#   scripts/dev.sh fuzz [SECONDS]
#                             the fuzzer for SECONDS (default 600), keeping what it
#                             finds in build-fuzz/work (or $KORRIN_FUZZ_WORK)
# `test` also builds the fuzzer with clang and gives it a short, fixed run, and
# checks the device package's recipe (packaging/check-spec.sh, with rpm's rpmspec).
# Missing Debian packages are installed with apt-get (as root) only when missing.
set -euo pipefail
cd "$(dirname "$0")/.."

# The library needs SQLite and Boost's headers; korrin-sim adds
# Boost.Program_options, libedit, dtl and nlohmann-json (the views as JSON);
# the tests GoogleTest and GoogleMock.
packages=(g++ make cmake pkg-config libsqlite3-dev libboost-dev libboost-program-options-dev
          libedit-dev libdtl-dev nlohmann-json3-dev libcpp-httplib-dev libgtest-dev libgmock-dev)

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
  # A failed index (a mirror mid-sync) is not fatal: a failed install is.
  apt-get update -q || echo "dev.sh: some package indexes failed; going on" >&2
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

# The fuzz target, built by clang with libFuzzer and the sanitizers, and only it.
fuzz_packages=(clang libclang-rt-14-dev)
build_fuzzer() {
  cmake -S . -B build-fuzz -DCMAKE_C_COMPILER=clang -DCMAKE_CXX_COMPILER=clang++ \
    -DKORRIN_FUZZ=ON -DKORRIN_TESTS=OFF >/dev/null
  cmake --build build-fuzz -j"$(nproc)" --target korrin-fuzz
}

# The phone's architecture: Debian's cross compiler, and a sysroot of Debian's
# own armhf packages unpacked into build-arm/sysroot with a private apt state,
# so the machine's package architectures stay as they are.
arm_packages=(g++-arm-linux-gnueabihf qemu-user googletest file)
arm_sysroot_packages=(libsqlite3-0 libsqlite3-dev libboost1.74-dev libboost-program-options1.74.0
                      libboost-program-options1.74-dev libedit2 libedit-dev libbsd0 libmd0
                      libtinfo6 libdtl-dev nlohmann-json3-dev)
arm_toolchain=(-DCMAKE_TOOLCHAIN_FILE="$PWD/cmake/arm-linux-gnueabihf.cmake"
               -DKORRIN_ARM_SYSROOT="$PWD/build-arm/sysroot")

prepare_arm_sysroot() {
  local deps=build-arm/deps sysroot=build-arm/sysroot deb
  # Made again when the package list or the toolchain file changes.
  local made_from
  made_from="${arm_sysroot_packages[*]} $(sha1sum cmake/arm-linux-gnueabihf.cmake)"
  [ "$(cat "$sysroot/.made-from" 2>/dev/null)" = "$made_from" ] && return 0
  # The build's cache keeps the toolchain's flags of its first configuration.
  rm -rf "$deps" "$sysroot" build-arm/CMakeCache.txt build-arm/CMakeFiles
  mkdir -p "$deps/lists/partial" "$deps/cache/archives/partial" "$deps/debs"
  touch "$deps/status"
  local apt=(-q -o Dir::State::Lists="$PWD/$deps/lists" -o Dir::Cache="$PWD/$deps/cache"
             -o Dir::State::status="$PWD/$deps/status" -o APT::Architecture=armhf
             -o APT::Architectures::=armhf -o APT::Sandbox::User=root -o Acquire::Retries=3)
  # An index that fails (a mirror mid-sync) is not fatal: the download below is.
  apt-get "${apt[@]}" update >/dev/null || echo "dev.sh: some armhf indexes failed; going on" >&2
  (cd "$deps/debs" && apt-get "${apt[@]}" download "${arm_sysroot_packages[@]}" >/dev/null) || {
    echo "dev.sh: cannot download Debian's armhf packages (do the apt sources offer armhf?)" >&2
    exit 1
  }
  for deb in "$deps"/debs/*.deb; do dpkg -x "$deb" "$sysroot"; done
  # The cross compiler's loader, C and C++ libraries, where qemu-arm -L looks.
  mkdir -p "$sysroot/lib"
  local cross=/usr/arm-linux-gnueabihf/lib
  ln -s "$cross"/ld-linux-armhf.so.3 "$cross"/lib*.so.[0-9]* "$sysroot/lib/"
  # GoogleTest from Debian's sources, built for the target into the sysroot.
  cmake -S /usr/src/googletest -B "$deps/googletest" "${arm_toolchain[@]}" \
    -DCMAKE_BUILD_TYPE=RelWithDebInfo -DCMAKE_INSTALL_PREFIX="$PWD/$sysroot/usr" >/dev/null
  cmake --build "$deps/googletest" -j"$(nproc)" >/dev/null
  cmake --install "$deps/googletest" >/dev/null
  echo "$made_from" >"$sysroot/.made-from"
}

# Only korrin-sim, quietly, for the demos: cmake's output goes to a log shown
# on failure.
build_korrin_sim_quietly() {
  install_missing_packages
  mkdir -p build
  echo "dev.sh: building korrin-sim (log in build/demo-build.log)" >&2
  if ! { cmake -S . -B build && cmake --build build -j"$(nproc)" --target korrin-sim; } \
      >build/demo-build.log 2>&1; then
    tail -n 40 build/demo-build.log >&2
    echo "dev.sh: the build failed; the whole log is build/demo-build.log" >&2
    exit 1
  fi
}

# The browser tests drive Debian's chromium with playwright-core from npm,
# pinned by tests/serve/package-lock.json; npm itself from Debian when the
# machine has none.
install_browser_driver() {
  command -v npm >/dev/null || install_missing_packages nodejs npm
  [ -d tests/serve/node_modules/playwright-core ] ||
    npm ci --prefix tests/serve --no-audit --no-fund >/dev/null
}

case "${1:-}" in
  demo)
    build_korrin_sim_quietly
    exec build/tools/korrin-sim/korrin-sim demo
    ;;
  serve)
    build_korrin_sim_quietly
    exec build/tools/korrin-sim/korrin-sim serve --script tools/korrin-sim/demo.ksim "${@:2}"
    ;;
  test)
    install_missing_packages "${fuzz_packages[@]}" rpm chromium
    install_browser_driver
    build build
    run_tests build
    bash packaging/check-spec.sh
    build_fuzzer
    run_tests build-fuzz
    ;;
  sanitize)
    install_missing_packages
    build build-sanitize -DCMAKE_BUILD_TYPE=Debug -DKORRIN_SANITIZE=ON
    export ASAN_OPTIONS=detect_leaks=1:abort_on_error=1
    export UBSAN_OPTIONS=print_stacktrace=1:halt_on_error=1
    run_tests build-sanitize
    ;;
  bench)
    install_missing_packages libbenchmark-dev valgrind
    build build-bench -DCMAKE_BUILD_TYPE=Release -DKORRIN_BENCHMARKS=ON -DKORRIN_TESTS=OFF
    # One table: each operation on a disk file and on /dev/shm (tmpfs), its
    # SQLite floor, the store, and store / floor. Extra arguments go to the
    # harness (--benchmark_filter=..., --benchmark_repetitions=N).
    shift
    build-bench/bench/korrin-bench "$@"
    ;;
  callgrind)
    install_missing_packages libbenchmark-dev valgrind
    shift
    exec bash bench/callgrind.sh "$@"
    ;;
  arm)
    install_missing_packages "${arm_packages[@]}"
    prepare_arm_sysroot
    build build-arm "${arm_toolchain[@]}"
    file -L build-arm/libkorrin-data.so
    qemu-arm -L build-arm/sysroot build-arm/tools/korrin-sim/korrin-sim demo
    run_tests build-arm
    ;;
  fuzz)
    seconds=${2:-600}
    install_missing_packages "${fuzz_packages[@]}"
    build_fuzzer
    # New inputs go to the work corpus, never into fuzz/corpus; crashes beside it.
    work=${KORRIN_FUZZ_WORK:-build-fuzz/work}
    mkdir -p "$work/corpus" "$work/crashes"
    set +e
    build-fuzz/fuzz/korrin-fuzz -max_total_time="$seconds" -timeout=60 -print_final_stats=1 \
      -dict=fuzz/korrin.dict -artifact_prefix="$work/crashes/" "$work/corpus" fuzz/corpus \
      2>&1 | tee "$work/last-run.log"
    status=${PIPESTATUS[0]}
    set -e
    runs=$(sed -n 's/^stat::number_of_executed_units: *//p' "$work/last-run.log")
    echo "dev.sh: ${runs:-no} executions in ${seconds} s; log in $work/last-run.log" >&2
    exit "$status"
    ;;
  *)
    echo "usage: scripts/dev.sh demo|test|sanitize|arm|bench|callgrind|fuzz [SECONDS]" >&2
    exit 2
    ;;
esac
