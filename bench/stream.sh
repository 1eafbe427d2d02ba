#!/bin/sh
# bench/stream.sh [MEGABYTES [BUILD]]: queries over a pipe of generated records that is longer than
# memory, beside the reader alone over the same pipe.
#
# Rates are of processor time, so that what makes the pipe does not matter, which takes longer than
# reading it. 20 GB: bench/stream.sh 20000
set -eu

megabytes=${1:-2000}
build=${2:-build/release}
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

# One document of a kind, without its declaration, as often as it takes.
"$build/xquery_auction" 0.25 | sed 1d > "$folder/auction"
"$build/xquery_bibliography" 0.25 | sed 1d > "$folder/bibliography"

records() {
  bytes=$(wc -c < "$folder/$1")
  left=$((megabytes * 1000000 / bytes + 1))
  echo '<all>'
  while [ "$left" -gt 0 ]; do
    cat "$folder/$1"
    left=$((left - 1))
  done
  echo '</all>'
}

# measure DATA LABEL OPTION...: the processor time of the command at the end of the pipe, its peak,
# and how the rate is beside that of the reader alone, which comes first.
measure() {
  data=$1 label=$2
  shift 2
  records "$data" | /usr/bin/time -f '%U %S %M' -o "$folder/time" "$build/xquery" "$@" - \
    > "$folder/out"
  read -r user system kilobytes < "$folder/time"
  awk -v label="$data, $label" -v megabytes="$megabytes" -v seconds="$user" -v more="$system" \
    -v kilobytes="$kilobytes" -v reader="${reader:-0}" -v file="$folder/rate" 'BEGIN {
      rate = megabytes / (seconds + more)
      printf "%-44s %7.0f MB/s", label, rate
      if (reader > 0) printf "  %4.2f of the reader alone", rate / reader
      printf "  peak %.0f MiB\n", kilobytes / 1024
      print rate > file
    }'
  rate=$(cat "$folder/rate")
}

for data in auction bibliography; do
  reader=0
  # No element has this name: all is read and nothing kept or evaluated.
  measure "$data" 'the reader alone' --stream -e 'count(/all/none)'
  reader=$rate
  case $data in
    auction)
      measure "$data" 'count of records' --stream -e 'count(/all/site/people/person)'
      measure "$data" 'records with a condition' --stream \
        -e '/all/site/people/person[profile/@income > 90000]/name/text()'
      measure "$data" 'sum over a FLWOR' --stream \
        -e 'sum(for $a in /all/site/closed_auctions/closed_auction return $a/price)'
      measure "$data" 'new elements' --stream -e 'for $i in /all/site/regions/*/item
        return <item name="{ $i/name }">{ count($i/mailbox/mail) }</item>'
      ;;
    bibliography)
      measure "$data" 'count of records' --stream -e 'count(/all/*/*/author)'
      ;;
  esac
done
