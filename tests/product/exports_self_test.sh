#!/bin/sh
# exports_self_test.sh routines.def: shows that exports_test.sh passes a library of the right names and finds each kind
# of flaw, on small libraries that have nothing but names.
set -eu

check=$(dirname "$0")/exports_test.sh
routines=$1
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0

{
  echo 'void QTBGetVersionString(void) {}'
  { sed -n 's/^QTB_ROUTINE(\([a-z0-9]*\),.*/\1/p' "$routines" && printf 'lsame\nxerbla\n'; } | while read -r name; do
    upper=$(printf '%s' "$name" | tr '[:lower:]' '[:upper:]')
    echo "void $name(void) {} void $upper(void) __attribute__((alias(\"$name\")));"
  done
} > "$folder/clean.c"

# expect name finding flags: the check of <name>.c, compiled with these flags, finds this; nothing says that it passes.
expect() {
  # shellcheck disable=SC2086 # a list of flags
  "${CC:-cc}" -shared -fPIC -w "$folder/$1.c" $3 -o "$folder/$1.so"
  if output=$("$check" "$folder/$1.so" "$routines"); then found=; else found=$output; fi
  case $found in
    "") [ -z "$2" ] && result=ok || result="passed" ;;
    *"$2"*) [ -n "$2" ] && result=ok || result="rejected: $found" ;;
    *) result="other finding: $found" ;;
  esac
  echo "$1: $result"
  [ "$result" = ok ] || failures=$((failures + 1))
}

name='-Wl,-soname,libqtb.so.10'
expect clean "" "$name"

sed 's/DAXPY/DAXPYX/' "$folder/clean.c" > "$folder/missing.c"
expect missing "not exported: DAXPY" "$name"

{ cat "$folder/clean.c" && echo 'int qtb_serv_cell;'; } > "$folder/more.c"
expect more "not in the list: qtb_serv_cell" "$name"

sed 's/void DGEMM(void) __attribute__((alias("dgemm")))/int other; void DGEMM(void) { other = 1; }/
     s/int other;/static int other;/' "$folder/clean.c" > "$folder/two.c"
expect two "another routine in upper case: dgemm" "$name"

cp "$folder/clean.c" "$folder/nameless.c"
expect nameless "SONAME" ""
cp "$folder/clean.c" "$folder/folder.c"
expect folder "RPATH" "$name -Wl,-rpath,/tmp"
cp "$folder/clean.c" "$folder/stack.c"
expect stack "GNU_STACK" "$name -Wl,-z,execstack"

[ "$failures" -eq 0 ]
