#!/bin/sh
# install_test.sh build_folder: installs the library into a folder of its own and moves that, then builds and runs
# programs outside the tree against it: C through pkg-config, C++ through find_package, Fortran through pkg-config.
set -eu

build=$1
programs=$(cd "$(dirname "$0")/install" && pwd)
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT

# expect file text: fails unless the file has a line that is text.
expect() {
  grep -qxF -e "$2" "$1" || { echo "$1 lacks the line \"$2\":" && cat "$1" && exit 1; }
}

cmake --install "$build" --prefix "$folder/first" > "$folder/install.log"
mv "$folder/first" "$folder/moved"
config=$(find "$folder/moved" -name qtb.pc)
PKG_CONFIG_PATH=$(dirname "$config")
LD_LIBRARY_PATH=$(dirname "$PKG_CONFIG_PATH")
export PKG_CONFIG_PATH LD_LIBRARY_PATH

cd "$folder"
# shellcheck disable=SC2046 # flags are words
"${CC:-cc}" -std=c11 -Wall -Wextra -pedantic -Werror "$programs/consumer.c" $(pkg-config --cflags --libs qtb) \
  -o consumer_c
./consumer_c > c.txt
expect c.txt "QTB ERROR: Parameter 8 was incorrect on entry to DGEMM "
grep -q 'Version 10\.2\.2 Product' c.txt

# shellcheck disable=SC2046 # flags are words
"${FC:-gfortran}" -fno-underscoring -fdefault-integer-8 "$programs/consumer.f90" $(pkg-config --libs qtb) \
  -o consumer_f
./consumer_f > f.txt
expect f.txt "QTB ERROR: Parameter 7 was incorrect on entry to MYSUB "

cmake -S "$programs" -B cxx -DCMAKE_PREFIX_PATH="$folder/moved" -DCMAKE_CXX_COMPILER="${CXX:-c++}" > cmake.log
cmake --build cxx >> cmake.log
cxx/consumer > cxx.txt
expect cxx.txt "complex product and dot product"
echo "installed, moved, and called from C, C++ and Fortran"
