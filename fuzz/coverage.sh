#!/usr/bin/env bash
# coverage.sh [CORPORA [TARGET...]]: what the inputs of fuzz targets, those named or all, reach, for
# each room of src/ that is linked to one: their seeds, and what they have learnt under CORPORA/TARGET
# (build/fuzz/corpus unless given). Prints a table of lines and branches; the lines that nothing
# reaches are in build/coverage/unreached.txt. The status is 1 when a target fails on an input.
set -u
. "$(dirname "${BASH_SOURCE[0]}")/../cmake/prepare.sh"

corpora=$(realpath -m "${1:-$top/build/fuzz/corpus}")
[ $# -gt 0 ] && shift
need_packages "${packages[@]}" clang libclang-rt-dev llvm || exit 1

cd "$top/fuzz" || exit 1
targets=("$@")
[ ${#targets[@]} -gt 0 ] || targets=(*.cpp)
targets=("${targets[@]%.cpp}")
(build coverage -- "${targets[@]/#/fuzz_}") || exit 1
out=$top/build/coverage
status=0
rm -f "$out"/*.profraw
objects=()
for target in "${targets[@]}"; do
  folders=()
  for folder in "seeds/$target" "$corpora/$target"; do
    [ -d "$folder" ] && folders+=("$folder")
  done
  [ ${#folders[@]} -gt 0 ] || continue
  # Each input once. What fails or hangs on one of them counts for nothing, and is told.
  LLVM_PROFILE_FILE="$out/$target.%p.profraw" \
    "$out/fuzz_$target" -runs=0 -timeout=60 "${folders[@]}" >"$out/$target.log" 2>&1 ||
    { echo "$target failed; see $out/$target.log" >&2; status=1; }
  objects+=(-object "$out/fuzz_$target")
done
llvm-profdata merge -sparse "$out"/*.profraw -o "$out/all.profdata" || exit 1
llvm-cov export -format=lcov "${objects[@]:1}" -instr-profile="$out/all.profdata" "$top/src" \
  >"$out/all.lcov" || exit 1

# A compiler cache makes paths relative to the folder of the build.
awk -v unreached="$out/unreached.txt" '
  function room(file) {
    count = split(file, parts, "/")
    return parts[1] == "Platform" && count > 2 ? parts[1] "/" parts[2] : parts[1]
  }
  BEGIN { FS = "[:,]"; printf "" > unreached }
  $1 == "SF" { file = $2; name = sub(/^.*\/src\//, "", file) ? room(file) : "" }
  name && $1 == "DA" {
    lines[name]++
    if ($3 > 0) reached[name]++
    else print file ":" $2 > unreached
  }
  name && $1 == "BRDA" { branches[name]++; if ($5 != "-" && $5 > 0) taken[name]++ }
  END {
    print "| room | lines | reached | branches | taken |"
    print "|---|---|---|---|---|"
    for (name in lines) {
      printf "| `src/%s/` | %d | %.1f %% | %d | %.1f %% |\n", name, lines[name],
        100 * reached[name] / lines[name], branches[name],
        branches[name] ? 100 * taken[name] / branches[name] : 0 | "sort"
    }
  }' "$out/all.lcov"
exit $status
