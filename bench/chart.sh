#!/bin/sh
# chart.sh RESULTS: draws rates over sizes, as SVG and PNG beside the tables in RESULTS.
#
#   square-<tier>   square products of this library and the peer on one tier, a panel per type
#   square-tiers    those of this library on every tier, a panel per type
#   level2-<tier>   routines of Level 2 of this library and the peer on one tier, in double precision
#
# The grey lines of the products are the arithmetic peak of a core in GFLOP/s, with vectors of the size that the tier's
# kernel has, as compare measured it in the run. A peer may have wider vectors. The grey curves of Level 2 are what the
# caches and the memory allow.
set -eu
results=$1

order=$(cut -d ' ' -f 2 "$results/tiers.txt")

# tiers_of KIND: the tiers of which there is a <kind>-<tier>.csv, in their order.
tiers_of() {
  for tier in $order; do
    [ ! -s "$results/$1-$tier.csv" ] || echo "$tier"
  done
}
tiers=$(tiers_of square)

# Rows of one routine as "n rate peer_rate limit", by the names of the file's columns.
rows() { # file routine options
  routine=$2 options=$3
  awk -F, -v routine="$routine" -v options="$options" '
    FNR == 1 { for (i = 1; i <= NF; i++) column[$i] = i; next }
    $column["routine"] == routine && $column["options"] == options && $column["outcome"] == "measured" &&
    $column["peer"] <= 1 && ($column["increment"] == "" || $column["increment"] == 1) {
      print $column["n"], $column["rate"], $column["peer_rate"], $column["limit"]
    }' "$1" | sort -n
}

scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
for tier in $tiers; do
  for routine in sgemm dgemm cgemm zgemm; do
    rows "$results/square-$tier.csv" $routine NN > "$scratch/$tier-$routine"
  done
done

# A little room on both sides of the sizes in these files.
range_of() {
  cat "$@" | sort -n | awk 'NR == 1 { first = $1 } END { print "[" first / 1.3 ":" $1 * 1.3 "]" }'
}

# The level of a file's limit lines: the median, since each run measures it anew.
limit() { sort -n -k 4 "$1" | awk '{ limit[NR] = $4 } END { if (NR) print limit[int((NR + 1) / 2)]; else print 0 }'; }

# The top of a panel: some room above all lines of these files.
top() { awk '{ for (i = 2; i <= 4; i++) if ($i > top) top = $i } END { print top * 1.12 }' "$@"; }

# draw name title panel range what...: both files of one picture; panel prints the plot command of each of four.
draw() {
  name=$1 title=$2 panel=$3 range=$4
  shift 4
  for form in svg png; do
    {
      case $form in
        svg) echo "set terminal svg size 1000,760 enhanced font 'Helvetica,13' background rgb 'white'" ;;
        png) echo "set terminal pngcairo size 1500,1140 enhanced font 'Helvetica,13' fontscale 1.15 linewidth 1.5" ;;
      esac
      cat << END
set output '$results/$name.$form'
set multiplot layout 2,2 title "{/:Bold $title}" font ',15'
set logscale x
set xrange $range
set xtics (4, 8, 16, 32, 64, 125, 250, 500, 1000, 2000, 4000) nomirror out
set ytics nomirror out
set border 3 lc rgb '#555555'
set grid y lc rgb '#dddddd' lt 1
set xlabel 'order n' offset 0, 0.3
set ylabel 'GFLOP/s'
set key below horizontal center samplen 2 reverse Left width 1
set lmargin 9
set bmargin 5.5
END
      for what in "$@"; do "$panel" "$what"; done
    } | gnuplot
  done
}

# The horizontal line of a peak, named above its left end.
peak() { # number height label
  cat << END
set arrow $1 from graph 0, first $2 to graph 1, first $2 nohead lc rgb '#888888' lw 1.5 dt (8, 4)
set label $1 sprintf('peak %.0f$3', $2) at graph 0.02, first $2 offset 0, 0.6 font ',11' tc rgb '#666666'
END
}

