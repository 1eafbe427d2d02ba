#!/usr/bin/env bash
# exported.sh LIBRARY [--write]: compares what the library exports with exported.txt beside this
# script, and with --write makes that file anew.
#
# Listed are the functions of the C interface and, demangled, what the C++ classes define in the
# library. What the compiler emits wherever it is used (inline functions, templates, tables of
# classes without a home) differs between compilers and options and is nobody's promise. A line
# that goes or changes breaks programs that are already built: see CONTRIBUTING.md.
set -euo pipefail
library=$1
list=$(dirname "$0")/exported.txt

exported() {
  nm -D --defined-only --demangle "$library" |
    sed -nE 's/^[0-9a-f]+ [TDBR] //p' | sed -E 's/@@.*//; s/\[abi:[a-z0-9]+\]//g' |
    LC_ALL=C sort -u
}

if [ "${2-}" = --write ]; then
  exported >"$list"
  exit
fi
# What is in one of the two alone.
if ! difference=$(diff <(exported) "$list"); then
  echo "the library exports what is marked <, and $list has what is marked > instead:" >&2
  echo "$difference" >&2
  exit 1
fi
echo "$(wc -l <"$list") names, as listed"
