#!/bin/sh
# usage: example-from-install.sh CMAKE BUILD_DIR LIBDIR CXX EXAMPLE [FLAG...]
# Installs the built tree into a temporary prefix, builds examples/host from
# that prefix alone through pkg-config, with the FLAGs the tree was built with
# (an instrumented library loads only into an instrumented program), and runs
# it on a fresh simulated device: it must show a first launch, every game on
# page 1, four to a row, in byte order of application id. In a cross build
# KORRIN_RUN (the emulator) starts it and KORRIN_LDD lists dependencies.
set -eu
cmake=$1 build=$2 libdir=$3 cxx=$4 example=$5
shift 5
work=$(mktemp -d /tmp/korrin-host-example-XXXXXX)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix lib=$work/prefix/$libdir
fail() { echo "FAIL: $*" >&2; exit 1; }

"$cmake" --install "$build" --prefix "$prefix" >/dev/null
installed=$(cd "$prefix/include/korrin-data" && find . -type f | LC_ALL=C sort | tr '\n' ' ')
[ "$installed" = "./korrin-data/korrin-data.h ./launcher-data-manager/db-util.h \
./launcher-data-manager/game-data.h ./launcher-data-manager/launcher-data-manager.h \
./launcher-package-manager/launcher-package-manager.h ./log-client-manager/log-client-manager.h \
./system-info/system-info.h " ] || fail "the installed headers are not the public ones: $installed"
${KORRIN_LDD:-ldd} "$lib/libkorrin-data.so" | grep -q "libkorrin-sim-platform.so => $lib/" ||
  fail "libkorrin-data.so does not find libkorrin-sim-platform.so beside it"

PKG_CONFIG_PATH="$lib/pkgconfig" pkg-config --cflags --libs korrin-data >"$work/flags"
"$cxx" -std=c++17 -Werror "$@" "$example" -o "$work/host" $(cat "$work/flags")
mkdir "$work/root"
LD_LIBRARY_PATH="$lib" KORRIN_SIM_ROOT="$work/root" ${KORRIN_RUN:-} "$work/host" >"$work/out" ||
  fail "the host exited with $?"
cat "$work/out"
LC_ALL=C awk 'function no(why) { print why; bad = 1; exit }
  NR == 1 && $0 != "page 1" { no("page 1 does not come first") }
  NR > 1 { want = sprintf("(%d,%d)", (NR - 2) % 4 + 1, int((NR - 2) / 4) + 1)
           if ($1 != want) no("line " NR " is not at " want)
           if ($2 <= last) no($2 " does not come after " last); last = $2 }
  END { if (!bad && NR < 6) { print "only " NR - 1 " boxes"; bad = 1 }; exit bad }' "$work/out" ||
  fail "not a first launch"
