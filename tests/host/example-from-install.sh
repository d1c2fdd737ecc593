#!/bin/sh
# Installs a built tree into a temporary prefix, builds examples/host from that
# prefix alone through pkg-config, runs it on a fresh simulated device and
# checks that it shows the first launch: every game on page 1 of the first
# menu, four to a row, in byte order of application id.
#
# usage: example-from-install.sh CMAKE BUILD_DIR LIBDIR CXX EXAMPLE [FLAG...]
# The FLAGs are the ones the tree was built with (warnings, sanitizers): an
# instrumented library loads only into an instrumented program.
# In a cross build KORRIN_RUN (the emulator) starts the example and KORRIN_LDD
# lists a library's dependencies.
set -eu
cmake=$1 build=$2 libdir=$3 cxx=$4 example=$5
shift 5

work=$(mktemp -d /tmp/korrin-host-example-XXXXXX)
trap 'rm -rf "$work"' EXIT
prefix=$work/prefix
fail() { echo "FAIL: $*" >&2; exit 1; }

"$cmake" --install "$build" --prefix "$prefix" >/dev/null

# Exactly the public headers, in their module folders.
expected='korrin-data/korrin-data.h
launcher-data-manager/db-util.h
launcher-data-manager/game-data.h
launcher-data-manager/launcher-data-manager.h
launcher-package-manager/launcher-package-manager.h
log-client-manager/log-client-manager.h
system-info/system-info.h'
installed=$(cd "$prefix/include/korrin-data" && find . -type f | sed 's|^\./||' | LC_ALL=C sort)
[ "$installed" = "$expected" ] || fail "installed headers differ:
$installed"

# The library finds the simulated platform beside it, without help.
${KORRIN_LDD:-ldd} "$prefix/$libdir/libkorrin-data.so" | grep -q "libkorrin-sim-platform.so => $prefix/$libdir/" ||
  fail "libkorrin-data.so does not find libkorrin-sim-platform.so beside it"

export PKG_CONFIG_PATH="$prefix/$libdir/pkgconfig"
"$cxx" -std=c++17 -Werror "$@" "$example" -o "$work/host" $(pkg-config --cflags --libs korrin-data)

mkdir "$work/root"
LD_LIBRARY_PATH="$prefix/$libdir" KORRIN_SIM_ROOT="$work/root" ${KORRIN_RUN:-} "$work/host" >"$work/out" ||
  fail "the host exited with $?"
cat "$work/out"

[ "$(head -n 1 "$work/out")" = "page 1" ] || fail "the home screen does not start with page 1"
[ "$(grep -c '^page ' "$work/out")" -eq 1 ] || fail "a first launch makes one page"
grep '^  (' "$work/out" >"$work/boxes" || fail "the home screen shows no box"
awk '{
    want = sprintf("(%d,%d)", n % 4 + 1, int(n / 4) + 1); n++
    if ($1 != want) { print "box " n " is at " $1 ", not " want; bad = 1 } }
  END { if (n < 5) { print "only " n " boxes"; bad = 1 }; exit bad }' "$work/boxes" ||
  fail "the boxes are not laid out four to a row from (1,1)"
awk '{ print $2 }' "$work/boxes" | LC_ALL=C sort -c -u ||
  fail "the boxes are not in byte order of application id"
