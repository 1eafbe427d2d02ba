#!/usr/bin/env bash
# abi.sh: compares the interface of the library, types and layouts included, with that of the last
# release, which is the last tag v* before the working copy. The status is 1 where programs that were
# built with the release would not run with the library of today, unless its soname has changed.
#
# Both are built with debugging information below build/abi, the release once: some minutes. Where
# neither the public headers nor the list of exported names differ from the release, the interface
# cannot, and nothing is built. XQUERY_RELEASE names another tag.
set -euo pipefail
. "$(dirname "${BASH_SOURCE[0]}")/../../cmake/prepare.sh"
cd "$top"

public=(include tests/interface/exported.txt)
release=${XQUERY_RELEASE:-$(git describe --tags --abbrev=0 --match 'v*' 2>/dev/null || true)}
if [ -z "$release" ]; then
  echo "no release to compare with yet: there is no tag v*"
  exit 0
fi
if git diff --quiet "$release" -- "${public[@]}" &&
  [ -z "$(git ls-files --others --exclude-standard -- "${public[@]}")" ]; then
  echo "the interface is that of $release: headers and exported names are the same"
  exit 0
fi

need_packages abigail-tools git binutils

# build_interface SOURCE BUILD: a library with debugging information and nothing else.
build_interface() {
  quietly cmake -S "$1" -B "$2" -G Ninja -DCMAKE_BUILD_TYPE=Debug -DCMAKE_CXX_FLAGS_DEBUG="-O0 -g" \
    -DXQUERY_BUILD_TESTS=OFF -DXQUERY_BUILD_BENCH=OFF -DXQUERY_BUILD_CLI=OFF
  quietly cmake --build "$2" -j "$jobs" --target libxquery.so
}

soname() {
  readelf -d "$1" | sed -nE 's/.*SONAME.*\[(.*)\].*/\1/p'
}

old=$top/build/abi/$release
new=$top/build/abi/now
if [ ! -f "$old/build/libxquery.so" ]; then
  rm -rf "$old"
  mkdir -p "$old/source"
  git archive "$release" | tar -x -C "$old/source"
  build_interface "$old/source" "$old/build"
fi
build_interface "$top" "$new"

if [ "$(soname "$old/build/libxquery.so")" != "$(soname "$new/libxquery.so")" ]; then
  echo "another soname than $release: the interface may be another one"
  exit 0
fi
# What is new breaks nobody.
if abidiff --headers-dir1 "$old/source/include" --headers-dir2 "$top/include" --no-added-syms \
  "$old/build/libxquery.so" "$new/libxquery.so"; then
  echo "programs built with $release run with the library as it is"
else
  echo "the interface is not that of $release: give it back, or raise the soname" >&2
  exit 1
fi
