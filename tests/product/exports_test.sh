#!/bin/sh
# exports_test.sh library routines.def: the library exports the listed routines, lsame and xerbla in both cases and the
# version query, 355 names, and nothing else; both cases of a name are one address; the library names itself, looks for
# others in no folder of its own, and has no writable code or executable stack.
set -eu

library=$1
routines=$2
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0
finding() {
  echo "$1"
  failures=$((failures + 1))
}

lower=$({ sed -n 's/^QTB_ROUTINE(\([a-z0-9]*\),.*/\1/p' "$routines" && printf 'lsame\nxerbla\n'; } | sort)
upper=$(printf '%s\n' "$lower" | tr '[:lower:]' '[:upper:]')
printf '%s\n' "$lower" "$upper" QTBGetVersionString | LC_ALL=C sort > "$folder/expected"
[ "$(wc -l < "$folder/expected")" -eq 355 ] || finding "the list has $(wc -l < "$folder/expected") names, not 355"

"${NM:-nm}" -D --defined-only "$library" > "$folder/symbols"
awk '{ print $3 }' "$folder/symbols" | LC_ALL=C sort > "$folder/exported"
for name in $(LC_ALL=C comm -23 "$folder/expected" "$folder/exported"); do finding "not exported: $name"; done
for name in $(LC_ALL=C comm -13 "$folder/expected" "$folder/exported"); do finding "not in the list: $name"; done

two_addresses=$(awk '
  { address[$3] = $1 }
  END {
    for (name in address) {
      other = toupper(name)
      if (other != name && other in address && address[other] != address[name]) print name
    }
  }' "$folder/symbols")
for name in $two_addresses; do finding "another routine in upper case: $name"; done

"${READELF:-readelf}" -dlW "$library" > "$folder/headers"
grep -q '(SONAME).*\[libqtb\.so\.10\]' "$folder/headers" || finding "no name of its own: SONAME libqtb.so.10"
if grep -qE '\((RPATH|RUNPATH)\)' "$folder/headers"; then finding "a folder to look for libraries in: RPATH"; fi
if grep -q '(TEXTREL)' "$folder/headers"; then finding "code that is written at load: TEXTREL"; fi
if grep -qE 'GNU_STACK.* RWE ' "$folder/headers"; then finding "an executable stack: GNU_STACK RWE"; fi

echo "$(wc -l < "$folder/exported") exported names, $failures findings"
[ "$failures" -eq 0 ]
