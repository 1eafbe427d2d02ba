#!/usr/bin/env bash
# Installs what is missing, builds, and runs the xquery command with the arguments given; without
# any, it asks examples/books.xml for the titles of the books that cost more than 10.
set -u
. "$(dirname "${BASH_SOURCE[0]}")/cmake/prepare.sh"

need_packages "${packages[@]}" || exit 3
(build release -- xquery-command) || exit 3
[ $# -gt 0 ] || set -- -e '//book[price > 10]/title' "$top/examples/books.xml"
exec "$top/build/release/xquery" "$@"
