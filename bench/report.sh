#!/usr/bin/env bash
# bench/report.sh [--quick] [SECTION...]: measures the engine beside the peers that are installed and
# writes docs/performance.md, its plots, and the table of the README.
#
# Every row is a ratio of two times, or two sizes, taken in turn in one run, so that the page can be
# made on any machine; nothing else should run on it meanwhile. With SECTIONs only these are measured
# again, the others stay as they were last measured (build/report keeps the figures). --quick takes
# documents of a hundredth of the size, to see that everything works, and writes below build/report.
set -eu
. "$(dirname "${BASH_SOURCE[0]}")/../cmake/prepare.sh"

need_packages "${packages[@]}" python3 python3-matplotlib python3-lxml
build release -- xquery-command xquery_bench xquery_auction xquery_bibliography xquery_business
exec /usr/bin/python3 "$top/bench/report" --top "$top" "$@"
