#!/bin/sh
# least_squares_test.sh program data: the certified coefficients come out, and bad input gets a message and a nonzero
# status.
set -eu

program=$1
data=$2/longley.csv
certified=$2/longley-certified.csv
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0

# expect case status text data certified: the program returns this status and prints this text.
expect() {
  if output=$("$program" "$4" "$5" 2>&1); then status=0; else status=$?; fi
  result=ok
  [ "$status" -eq "$2" ] || result="status $status: $output"
  case $output in
    *"$3"*) ;;
    *) result="output: $output" ;;
  esac
  echo "$1: $result"
  [ "$result" = ok ] || failures=$((failures + 1))
}

# variant name: a file of that name, from what comes in.
variant() {
  cat > "$folder/$1"
  echo "$folder/$1"
}

expect "certified data" 0 "with 9 degrees of freedom" "$data" "$certified"
expect "missing data" 2 "absent.csv: No such file" "$folder/absent.csv" "$certified"
expect "missing certificate" 2 "absent.csv: No such file" "$data" "$folder/absent.csv"
expect "folder for a file" 2 "Is a directory" "$folder" "$certified"
expect "empty file" 2 "empty.csv: no data" "$(variant empty.csv < /dev/null)" "$certified"
expect "comments alone" 2 "comments.csv: no data" "$(sed -n '/^#/p' "$data" | variant comments.csv)" "$certified"
expect "names alone" 2 "names.csv: no data" "$(sed -n '/^employed/p' "$data" | variant names.csv)" "$certified"
expect "bad number" 2 'number.csv:5: "8x" in column deflator is not a finite number' \
  "$(sed '5s/,[^,]*/,8x/' "$data" | variant number.csv)" "$certified"
expect "no number" 2 'none.csv:5: "" in column deflator' "$(sed '5s/,[^,]*/,/' "$data" | variant none.csv)" "$certified"
expect "infinite number" 2 '"inf" in column deflator' "$(sed '5s/,[^,]*/,inf/' "$data" | variant inf.csv)" "$certified"
expect "number out of range" 2 '"1e999" in column deflator' \
  "$(sed '5s/,[^,]*/,1e999/' "$data" | variant range.csv)" "$certified"
expect "one value too many" 2 "many.csv:6: 8 values, but the table has 7 columns" \
  "$(sed '6s/$/,1/' "$data" | variant many.csv)" "$certified"
expect "one value too few" 2 "few.csv:6: 6 values, but the table has 7 columns" \
  "$(sed '6s/,[^,]*//' "$data" | variant few.csv)" "$certified"
expect "as many rows as coefficients" 2 "7 rows are too few for 7 coefficients" \
  "$(sed '11,$d' "$data" | variant short.csv)" "$certified"
expect "one column" 2 "at least one to fit it by" "$(cut -d, -f1 "$data" | variant column.csv)" "$certified"
expect "equal columns" 2 "linearly dependent" \
  "$(printf 'y,a,b\n1,0,0\n2,0,0\n3,1,0\n4,0,0\n5,1,0\n' | variant equal.csv)" \
  "$(printf 'term,coefficient\nintercept,1\na,1\nb,1\n' | variant equal-certified.csv)"
expect "certificate of another shape" 2 "the certified table has 3 columns" "$data" \
  "$(sed '/^[^#]/s/$/,1/' "$certified" | variant wide.csv)"
expect "a coefficient without certificate" 2 "no certified coefficient of gnp" "$data" \
  "$(sed '/^gnp/d' "$certified" | variant part.csv)"
expect "a wrong coefficient" 1 "fewer than 9 digits agree" "$data" \
  "$(sed 's/^year,1829.1514/year,1829.1524/' "$certified" | variant wrong.csv)"
expect "line ends with carriage returns" 0 "with 9 degrees of freedom" \
  "$(sed 's/$/\r/' "$data" | variant returns.csv)" "$certified"

if output=$("$program" 2>&1); then status=0; else status=$?; fi
case "$status $output" in
  "2 usage: "*) echo "no arguments: ok" ;;
  *)
    echo "no arguments: status $status: $output"
    failures=$((failures + 1))
    ;;
esac

[ $failures -eq 0 ]
