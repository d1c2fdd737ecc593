#!/bin/sh
# usage: example-from-install.sh CMAKE BUILD_DIR LIBDIR CXX EXAMPLE [FLAG...]
# Installs the build into a temporary prefix, builds examples/host from it
# alone through pkg-config with the build's FLAGs, and runs it on a fresh
# simulated device: a first launch. KORRIN_RUN (an emulator) starts it and
# KORRIN_LDD lists dependencies in a cross build.
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
# The .pc files ask for C++11, as a launcher's toolchain may be.
"$cxx" -Werror "$@" "$example" -o "$work/host" $(cat "$work/flags")
mkdir "$work/root"
LD_LIBRARY_PATH="$lib" KORRIN_SIM_ROOT="$work/root" ${KORRIN_RUN:-} "$work/host" >"$work/out" ||
  fail "the host exited with $?"
cat "$work/out"
[ "$(sed -n 1p "$work/out")" = "page 1" ] && sed -n 2p "$work/out" | grep -q '^  (1,1) ' ||
  fail "not a first launch: page 1 first, a box at (1,1)"
