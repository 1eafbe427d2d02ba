#!/usr/bin/env bash
# run.sh MINUTES [TARGET...]: builds fuzz targets into build/asan and runs one after another, those
# named or all, each for so many minutes (fractions are allowed). XQUERY_FUZZ_JOBS says how many
# of them run at a time, one unless given. What makes one fail is kept under
# build/fuzz/found/TARGET, what it has learnt under build/fuzz/corpus/TARGET for the next run;
# XQUERY_FUZZ_CORPUS names another folder for that. XQUERY_FUZZ_SEED is the number that the choices
# begin with, another one in each run unless given: the same number goes the same way. The status is 1 when something was found: mend it,
# and keep its smallest form as a seed.
set -u
. "$(dirname "${BASH_SOURCE[0]}")/../cmake/prepare.sh"

minutes=${1:?usage: run.sh MINUTES [TARGET...]}
shift
need_packages "${packages[@]}" clang libclang-rt-dev || exit 1

cd "$top/fuzz" || exit 1
targets=("$@")
[ ${#targets[@]} -gt 0 ] || targets=(*.cpp)
targets=("${targets[@]%.cpp}")
(build asan -- "${targets[@]/#/fuzz_}") || exit 1
seconds=$(awk -v minutes="$minutes" 'BEGIN { all = int(minutes * 60); print (all > 1 ? all : 1) }')
out=$top/build/fuzz
results=$(mktemp -d)
trap 'rm -rf "$results"' EXIT

# run_target TARGET: leaves a file in the folder of results when it finds something.
run_target() {
  local target=$1
  local found=$out/found/$target corpus=${XQUERY_FUZZ_CORPUS:-$out/corpus}/$target
  local log=$out/$target.log
  mkdir -p "$found" "$corpus" "seeds/$target"
  local options=(-max_total_time="$seconds" -timeout=30 -rss_limit_mb=3000 -print_final_stats=1
    -seed="${XQUERY_FUZZ_SEED:-0}" -artifact_prefix="$found/")
  [ -f "dictionaries/$target.txt" ] && options+=(-dict="dictionaries/$target.txt")
  if "$top/build/asan/fuzz_$target" "${options[@]}" "$corpus" "seeds/$target" >"$log" 2>&1; then
    echo "== $target, for $seconds s: $(awk '/number_of_executed_units/ { print $2 }' "$log") inputs"
  else
    echo "== $target, for $seconds s: found something"
    tail -40 "$log"
    touch "$results/$target"
  fi
}

for target in "${targets[@]}"; do
  while [ "$(jobs -rp | wc -l)" -ge "${XQUERY_FUZZ_JOBS:-1}" ]; do wait -n; done
  run_target "$target" &
done
wait

failed=$(ls "$results")
[ -z "$failed" ] && exit 0
for target in $failed; do
  echo "$target failed; what it failed on is in $out/found/$target"
done
exit 1
