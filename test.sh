#!/usr/bin/env bash
# Installs what is missing, builds, and runs every test. XQUERY_PRESET chooses another build
# (release, debug, asan, tsan); XQUERY_WERROR=ON turns warnings into errors. XQUERY_TESTS_OF may name
# the folder of a complete build without sanitizers, whose compiled tests are then used as they are.
set -u
. "$(dirname "${BASH_SOURCE[0]}")/cmake/prepare.sh"

preset=${XQUERY_PRESET:-release}
# That build has the fuzz targets, which are clang's.
[ "$preset" = asan ] && packages+=(clang libclang-rt-dev)
need_packages "${packages[@]}" || exit 1
(build "$preset" -DXQUERY_WERROR="${XQUERY_WERROR:-OFF}" \
  -DXQUERY_TESTS_OF="${XQUERY_TESTS_OF:-}") || exit 1

log=$(mktemp)
trap 'rm -f "$log"' EXIT
(cd "$top" && ctest --preset "$preset" -j "$jobs" --no-tests=error "$@") | tee "$log"
status=${PIPESTATUS[0]}
grep -E 'tests? failed out of' "$log"
# The closing lines of the tests that pytest ran.
grep -hE '^[0-9]+ (passed|failed|skipped|errors?).* in [0-9.]+s' \
  "$top/build/$preset/Testing/Temporary/LastTest.log" 2>/dev/null
exit "$status"
