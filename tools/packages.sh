#!/bin/sh
# packages.sh purpose...: installs the Debian packages that these purposes need and this machine lacks.
#
# Purposes: build demo test ecosystem packages bench lint sanitizers fuzz coverage. Where nothing is missing no package
# manager runs, so that a complete machine works without a network. Otherwise the package lists are fetched once and the
# missing packages installed, through sudo where the caller is not root. Fails with the list of packages where that
# cannot be done.
set -eu

packages_for() {
  case $1 in
    build | demo) echo cmake ninja-build g++ make pkg-config ;;
    # binutils reads what was built, libc-dev-bin has gencat for message catalogues, qemu-user plays other processors,
    # gfortran is a caller, libblas3 a second opinion, the -test packages have testers of a BLAS, and groff and man read
    # the manual pages.
    test)
      echo libgtest-dev binutils libc-dev-bin qemu-user gfortran libblas3 libblas-test libblas64-test
      echo groff-base man-db
      ;;
    # Programs that use a BLAS, with suites of their own where they have some, and the reference LAPACK under them.
    ecosystem)
      echo libblas3 liblapack3 liblapack-test python3-numpy python3-scipy python3-pytest python3-hypothesis octave \
        r-base-core hpcc scalapack-mpi-test openmpi-bin
      ;;
    packages) echo dpkg-dev ;;
    bench) echo libbenchmark-dev libopenblas0-pthread libblis4-pthread gnuplot-nox ;;
    lint) echo clang clang-format clang-tidy libomp-dev shellcheck ;;
    # libomp-dev has the OpenMP runtime that the thread sanitizer understands, llvm the symbolizer of its reports.
    sanitizers) echo clang libclang-rt-14-dev libomp-dev llvm ;;
    fuzz) echo clang libclang-rt-14-dev libomp-dev llvm ;;
    coverage) echo gcovr ;;
    *)
      echo "packages.sh: no such purpose: $1" >&2
      exit 2
      ;;
  esac
}

installed() {
  [ "$(dpkg-query -W -f='${db:Status-Status}' "$1" 2>/dev/null)" = installed ]
}

if ! command -v dpkg-query >/dev/null; then
  echo "packages.sh: not a Debian system; the packages of \"$*\" are taken to be there" >&2
  exit 0
fi

missing=
for purpose in "$@"; do
  wanted=$(packages_for "$purpose")
  for package in $wanted; do
    case " $missing " in *" $package "*) continue ;; esac
    installed "$package" || missing="$missing $package"
  done
done
[ -n "$missing" ] || exit 0

as_root=
if [ "$(id -u)" -ne 0 ]; then
  if ! command -v sudo >/dev/null; then
    echo "packages.sh: please install as root:$missing" >&2
    exit 1
  fi
  as_root=sudo
fi

echo "packages.sh: installing$missing"
apt="$as_root env DEBIAN_FRONTEND=noninteractive apt-get -q -o DPkg::Lock::Timeout=300"
$apt update
# shellcheck disable=SC2086 # a list of words
$apt install -y --no-install-recommends $missing
