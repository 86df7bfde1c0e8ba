#!/bin/sh
# kernel_types_test.sh source_folder: a kernel compiles under its slot's shape and element type, and under no other.
# CXX: the compiler.
set -eu

source=$1
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0

# compiles name shape type: whether a definition of this kernel does, without any warning turned into an error.
compiles() {
  {
    echo '#include "blas/kernels/kernel.h"'
    echo 'namespace qtb::QTB_TIER {'
    echo "namespace { template <class T> QTB_FUNCTION($2, T, body) {} }"
    echo "QTB_KERNEL($1, $2, $3, body<$3>)"
    echo '}'
  } > "$folder/kernel.cpp"
  "$CXX" -std=c++20 -fsyntax-only -w -I "$source" -DQTB_TIER=def "$folder/kernel.cpp" 2> "$folder/errors"
}

expect() {
  expected=$1
  shift
  if compiles "$@"; then found=compiles; else found=fails; fi
  if [ "$found" = fails ] && ! grep -q conflicting "$folder/errors"; then
    found=$(cat "$folder/errors")
  fi
  [ "$found" = "$expected" ] && return 0
  echo "$*: $found, not $expected"
  failures=$((failures + 1))
}

expect compiles saxpy axpy float
expect compiles dsyr_block syr_block double
expect compiles unlisted axpy double
expect fails saxpy axpy double
expect fails saxpy copy float
expect fails cher syr cfloat
expect fails dsyr_block syr2_block double

echo "7 kernels, $failures wrong"
[ "$failures" -eq 0 ]
