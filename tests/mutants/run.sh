#!/usr/bin/env bash
# Breaks the library in one place at a time and looks whether the tests see it.
#
#   tests/mutants/run.sh [pattern]     the mutants whose name or file matches the extended regular expression, or all
#
# Every mutant of mutants.list is applied to a copy of the tree below build/mutants; what its suites need is built
# there, and they run until the first of them fails. Ahead of all, the suites have to pass on the copy as it is. The
# report has a line for each mutant: the test that caught it, or that it survived, or that it could not be judged
# because the expression changes nothing or the result does not compile. It ends with 0 if at least 98 in 100 of the
# mutants were caught and all could be judged. The tree itself stays as it is.
#
# JOBS=n sets how many cores to use. An object cache (ccache) is used where the machine has one.
set -euo pipefail

root=$(cd "$(dirname "$0")/../.." && pwd)
pattern=${1:-.}
jobs=${JOBS:-$(nproc)}
least_caught=98  # in 100
work=$root/build/mutants
copy=$work/tree
logs=$work/logs

mkdir -p "$copy"
rm -rf "$logs"
mkdir "$logs"
# All but what an earlier run has built. Times of the files stay, so that only what has changed is built again.
find "$copy" -mindepth 1 -maxdepth 1 ! -name build -exec rm -rf {} +
cd "$root"
git ls-files -z --cached --others --exclude-standard |
  while IFS= read -r -d '' file; do if [[ -e $file ]]; then printf '%s\0' "$file"; fi; done |
  xargs -0 cp -p --parents -t "$copy"

mutants=()
while IFS= read -r line; do
  [[ -z $line || $line == \#* ]] && continue
  name=${line%% | *}
  rest=${line#* | }
  if [[ "$name ${rest%% | *}" =~ $pattern ]]; then mutants+=("$line"); fi
done <"$root/tests/mutants/mutants.list"
if [[ ${#mutants[@]} -eq 0 ]]; then
  echo "no mutant matches $pattern" >&2
  exit 2
fi

launcher=()
if command -v ccache >/dev/null; then
  launcher=(-D CMAKE_CXX_COMPILER_LAUNCHER=ccache -D CMAKE_C_COMPILER_LAUNCHER=ccache)
fi
cd "$copy"
cmake --preset release -D QTB_BUILD_TESTS=ON -D QTB_BUILD_EXAMPLES=OFF "${launcher[@]}" >"$logs/configure" 2>&1

# A suite is a name that ctest knows up to a dot; the program is what stands before its first dot.
build() {  # suites
  local suite targets=()
  for suite in "$@"; do targets+=("${suite%%.*}"); done
  cmake --build --preset release -j "$jobs" --target "${targets[@]}"
}
run() {  # suites
  local names
  names=$(printf '%s|' "$@")
  names=${names%|}
  GTEST_FAIL_FAST=1 ctest --preset release -R "^(${names//./\\.})(\.|\$)" -j "$jobs" --stop-on-failure --no-tests=error
}
# The first test that failed in the last run, or how the program ended.
catcher() {
  local log=build/release/Testing/Temporary/LastTest.log case program
  case=$(sed -n 's/^\[  FAILED  \] \([A-Za-z0-9_]*[./][^ ,]*\).*/\1/p' "$log" | head -1)
  program=$(cut -d: -f2 build/release/Testing/Temporary/LastTestsFailed.log | head -1)
  echo "${program:-?}${case:+: $case}"
}

mapfile -t suites < <(for line in "${mutants[@]}"; do tr ' ' '\n' <<<"${line##* | }"; done | sort -u | sed '/^$/d')
if ! build "${suites[@]}" >"$logs/unchanged" 2>&1 || ! run "${suites[@]}" >>"$logs/unchanged" 2>&1; then
  echo "the suites fail on the tree as it is: $logs/unchanged" >&2
  exit 2
fi

caught=0
unjudged=0
for line in "${mutants[@]}"; do
  IFS=$'\t' read -r name file expression suites_of <<<"${line// | /$'\t'}"
  read -ra suites <<<"$suites_of"
  sed -E -i "$expression" "$file"
  if cmp -s "$file" "$root/$file"; then
    verdict='changes nothing'
    unjudged=$((unjudged + 1))
  elif ! build "${suites[@]}" >"$logs/$name" 2>&1; then
    verdict='does not compile'
    unjudged=$((unjudged + 1))
  elif run "${suites[@]}" >>"$logs/$name" 2>&1; then
    verdict='SURVIVED'
  else
    verdict="caught by $(catcher)"
    caught=$((caught + 1))
  fi
  printf '%-28s %s\n' "$name" "$verdict"
  cp "$root/$file" "$file"
done

total=${#mutants[@]}
printf '%d of %d mutants caught' "$caught" "$total"
if [[ $unjudged -gt 0 ]]; then printf ', %d could not be judged' "$unjudged"; fi
printf '\n'
[[ $unjudged -eq 0 && $((100 * caught)) -ge $((least_caught * total)) ]]
