#!/bin/bash
# bench/projection.sh [MEGABYTES [BUILD]]: questions that need little of a document, from file to
# answer, beside the same with the whole tree of it.
#
# Of each question: processor time and peak memory beyond those of a command that reads nothing, and
# what they are of reading the whole document and asking it. Both sides run in turn, the least of
# several counts. The budgets are 0.50 and 0.15.
set -eu
export XQUERY_PLAN=1

megabytes=${1:-10}
build=${2:-build/release}
rounds=15
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

factor=$(awk -v megabytes="$megabytes" 'BEGIN { print megabytes / 110 }')
for data in auction bibliography business; do
  "$build/xquery_$data" "$factor" > "$folder/$data.xml"
done

# once SIDE ARGUMENT...: adds "user system kilobytes" to the side's list.
once() {
  local side=$1 seconds
  shift
  TIMEFORMAT='%3U %3S'
  seconds=$( { time "$build/xquery" "$@" > "$folder/out.$side"; } 2>&1 )
  echo "$seconds $(/usr/bin/time -f %M "$build/xquery" "$@" 2>&1 > "$folder/out.$side")" \
    >> "$folder/times.$side"
}

# The least of each column: seconds and kilobytes.
least() {
  awk 'NR == 1 || $1 + $2 < seconds { seconds = $1 + $2 }
       NR == 1 || $3 < kilobytes { kilobytes = $3 }
       END { print seconds, kilobytes }' "$folder/times.$1"
}

ask() {
  local data=$1 query=$2 round
  rm -f "$folder"/times.*
  for round in $(seq $rounds); do
    once none -e 1
    once part -e "$query" "$folder/$data.xml"
    # A step upwards, which finds nothing, has the whole tree made; the plan stays the same.
    once whole -e "if (/..) then () else ($query)" "$folder/$data.xml"
  done
  cmp -s "$folder/out.part" "$folder/out.whole" || echo "not the same: $query"
  echo "$(least none) $(least part) $(least whole)" | awk -v query="$query" -v data="$data" '{
    time = ($3 - $1) / ($5 - $1)
    memory = ($4 - $2) / ($6 - $2)
    printf "%-13s %-52s %6.1f ms  time %4.2f  %7.1f MiB  memory %4.2f\n", data,
      substr(query, 1, 52), ($3 - $1) * 1000, time, ($4 - $2) / 1024, memory
  }'
}

ask auction 'count(//item)'
ask auction '//person[@id = "person0"]/name'
ask auction 'sum(//closed_auction/price)'
ask auction 'for $p in /site/people/person where $p/profile/age > 50 return $p/name/string()'
ask auction 'max(for $d in /site/closed_auctions/closed_auction/date return string($d))'
ask auction 'exists(//x)'
ask bibliography 'count(/bibliography/people/person[country = "Kenya"])'
ask bibliography 'min(/bibliography/people/person/born)'
ask business 'count(//*:employee)'
ask business 'avg(//*:employee/@salary)'
