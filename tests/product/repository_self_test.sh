#!/bin/sh
# repository_self_test.sh: shows that repository_test.sh passes a clean tree and finds each kind of flaw in it.
set -eu

check=$(dirname "$(readlink -f "$0")")/repository_test.sh
folder=$(mktemp -d)
trap 'rm -rf "$folder"' EXIT
failures=0

# A tree without flaws.
clean_tree() {
  rm -rf "$folder/tree"
  mkdir -p "$folder/tree/blas/kernels" "$folder/tree/tests/unit" "$folder/tree/build"
  cd "$folder/tree"
  printf '%s\n' '// A kernel.' '#include <cstdint>' '#include <emmintrin.h>' '#include "blas/types.h"' \
    'std::int64_t n;' > blas/kernels/k.cpp
  printf '// Types.\n#pragma once\n' > blas/types.h
  printf '// A test.\n' > tests/unit/k_test.cpp
  printf 'qtb_add_test(k_test SOURCES unit/k_test.cpp)\n' > tests/unit/suites.cmake
  printf '#!/bin/sh\ntrue\n' > run.sh
  chmod +x run.sh
  printf '\tbuilt' > build/made.cpp
}

# expect case finding: the check of the tree as it stands finds this; an empty finding says that it passes.
expect() {
  if output=$("$check" "$folder/tree" 2>&1); then status=0; else status=$?; fi
  if [ -z "$2" ]; then
    [ $status -eq 0 ] && result=ok || result="rejected: $output"
  else
    case "$status $output" in
      "0 "*) result=passed ;;
      *"$2"*) result=ok ;;
      *) result="other finding: $output" ;;
    esac
  fi
  echo "$1: $result"
  [ "$result" = ok ] || failures=$((failures + 1))
  clean_tree
}

clean_tree
expect clean ""
if command -v git >/dev/null; then
  git init -q "$folder"
  echo tree > "$folder/.gitignore"
  printf 'int\tn;\n' >> blas/types.h
  expect "inside another tree that ignores it" "blas/types.h:3: tab"
  rm -rf "$folder/.git"
fi
printf 'int\tn;\n' >> blas/types.h
expect tab "blas/types.h:3: tab"
printf 'int n; \n' >> blas/types.h
expect blank "blas/types.h:3: trailing blank"
printf 'int n;\r\n' >> blas/types.h
expect return "blas/types.h:3: carriage return"
printf '// %0121d\n' 0 >> blas/types.h
expect long "blas/types.h:3: line of 124 characters"
printf '// clang-format off\n// %0121d\n' 0 >> blas/types.h
expect table ""
printf '// clang-format off\n// clang-format on\n// %0121d\n' 0 >> blas/types.h
expect "behind a table" "blas/types.h:5: line of 124 characters"
printf '// TO''DO: later\n' >> blas/types.h
expect later "blas/types.h:3: a note for later"
printf 'int n;' >> blas/types.h
expect ending "blas/types.h: no line end at the end"
printf '#pragma once\n' > blas/types.h
expect contract "blas/types.h:1: does not open with its contract"
printf '// Types.\n' > blas/types.h
expect twice "blas/types.h: can be included twice"
printf '#include <algorithm>\n' >> blas/kernels/k.cpp
expect header "blas/kernels/k.cpp:6: kernel includes <algorithm>"
printf 'auto m = std::min(1, 2);\n' >> blas/kernels/k.cpp
expect standard "blas/kernels/k.cpp:6: kernel uses the standard library"
printf '#define QTB_TIER avx\n' >> blas/kernels/k.cpp
expect tier "blas/kernels/k.cpp:6: kernel sets its own tier"
printf '// A test.\n' > tests/unit/lost_test.cpp
expect lost "tests/unit/lost_test.cpp: no suite lists it"
chmod -x run.sh
expect mode "run.sh: not executable"
rm -r blas tests
expect nothing "no sources"

[ $failures -eq 0 ]
