#!/bin/sh
# repository_test.sh folder: reads the tree's text files and fails on what its rules keep out.
#
#   tabs, trailing blanks, carriage returns, a missing last line end (in source text)
#   lines above 120 characters, but for the rows of tables that the formatter is told to leave alone
#   notes for later instead of work: the words that mark them
#   a source or header that does not open with its contract, a header that can be included twice
#   in a kernel: headers other than <cstdint>, intrinsics and our own; anything of std:: but the types of <cstdint>;
#   macros that define the tier again
#   a test program or script that no suite lists
#   a script that cannot be executed
set -eu
cd "$1"

findings=$(mktemp)
trap 'rm -f "$findings"' EXIT

# Without version control of its own (a release archive, say, perhaps unpacked inside another tree), or for a user whom
# git does not trust with the owner's tree, everything but the build folder is the tree.
if [ "$(git rev-parse --show-toplevel 2>/dev/null)" = "$(pwd -P)" ]; then
  files=$(git ls-files --cached --others --exclude-standard)
else
  files=$(find . -name build -prune -o -name .git -prune -o -type f -print | sed 's,^\./,,')
fi
# of pattern: the files whose paths match it, that exist.
of() {
  printf '%s\n' "$files" | grep -E "$1" | while IFS= read -r file; do
    if [ -f "$file" ]; then printf '%s\n' "$file"; fi
  done
}

sources=$(of '\.(cpp|c|h|def)$')
texts=$(of '(\.(cpp|c|h|def|cmake|sh|map)|CMakeLists\.txt|^\.ci/run)$')
kernels=$(of '^blas/kernels/.*\.(cpp|h)$')
[ -n "$sources" ] || { echo "no sources below $1" >&2; exit 1; }

# Each scan prints file:line: finding.
# shellcheck disable=SC2086 # lists of paths without blanks
{
  awk '
    function finding(what) { print FILENAME ":" FNR ": " what }
    /\t/ { finding("tab") }
    /\r/ { finding("carriage return") }
    /[ \t]$/ { finding("trailing blank") }
    FNR == 1 { table = 0 }
    /clang-format off/ { table = 1 }
    /clang-format on/ { table = 0 }
    length($0) > 120 && !table { finding("line of " length($0) " characters") }
    /(^|[^A-Za-z])(TO[D]O|FIX[M]E|XX[X]|HA[C]K)([^A-Za-z]|$)/ { finding("a note for later") }
  ' $texts
  awk '
    FNR == 1 && !/^\/(\/ |\*( |$))/ { print FILENAME ":1: does not open with its contract" }
  ' $sources
  for file in $texts; do
    [ -z "$(tail -c 1 "$file")" ] || echo "$file: no line end at the end"
  done
  for file in $(of '\.h$'); do
    grep -qE '^#pragma once|^#ifndef QTB_' "$file" || echo "$file: can be included twice"
  done
  if [ -n "$kernels" ]; then
    awk '
      function finding(what) { print FILENAME ":" FNR ": " what }
      /^[ \t]*#[ \t]*include/ && !/<cstdint>|<[a-z]*mmintrin\.h>|"(blas|service)\/[^"]*"/ {
        finding("kernel includes " $2)
      }
      {
        code = $0
        sub(/\/\/.*/, "", code)
        gsub(/std::u?int(8|16|32|64|ptr|max)_t/, "", code)
        if (code ~ /std::/) finding("kernel uses the standard library")
        if (code ~ /#[ \t]*(define|undef)[ \t]+QTB_TIER([ \t]|$)/) finding("kernel sets its own tier")
      }
    ' $kernels
  fi
  lists=$(of '^tests/.*(suites\.cmake|targets\.cmake|CMakeLists\.txt)$')
  for file in $(of '^tests/.*_(test|fuzz)\.(cpp|c|sh|cmake|f90)$'); do
    cat $lists /dev/null | grep -qF "${file#tests/}" || echo "$file: no suite lists it"
  done
  for file in $(of '(\.sh|^\.ci/run)$'); do
    [ -x "$file" ] || echo "$file: not executable"
  done
} > "$findings"

cat "$findings"
echo "$(printf '%s\n' "$texts" | wc -l) files, $(wc -l < "$findings") findings"
[ ! -s "$findings" ]
