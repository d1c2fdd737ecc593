#!/usr/bin/env bash
# Checks packaging/korrin-data.spec against CMake's own rules for the device build:
# the recipe parses; its Version is the one written into korrin-data.pc; its
# pkgconfig() BuildRequires are the modules that .pc file requires; its %files
# name every file the install puts down and nothing more (%dir entries must be
# directories it makes), and each %files carries the manifest.
#
# A device configure needs the Tizen pkg-config modules, which this machine lacks.
# Empty stand-ins let KORRIN_PLATFORM=tizen configure (nothing is compiled or
# linked), an empty file stands where each built artifact would be, and the real
# install rules then run into a scratch DESTDIR. So the file list comes from the
# tizen branch of CMakeLists.txt itself, not from a copy kept here.
set -euo pipefail
cd "$(dirname "$0")/.."
spec=packaging/korrin-data.spec
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
bad() { echo "check-spec: $*" | tee -a "$work/problems" >&2; }

rpmspec -P "$spec" >"$work/spec"
sed -n 's/^BuildRequires: *pkgconfig(\(.*\))$/\1/p' "$work/spec" | sort >"$work/spec-modules"
mkdir "$work/pc"
while read -r m; do
  pkg-config --exists "$m" || printf 'Name: %s\nDescription: stand-in\nVersion: 0\n' "$m" >"$work/pc/$m.pc"
done <"$work/spec-modules"
PKG_CONFIG_PATH="$work/pc" cmake -S . -B "$work/build" -DKORRIN_PLATFORM=tizen -DKORRIN_TESTS=OFF \
  -DCMAKE_INSTALL_PREFIX="$(rpm -E %_prefix)" -DCMAKE_INSTALL_LIBDIR="$(rpm -E %_libdir)" \
  -DCMAKE_INSTALL_INCLUDEDIR="$(rpm -E %_includedir)" >"$work/configure.log" 2>&1 || {
  cat "$work/configure.log" >&2
  bad "KORRIN_PLATFORM=tizen does not configure with the recipe's pkgconfig() BuildRequires"
  exit 1
}
grep -o "\"$work/build/[^\"\$]*\"" "$work/build/cmake_install.cmake" | tr -d '"' |
  while read -r f; do [ -e "$f" ] || : >"$f"; done
DESTDIR="$work/root" cmake --install "$work/build" >/dev/null
(cd "$work/root" && find . ! -type d | sed 's/^\.//' | sort) >"$work/installed"

pc=$(find "$work/root" -name korrin-data.pc)
pc_version=$(sed -n 's/^Version: //p' "$pc")
[ "$pc_version" = "$(rpmspec -q --srpm --qf '%{VERSION}' "$spec")" ] ||
  bad "Version is not korrin-data.pc's $pc_version"
sed -n 's/^Requires: //p' "$pc" | tr ' ' '\n' | grep . | sort >"$work/pc-modules"
while read -r m; do bad "BuildRequires lacks pkgconfig($m), which korrin-data.pc requires"; done \
  < <(comm -23 "$work/pc-modules" "$work/spec-modules")
while read -r m; do bad "BuildRequires pkgconfig($m), which korrin-data.pc does not require"; done \
  < <(comm -13 "$work/pc-modules" "$work/spec-modules")

# The %files sections: each needs %manifest; "F path" for a file, "D path" for %dir.
awk '/^%files/ {on = 1; n++; next} /^%[a-z]+($| )/ && !/^%(manifest|dir) / {on = 0}
     !on {next} /^%manifest / {m++} /^%dir / {print "D", $2} /^\// {print "F", $1}
     END {if (m != n) print "M"}' "$work/spec" >"$work/files"
grep -q '^M' "$work/files" && bad "a %files section lacks %manifest"
while read -r d; do [ -d "$work/root$d" ] || bad "%dir $d: no such directory installed"; done \
  < <(sed -n 's/^D //p' "$work/files")
sed -n 's/^F //p' "$work/files" | sort >"$work/listed"
while read -r f; do bad "$f is installed but not in %files"; done \
  < <(comm -23 "$work/installed" "$work/listed")
while read -r f; do bad "$f is in %files but not installed"; done \
  < <(comm -13 "$work/installed" "$work/listed")
[ -s "$work/problems" ] && exit 1
echo "check-spec: $spec matches the device install ($(wc -l <"$work/installed") files)"
