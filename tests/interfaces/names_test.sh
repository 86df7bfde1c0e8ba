#!/bin/sh
# names_test.sh folder: the companions in a folder export what the distribution's libblas.so.3 does, each under its own
# convention, and beside it the positions of smallest magnitudes and the calls of qtb/threads.h alone; no name has a
# version.
set -eu

folder=$1
distribution=/usr/lib/x86_64-linux-gnu/blas/libblas.so.3
if [ ! -e "$distribution" ]; then
  echo "no $distribution to compare with"
  exit 77
fi
work=$(mktemp -d)
trap 'rm -rf "$work"' EXIT
LC_ALL=C
export LC_ALL
failures=0

exported() { "${NM:-nm}" -D --defined-only "$1" | awk '{ print $3 }' | sort; }

exported "$distribution" > "$work/distribution"
# Its own calls, the same in all three.
own='blas_get_num_threads blas_set_num_threads qtb_get_num_threads qtb_get_tier qtb_set_num_threads
  qtb_set_num_threads_local'
# The smallest magnitudes, in all four types, in both faces and as subroutines.
for name in isamin idamin icamin izamin; do printf '%s_\n%ssub_\ncblas_%s\n' $name $name $name; done > "$work/added"
sort "$work/distribution" "$work/added" > "$work/plain"
# name_ is name_64_; cblas_name is cblas_name_64 and cblas_name64_; the two variables end in _64.
sed -e '/^cblas_/{s/$/_64/;p;s/_64$/64_/;b;}' -e 's/_$/_64_/;t' -e 's/$/_64/' "$work/plain" | sort > "$work/suffixed"

# compare library list
compare() {
  exported "$folder/$1" > "$work/exported"
  # shellcheck disable=SC2086 # a list of words
  printf '%s\n' $own | sort - "$2" | diff - "$work/exported" > "$work/difference" && return
  echo "$1: names that it lacks (<) and has beyond (>)"
  cat "$work/difference"
  failures=$((failures + 1))
}
compare libblas.so.3 "$work/plain"
compare libblas64.so.3 "$work/plain"
compare libqtb64.so "$work/suffixed"

for name in libblas.so.3 libblas64.so.3; do
  "${READELF:-readelf}" -dW "$folder/$name" | grep -q "(SONAME).*\[$name\]" || {
    echo "$name does not call itself so"
    failures=$((failures + 1))
  }
done
[ "$failures" -eq 0 ] || exit 1
echo "$(wc -l < "$work/distribution") names of the distribution's library, under three conventions"
