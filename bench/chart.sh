#!/bin/sh
# chart.sh RESULTS: draws the rates of the square products in RESULTS/square-<tier>.csv over their size, as SVG and PNG
# beside them.
#
#   square-<tier>   this library and the peer on one tier, a panel per type
#   square-tiers    this library on every tier, a panel per type
#
# The grey lines are the arithmetic peak of a core in GFLOP/s, with vectors of the size that the tier's kernel has, as
# compare measured it in the run. A peer may have wider vectors.
set -eu
results=$1
order='def sse3 ssse3 sse42 avx'

tiers=
for tier in $order; do
  [ ! -s "$results/square-$tier.csv" ] || tiers="$tiers $tier"
done
[ -n "$tiers" ] || { echo "chart.sh: no square-<tier>.csv in $results" >&2; exit 1; }

# Rows of one routine as "n rate peer_rate limit", by the names of the file's columns.
rows() { # file routine
  awk -F, -v routine="$2" '
    NR == 1 { for (i = 1; i <= NF; i++) column[$i] = i; next }
    $column["routine"] == routine && $column["options"] == "NN" && $column["outcome"] == "measured" {
      print $column["n"], $column["rate"], $column["peer_rate"], $column["limit"]
    }' "$1" | sort -n
}

scratch=$(mktemp -d)
trap 'rm -rf "$scratch"' EXIT
for tier in $tiers; do
  for routine in sgemm dgemm cgemm zgemm; do
    rows "$results/square-$tier.csv" $routine > "$scratch/$tier-$routine"
  done
done

# A little room on both sides of the sizes that were measured.
range=$(cat "$scratch"/* | sort -n | awk 'NR == 1 { first = $1 } END { print "[" first / 1.3 ":" $1 * 1.3 "]" }')

# The level of a file's limit lines: the median, since each run measures it anew.
limit() { sort -n -k 4 "$1" | awk '{ limit[NR] = $4 } END { if (NR) print limit[int((NR + 1) / 2)]; else print 0 }'; }

# The top of a panel: some room above all lines of these files.
top() { awk '{ for (i = 2; i <= 4; i++) if ($i > top) top = $i } END { print top * 1.12 }' "$@"; }

# draw name title panel: both files of one picture; panel routine prints its plot command.
draw() {
  for form in svg png; do
    {
      case $form in
        svg) echo "set terminal svg size 1000,760 enhanced font 'Helvetica,13' background rgb 'white'" ;;
        png) echo "set terminal pngcairo size 1500,1140 enhanced font 'Helvetica,13' fontscale 1.15 linewidth 1.5" ;;
      esac
      cat << END
set output '$results/$1.$form'
set multiplot layout 2,2 title "{/:Bold $2}" font ',15'
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
      for routine in sgemm dgemm cgemm zgemm; do "$3" $routine; done
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

colour() {
  case $1 in
    def) echo '#666666' ;;
    sse3) echo '#0072b2' ;;
    ssse3) echo '#009e73' ;;
    sse42) echo '#e69f00' ;;
    avx) echo '#d55e00' ;;
  esac
}

pair_panel() {
  file=$scratch/$tier-$1
  [ -s "$file" ] || return 0
  height=$(limit "$file")
  peak 1 "$height" ''
  echo "set title '$1'"
  echo "set yrange [0:$(top "$file")]"
  printf "plot '%s' using 1:2 with linespoints lw 2 pt 7 ps 0.6 lc rgb '#0072b2' title 'this library'" "$file"
  if awk '$3 > 0 { found = 1 } END { exit !found }' "$file"; then
    printf ", '%s' using 1:3 with linespoints lw 2 pt 5 ps 0.5 dt 2 lc rgb '#d55e00' title 'peer'" "$file"
  fi
  echo
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
  draw "square-$tier" "C := A B, n by n, tier $tier, one thread" pair_panel
done
draw square-tiers 'C := A B, n by n, every tier, one thread' tiers_panel
