#!/usr/bin/env bash
# packages.sh SOURCE_DIR BUILD_DIR: makes the Debian packages of a build, has lintian look at them,
# installs them with dpkg into a root of their own and uses them from there: the command, the
# examples through CMake's and pkg-config's files, the Python module.
#
# That root knows, as installed, those packages of this machine that the new ones name as their
# dependencies, at the versions they have here, and nothing else: what they fail to name, or want
# newer, dpkg refuses. It needs no rights beyond those of the caller.
set -eu
source_dir=$1 build_dir=$2
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
fail() {
  echo "$*" >&2
  exit 1
}
# same WHAT EXPECTED ACTUAL
same() {
  [ "$2" = "$3" ] || fail "$1: expected \"$2\", not \"$3\""
}

# --- making them ---------------------------------------------------------------------------------

(umask 022 && cd "$build_dir" && cpack -G DEB -B "$work/packages" >"$work/log" 2>&1) ||
  fail "$(cat "$work/log")"
cd "$work/packages"
names=(libxquery0 libxquery-dev xquery)
[ ! -f "$build_dir/bindings/python/cmake_install.cmake" ] || names+=(python3-xquery)
same "the packages" "$(printf '%s\n' "${names[@]}" | sort)" \
  "$(for file in *.deb; do dpkg-deb -f "$file" Package; done | sort)"
if command -v lintian >/dev/null; then
  lintian --allow-root --fail-on error,warning *.deb || fail "lintian finds fault"
fi

# --- installing them -----------------------------------------------------------------------------

root=$work/root
mkdir -p "$root/var/lib/dpkg/info" "$root/var/lib/dpkg/updates" "$root/var/log"
needed=$(for file in *.deb; do dpkg-deb -f "$file" Depends; done |
  tr ',|' '\n' | sed 's/(.*//; s/ //g' | sort -u)
for package in $needed; do
  [[ " ${names[*]} " != *" $package "* ]] || continue
  dpkg -s "$package" >>"$root/var/lib/dpkg/status" 2>/dev/null ||
    fail "$package, which a package depends on, is not here"
  echo >>"$root/var/lib/dpkg/status"
  for list in "$package" "$package:$(dpkg --print-architecture)"; do
    : >"$root/var/lib/dpkg/info/$list.list"
  done
done
# Images of containers are told to leave documents out.
install_packages() {
  dpkg --root="$root" --path-include='*' --force-not-root --force-script-chrootless --log=/dev/null "$@" \
    >"$work/log" 2>&1
}
# Nobody gets the command without its library.
install_packages -i xquery_*.deb && fail "the command installs without its library"
grep -q 'depends on libxquery0' "$work/log" || fail "$(cat "$work/log")"
install_packages -i ./*.deb || fail "$(cat "$work/log")"
for package in "${names[@]}"; do
  same "the state of $package" "install ok installed" \
    "$(dpkg-query --admindir="$root/var/lib/dpkg" -W -f '${Status}' "$package")"
done

# --- using them ----------------------------------------------------------------------------------

usr=$root/usr
books=$usr/share/doc/xquery/examples/books.xml
LD_LIBRARY_PATH=$(dirname "$(find "$usr/lib" -name libxquery.so.0)")
export LD_LIBRARY_PATH
titles=$'A Field Guide to Lichens\nBrücken & Wege'

same "the command" "$titles" "$("$usr/bin/xquery" --as text -e '//book[price > 10]/title' "$books")"
same "a piece" "$work/parts/part-00000001.xml" \
  "$("$usr/bin/xquery" --split '/*/book' --records 100 "$books" "$work/parts")"

# Each example is compiled once, by one of the two ways.
mkdir "$work/src"
cp "$usr/share/doc/libxquery-dev/examples/embed.cpp" "$work/src/"
cp "$source_dir/tests/install/consumer.cmake" "$work/src/CMakeLists.txt"
cmake -S "$work/src" -B "$work/build" -G Ninja -DCMAKE_PREFIX_PATH="$usr" >/dev/null
cmake --build "$work/build" >"$work/log" || fail "$(cat "$work/log")"
same "the C++ example" "$titles" "$("$work/build/embed" "$books")"

PKG_CONFIG_PATH=$(dirname "$(find "$usr" -name xquery.pc)")
export PKG_CONFIG_PATH
# The flags are a list of words.
# shellcheck disable=SC2046
gcc -std=c99 "$usr/share/doc/libxquery-dev/examples/embed.c" -o "$work/embed" \
  $(pkg-config --cflags --libs xquery)
same "the C example" "$titles" "$("$work/embed" "$books")"

if [[ " ${names[*]} " == *" python3-xquery "* ]]; then
  module=$(PYTHONPATH=$usr/lib/python3/dist-packages /usr/bin/python3 -c '
import sys, xquery
print(xquery.__file__)
print(*(title.text for title in xquery.query("//book[price > 10]/title", sys.argv[1])), sep="\n")
' "$books")
  same "the Python module" "$usr/lib/python3/dist-packages/xquery/__init__.py"$'\n'"$titles" "$module"
fi

# --- and back ------------------------------------------------------------------------------------

install_packages --purge "${names[@]}" || fail "$(cat "$work/log")"
same "what is left" "" "$(find "$root" -path "$usr/*" -type f)"
