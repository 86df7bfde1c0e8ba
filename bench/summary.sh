#!/bin/sh
# summary.sh RESULTS: the comparisons in RESULTS/*.csv as Markdown tables: a row per routine and case, a column per
# tier, in the order of RESULTS/tiers.txt.
set -eu
cd "$1"
order=$(cut -d ' ' -f 2 tiers.txt | tr '\n' ' ')

# table CELL FILE...: the rows of files named <kind>-<tier>.csv. A cell is "rate" (the rate, its share of the limit, the
# ratio to each peer), "ratio" (that of each kind of file, in the order given, to each peer), "gemv" (of the rows of
# trmv and trsv, the rate over that of gemv with the same transposition, type and order) or "gemm" (of all rows, the
# rate over that of gemm of the same type and sizes).
table() {
  cell=$1
  shift
  awk -F, -v cell="$cell" -v order_of_tiers="$order" '
    function join_cell(key, text) {
      if (key in cells) text = cells[key] " / " text
      cells[key] = text
    }
    BEGIN { is_share = cell == "gemv" || cell == "gemm" }
    FNR == 1 {
      split("", column)
      for (i = 1; i <= NF; i++) column[$i] = i
      tier = FILENAME
      sub(/\.csv$/, "", tier)
      sub(/.*-/, "", tier)
      seen[tier] = 1
      next
    }
    {
      shape = ""
      is_square = 1
      for (i = 1; i <= 3; i++) {
        size = $column[substr("mnk", i, 1)]
        if (size == "") continue
        if (shape != "" && size != last) is_square = 0
        shape = shape (shape == "" ? "" : " x ") size
        last = size
      }
      if (is_square) shape = last
      if ($column["band"] != "") shape = shape ", band " $column["band"]
      if ($column["increment"] != "" && $column["increment"] != 1) shape = shape ", increment " $column["increment"]
      row = $column["routine"] " | " $column["options"] " | " shape
      ratio = $column["ratio"] > 0 ? sprintf("%.2f", $column["ratio"]) : "-"
      outcome = $column["outcome"]
      if (is_share) {
        if ($column["peer"] > 1) next
        type = substr($column["routine"], 1, 1)
        trans = cell == "gemv" ? $column["options"] : "any"
        if ($column["routine"] ~ "^." cell "$") { whole[tier, type, trans, shape] = $column["rate"]; next }
        if (cell == "gemv" && $column["routine"] !~ /^.tr[ms]v$/) next
        if (cell == "gemv") trans = substr(trans, 2, 1)
        as_whole[++shares] = tier SUBSEP type SUBSEP trans SUBSEP shape
        rate[shares] = $column["rate"]
        row_of[shares] = row
        text = ""
      }
      else if (outcome != "measured") text = outcome
      else if (cell == "ratio" || $column["peer"] > 1) text = ratio
      else text = sprintf("%.1f / %.0f%% / %s", $column["rate"], 100 * $column["share"], ratio)
      if (!(row in known)) { known[row] = 1; rows[++count] = row }
      if (!is_share) join_cell(row SUBSEP tier, text)
    }
    END {
      for (i = 1; i <= shares; i++) {
        split(as_whole[i], part, SUBSEP)
        if (whole[as_whole[i]] > 0) cells[row_of[i], part[1]] = sprintf("%.2f", rate[i] / whole[as_whole[i]])
      }
      tiers = split(order_of_tiers, order, " ")
      head = "| Routine | Options | Case |"
      line = "|---|---|---|"
      for (t = 1; t <= tiers; t++) if (order[t] in seen) { head = head " " order[t] " |"; line = line "---|" }
      print head
      print line
      for (r = 1; r <= count; r++) {
        text = "| " rows[r] " |"
        for (t = 1; t <= tiers; t++)
          if (order[t] in seen) text = text " " ((rows[r], order[t]) in cells ? cells[rows[r], order[t]] : "-") " |"
        print text
      }
    }' "$@"
}

# section TITLE TEXT CELL KIND...: a heading and a table, where there are files of the first kind.
section() {
  title=$1 text=$2 cell=$3
  ls "$4"-*.csv > /dev/null 2>&1 || return 0
  shift 3
  files=
  for kind in "$@"; do
    for tier in $order; do
      [ ! -s "$kind-$tier.csv" ] || files="$files $kind-$tier.csv"
    done
  done
  printf '## %s\n\n%s\n\n' "$title" "$text"
  # shellcheck disable=SC2086 # a list of names without blanks
  table "$cell" $files
  echo
}

section 'Matrix products, one thread' \
  'GFLOP/s / share of the arithmetic peak / ratio to the peer (above 1: this library is faster)' \
  rate square oblong options
section 'Matrix products with one short side, one thread' \
  'GFLOP/s / share of the arithmetic peak / ratio to the peer' \
  rate flat
section 'Matrix products, one thread, by the kernels that this processor does not take' \
  'GFLOP/s / share of the arithmetic peak / ratio to the peer' \
  rate families
section 'Matrix products, all threads' \
  'Ratio to this library on one thread / ratio to the peer on all threads' \
  ratio threads-serial threads-peer
section 'Level 3 beside gemm, one thread' \
  'GFLOP/s / share of the arithmetic peak / ratio to the peer' \
  rate level3 level3-flat
section 'Level 3 beside gemm, one thread, over matrix products' \
  'Rate over that of gemm of the same type and sizes, in the same run' \
  gemm level3
section 'Level 3 beside gemm, all threads' \
  'Ratio to this library on one thread / ratio to the peer on all threads' \
  ratio level3-threads-serial level3-threads-peer
section 'Level 2, one thread' \
  'GFLOP/s / share of what caches, memory and arithmetic allow / ratio to the peer' \
  rate level2 level2-large level2-increments level2-options
section 'Level 2, one thread, leading dimensions one beyond the rows' \
  'GFLOP/s / share of what caches, memory and arithmetic allow / ratio to the peer' \
  rate level2-odd
section 'Level 2, triangular matrices beside general ones, one thread' \
  'Rate over that of gemv of the same order and transposition, in the same run' \
  gemv level2 level2-large level2-options
section 'Level 2, all threads' \
  'Ratio to this library on one thread / ratio to the peer on all threads' \
  ratio level2-threads-serial level2-threads-peer
section 'Level 1, one thread' \
  'GFLOP/s, or GB/s where nothing is computed / share of what a core allows in cache / ratio to the peer' \
  rate vectors
