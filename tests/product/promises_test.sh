#!/bin/sh
# promises_test.sh folder build_folder ctest: every test that docs/promises.md names exists, and every row of its tables
# names one.
set -eu

document=$1/docs/promises.md
# A suite runs in shards and once per tier, which stand behind its name and a point.
names=$(cd "$2" && "$3" -N | sed -n 's/^ *Test *#[0-9]*: //p' | sed 's/\..*//' | sort -u)
[ -n "$names" ] || { echo "no tests below $2" && exit 1; }

rows=$(mktemp)
trap 'rm -f "$rows"' EXIT
grep '^|' "$document" | grep -vE '^\|( Promise |-)' > "$rows"

failures=0
named=0
for test in $(sed 's/.*| \(.*\) |$/\1/' "$rows" | tr -d '\140,' | tr ' ' '\n' | sort -u); do
  named=$((named + 1))
  printf '%s\n' "$names" | grep -qx "$test" && continue
  echo "docs/promises.md names $test, which is no test"
  failures=$((failures + 1))
done
while IFS= read -r row; do
  case $row in *'_test` |') continue ;; esac
  echo "no test is named: $row"
  failures=$((failures + 1))
done < "$rows"
[ "$named" -gt 0 ] && [ "$failures" -eq 0 ] || exit 1
echo "$named tests stand behind the promises"