# Colours that stay apart for every eye, in the order of the tiers.
colour() {
  set -- "$1" '#666666' '#0072b2' '#009e73' '#e69f00' '#d55e00' '#cc79a7' '#56b4e9' '#000000'
  number=$(echo "$order" | grep -nx "$1" | cut -d : -f 1)
  shift "$(((number - 1) % 8))"
  echo "$2"
}

# plot_pair FILE: the plot command's two curves.
plot_pair() {
  printf "plot '%s' using 1:2 with linespoints lw 2 pt 7 ps 0.6 lc rgb '#0072b2' title 'this library'" "$1"
  if awk '$3 > 0 { found = 1 } END { exit !found }' "$1"; then
    printf ", '%s' using 1:3 with linespoints lw 2 pt 5 ps 0.5 dt 2 lc rgb '#d55e00' title 'peer'" "$1"
  fi
}

pair_panel() { # routine
  file=$scratch/$tier-$1
  [ -s "$file" ] || return 0
  height=$(limit "$file")
  peak 1 "$height" ''
  echo "set title '$1'"
  echo "set yrange [0:$(top "$file")]"
  plot_pair "$file"
  echo
}

level2_panel() { # routine-options
  file=$scratch/$tier-level2-$1
  [ -s "$file" ] || return 0
  echo "set title '$(echo "$1" | tr - ' ')'"
  echo "set yrange [0:$(cut -d ' ' -f 1-3 "$file" | top)]"
  plot_pair "$file"
  printf ", '%s' using 1:4 with lines lw 1.5 dt (8, 4) lc rgb '#888888' title 'limit'\n" "$file"
}

tiers_panel() {
  files=
  for tier in $tiers; do files="$files $scratch/$tier-$1"; done
  # shellcheck disable=SC2086 # a list of names without blanks
  heights=$(for file in $files; do limit "$file"; done | sort -n)
  lowest=$(echo "$heights" | head -n 1)
  highest=$(echo "$heights" | tail -n 1)
  echo "unset arrow; unset label"
  peak 1 "$lowest" ' (16-byte vectors)'
  # What differs by less than that is the same peak, measured twice.
  if awk "BEGIN { exit !($highest > 1.5 * $lowest) }"; then peak 2 "$highest" ' (32-byte vectors)'; fi
  echo "set title '$1'"
  # shellcheck disable=SC2086
  echo "set yrange [0:$(cut -d ' ' -f 1,2,4 $files | top)]"
  separator=plot
  for tier in $tiers; do
    printf "%s '%s' using 1:2 with linespoints lw 2 pt 7 ps 0.6 lc rgb '%s' title '%s'" \
      "$separator" "$scratch/$tier-$1" "$(colour "$tier")" "$tier"
    separator=,
  done
  echo
}

for tier in $tiers; do
  draw "square-$tier" "C := A B, n by n, tier $tier, one thread" pair_panel "$(range_of "$scratch/$tier"-*)" \
    sgemm dgemm cgemm zgemm
done
[ -z "$tiers" ] || draw square-tiers 'C := A B, n by n, every tier, one thread' tiers_panel \
  "$(range_of "$scratch"/*)" sgemm dgemm cgemm zgemm

for tier in $(tiers_of level2); do
  for what in dgemv-N dgemv-T dsymv-U dtrsv-UNN; do
    for kind in level2 level2-large; do
      file=$results/$kind-$tier.csv
      [ ! -s "$file" ] || rows "$file" "${what%-*}" "${what#*-}"
    done | sort -n > "$scratch/$tier-level2-$what"
  done
  draw "level2-$tier" "Level 2, order n, tier $tier, one thread" level2_panel \
    "$(range_of "$scratch/$tier"-level2-*)" dgemv-N dgemv-T dsymv-U dtrsv-UNN
done
