#!/bin/sh
# man_test.sh folder build_folder: the manual pages are read without a warning, are listed where they are installed, and
# tell every option of the programs and no other.
set -eu

folder=$1 tools=$2/tools
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
failures=0
fail() {
  echo "$1"
  failures=$((failures + 1))
}

for page in "$folder"/man/*.[1-9]; do
  name=$(basename "$page")
  groff -ww -man -Tutf8 "$page" > "$work/$name" 2> "$work/warnings"
  man --warnings -l -E UTF-8 -Tutf8 -Z "$page" > /dev/null 2>> "$work/warnings"
  [ ! -s "$work/warnings" ] || fail "$name: $(cat "$work/warnings")"
  for section in NAME DESCRIPTION "SEE ALSO"; do
    grep -q "^\.SH $section\$" "$page" || fail "$name lacks the section $section"
  done
  grep -q "man/$name" "$folder/tools/tools.cmake" || fail "$name is not installed"
done

options() { grep -oE -e '--[a-z]+' | sort -u; }
for program in qtb-info qtb-trace; do
  "$tools/$program" --help | options > "$work/help"
  # A page writes a hyphen that is typed with a backslash.
  sed 's/\\-/-/g' "$folder/man/$program.1" | options > "$work/page"
  diff "$work/help" "$work/page" > "$work/difference" || fail "$program: the help (<) and the page (>)
$(cat "$work/difference")"
done
[ "$failures" -eq 0 ]
