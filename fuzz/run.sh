#!/usr/bin/env bash
# run.sh MINUTES [TARGET...]: builds the fuzz targets, all unless some are named, into build/fuzz and
# runs one after another, each for its share of the time (fractions are allowed). What makes one fail
# is kept under build/fuzz/found/TARGET, what it has learnt under build/fuzz/corpus/TARGET for the
# next run. The status is 1 when something was found: mend it, and keep its smallest form as a seed.
set -u
. "$(dirname "${BASH_SOURCE[0]}")/../cmake/prepare.sh"

minutes=${1:?usage: run.sh MINUTES [TARGET...]}
shift
need_packages "${packages[@]}" clang libclang-rt-dev || exit 1

cd "$top/fuzz" || exit 1
targets=(*.cpp)
targets=("${targets[@]%.cpp}")
[ $# -gt 0 ] && targets=("$@")
(build fuzz -DXQUERY_WERROR="${XQUERY_WERROR:-OFF}" -- "${targets[@]/#/fuzz_}") || exit 1
seconds=$(awk -v minutes="$minutes" -v count="${#targets[@]}" \
  'BEGIN { share = int(minutes * 60 / count); print (share > 1 ? share : 1) }')
status=0
for target in "${targets[@]}"; do
  out=$top/build/fuzz
  found=$out/found/$target
  corpus=$out/corpus/$target
  mkdir -p "$found" "$corpus"
  options=(-max_total_time="$seconds" -timeout=20 -rss_limit_mb=2048 -artifact_prefix="$found/"
    -print_final_stats=1)
  [ -f "dictionaries/$target.txt" ] && options+=(-dict="dictionaries/$target.txt")
  echo "== $target, for $seconds s"
  log=$out/$target.log
  if "$out/fuzz_$target" "${options[@]}" "$corpus" "seeds/$target" >"$log" 2>&1; then
    grep -E 'stat::number_of_executed_units' "$log"
  else
    tail -40 "$log"
    echo "$target failed; what it failed on is in $found"
    status=1
  fi
done
exit $status
