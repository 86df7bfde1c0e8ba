#!/bin/sh
# consumers_test.sh build_folder: installs the library into a folder of its own, moves that, and builds and runs C and
# Fortran programs against each companion: through pkg-config, through the CMake package and through CMake's FindBLAS.
set -eu

build=$1
programs=$(cd "$(dirname "$0")/consumer" && pwd)
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

# expect file text: fails unless the file has a line that is text.
expect() {
  grep -qxF -e "$2" "$1" || { echo "$1 lacks the line \"$2\":" && cat "$1" && exit 1; }
}

cmake --install "$build" --prefix "$folder/first" > "$folder/install.log"
mv "$folder/first" "$folder/moved"
PKG_CONFIG_PATH=$(dirname "$(find "$folder/moved" -name qtb-lp64.pc)")
LD_LIBRARY_PATH=$(pkg-config --variable=companions "$PKG_CONFIG_PATH/qtb-lp64.pc")
export PKG_CONFIG_PATH LD_LIBRARY_PATH
cd "$folder"

# c_program name package flags...
c_program() {
  name=$1 package=$2
  shift 2
  # shellcheck disable=SC2046 # flags are words
  "${CC:-cc}" -std=c11 -Wall -Wextra -pedantic -Werror "$@" "$programs/consumer.c" \
    $(pkg-config --cflags --libs "$package") -o "$name"
  "./$name" > "$name.txt"
  expect "$name.txt" "QTB ERROR: Parameter 9 was incorrect on entry to cblas_dgemm"
  expect "$name.txt" "QTB ERROR: Parameter 3 was incorrect on entry to cblas_dgemm"
  expect "$name.txt" "Illegal TransB setting, 7"
}
c_program c32 qtb-cblas
c_program c64 qtb-ilp64
c_program c64_suffixed qtb-ilp64-suffixed -DUSE_SUFFIX

# f_program name package flags...
f_program() {
  name=$1 package=$2
  shift 2
  # shellcheck disable=SC2046 # flags are words
  "${FC:-gfortran}" "$@" "$programs/consumer.f90" $(pkg-config --libs "$package") -o "$name"
  "./$name" > "$name.txt"
  expect "$name.txt" "QTB ERROR: Parameter 8 was incorrect on entry to DGEMM "
}
f_program f32 qtb-lp64
f_program f64 qtb-ilp64 -fdefault-integer-8

cmake -S "$programs" -B by_cmake -DCMAKE_PREFIX_PATH="$folder/moved" -DCMAKE_C_COMPILER="${CC:-cc}" > cmake.log
grep -q "FindBLAS took .*$folder/moved" cmake.log || { cat cmake.log && exit 1; }
cmake --build by_cmake >> cmake.log
for name in by_package by_package_64 by_find_blas; do
  "by_cmake/$name" > "$name.txt"
  expect "$name.txt" "QTB ERROR: Parameter 9 was incorrect on entry to cblas_dgemm"
done
echo "companions called from C and Fortran, with integers of both widths"
